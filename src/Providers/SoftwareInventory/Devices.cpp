// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Devices.h"

#include "MidAPI/Image/OptionRom.h"
#include "MidAPI/ma.h"
#include "Utils/Exception.h"

namespace inventory {

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
    return rows;
}

}  // namespace inventory
