// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Quenx_EthernetPort.h"

#include "MidAPI/ma.h"
#include "Providers/RegisteredProfile.h"
#include "Providers/SoftwareInventory/Devices.h"
#include "Utils/Utils.h"

namespace {

/// Twelve hexadecimal digits, as CIM_NetworkPort wants an address.
std::string addressText(const std::array<std::uint8_t, 6>& mac) {
    return fmt("%02X%02X%02X%02X%02X%02X", mac[0], mac[1], mac[2], mac[3], mac[4], mac[5]);
}

}  // namespace

Quenx_EthernetPort::Quenx_EthernetPort(inventory::Port port) : m_port(std::move(port)) {
    inventory::setDeviceKeys(*this, getUniqId());
    PortType = 0;        // unknown: not told by the adapter API
    LinkTechnology = 2;  // Ethernet
}

void Quenx_EthernetPort::refresh() {
    // All questions come before the lock, since the adapter may take its time.
    const std::optional<ma::AdapterInfo> info = inventory::readInfo(m_port.adapter);
    const bool updatable = ma::getCanBeUpdated(m_port.adapter);

    const std::string address = inventory::domainOf(m_port.address) + utils::formatPCIAddr(m_port.address);
    std::vector<inventory::Identification> rows = inventory::identify(address, info, updatable);
    if (info) {
        for (const std::string& interface : info->interfaces)
            rows.push_back({"Network Interface", interface});
    }
    const core::RecursiveLocker lock(getMutex());
    inventory::setIdentification(*this, std::move(rows));
    setLink(info);
}

void Quenx_EthernetPort::setLink(const std::optional<ma::AdapterInfo>& info) {
    using inventory::EnabledState;
    if (!info) {
        inventory::setDeviceState(*this, EnabledState::Unknown);
        setNull(Description, Speed, PermanentAddress, NetworkAddresses);
        return;
    }
    inventory::setDeviceState(*this, info->linkUp ? EnabledState::Enabled : EnabledState::EnabledButOffline);
    Description = info->description;
    PermanentAddress = addressText(info->permanentMac);
    NetworkAddresses = std::vector<std::string>{addressText(info->permanentMac)};
    // A link that is down has no speed, which is not a speed of 0.
    setOrNull(Speed, info->speed != 0, info->speed);
}

core::InstanceList::Iterator Quenx_EthernetPortClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp time("Quenx_EthernetPortClass::getInstances");
    return serve(inventory::readPorts());
}

core::CimInstance* Quenx_EthernetPortClass::findInstance(const core::CimPath& path) {
    return find(inventory::readPorts(), path);
}

void Quenx_EthernetPortRegisteredProfile::refresh() {
    // The version is that of DSP1014.
    registerProfile(*this, kEthernetPortProfile, "Ethernet Port", "1.0.1",
                    "Ethernet Port Profile for Tarvel(R) Ethernet Adapters");
}
