// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Devices.h"

#include <algorithm>

#include "MidAPI/Image/OptionRom.h"
#include "MidAPI/ma.h"
#include "Utils/Exception.h"
#include "Utils/Utils.h"

namespace inventory {

namespace {

/// What only some backends tell.
void addTold(std::vector<Identification>& rows, const ma::AdapterInfo& info) {
    const auto add = [&rows](std::string description, const std::string& text) {
        if (!text.empty()) rows.push_back({std::move(description), text});
    };
    add("Driver", info.driver);
    add("Serial Number", info.serialNumber);
    add("Board Serial Number", info.boardSerialNumber);
    for (const ma::NamedVersion& version : info.versions)
        add(version.name, version.fixed);
    if (!info.writer.empty()) add("Update State", "Busy");
    add("Updating Process", info.writer);
    if (info.resetNeeded != ma::ResetNeeded::None) add("Reset Needed", resetText(info.resetNeeded));
}

}  // namespace

std::vector<Port> readPorts() {
    std::vector<Port> ports;
    for (const std::string& adapter : ma::enumerateAdapters()) {
        try {
            ports.push_back({adapter, ma::getPCIAddress(adapter)});
        } catch (const utils::Exception&) {
            // It went away since it was enumerated. The exception has logged itself.
        }
    }
    return ports;
}

std::optional<ma::AdapterInfo> readInfo(const std::string& adapter) {
    try {
        return ma::getAdapterInfo(adapter);
    } catch (const utils::Exception&) {
        return std::nullopt;  // logged by the exception itself
    }
}

std::string domainOf(const utils::PCIAddr& address) {
    const std::string_view text = address.text;
    const bool isFull = std::ranges::count(text, ':') == 2;
    const std::string_view domain = text.substr(0, text.find(':'));
    const bool isFirst = domain.find_first_not_of('0') == std::string_view::npos;
    return isFull && !isFirst ? std::string(domain) + ':' : "";
}

std::vector<Identification> identify(const std::string& address, const std::optional<ma::AdapterInfo>& info,
                                     bool updatable) {
    std::vector<Identification> rows{{"PCI Address", address}};
    if (info) {
        const ma::PciIds& ids = info->ids;
        rows.push_back({"PCI Vendor and Device ID", ma::formatIds(ids.vendor, ids.device)});
        rows.push_back(
            {"PCI Subsystem Vendor and Device ID", ma::formatIds(ids.subsystemVendor, ids.subsystemDevice)});
    }
    rows.push_back({"Firmware Update", updatable ? "Supported" : "Not Supported"});
    // Also of an adapter that does not answer.
    const std::string backend = info ? info->backend : ma::backendName();
    if (!backend.empty()) rows.push_back({"Adapter Backend", backend});
    if (info) addTold(rows, *info);
    return rows;
}

const char* resetText(ma::ResetNeeded reset) {
    switch (reset) {
        case ma::ResetNeeded::None:
            return "None";
        case ma::ResetNeeded::Reload:
            return "Reload";
        case ma::ResetNeeded::Reboot:
            return "Reboot";
        case ma::ResetNeeded::PowerCycle:
            return "Power Cycle";
        case ma::ResetNeeded::Unknown:
            break;
    }
    return "Unknown";
}

}  // namespace inventory
