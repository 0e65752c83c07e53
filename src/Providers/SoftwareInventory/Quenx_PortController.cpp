// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Quenx_PortController.h"

#include <map>
#include <tuple>

#include "MidAPI/ma.h"
#include "Providers/SoftwareInventory/Devices.h"
#include "Utils/Utils.h"

namespace inventory {

std::vector<Card> groupByCard(const std::vector<Port>& ports) {
    std::vector<Card> cards;
    std::map<std::tuple<std::string, std::uint8_t, std::uint8_t>, std::size_t> known;
    for (const Port& port : ports) {
        const utils::PCIAddr& address = port.address;
        const auto [place, isNew] =
            known.try_emplace({domainOf(address), address.bus, address.device}, cards.size());
        if (isNew) cards.emplace_back();
        cards[place->second].ports.push_back(port);
    }
    return cards;
}

}  // namespace inventory

Quenx_PortController::Quenx_PortController(inventory::Card card) : m_card(std::move(card)) {
    inventory::setDeviceKeys(*this, getUniqId());
    ControllerType = 2;  // Ethernet
}

std::string Quenx_PortController::getUniqId() const {
    return inventory::domainOf(m_card.ports.front().address) + utils::formatPCIAddr(getPCIAddress());
}

void Quenx_PortController::refresh() {
    // All questions come before the lock, since an adapter may take its time.
    std::optional<ma::AdapterInfo> info;
    bool updatable = false;
    for (const inventory::Port& port : m_card.ports) {
        // Every port knows its card; the first that answers will do.
        if (!info) info = inventory::readInfo(port.adapter);
        updatable = updatable || ma::getCanBeUpdated(port.adapter);
    }

    const core::RecursiveLocker lock(getMutex());
    inventory::setIdentification(*this, inventory::identify(getUniqId(), info, updatable));
    using inventory::EnabledState;
    inventory::setDeviceState(*this, info ? EnabledState::Enabled : EnabledState::Unknown);
    setOrNull(Description, info.has_value(), info ? info->description : "");
}

utils::PCIAddr Quenx_PortController::getPCIAddress() const {
    utils::PCIAddr address = m_card.ports.front().address;
    address.function = 0;
    address.noFunction = true;
    // The text names a port.
    address.text.clear();
    return address;
}

bool Quenx_PortController::holds(const utils::PCIAddr& address) const {
    // The functions of one PCI device are the ports of one card.
    const utils::PCIAddr& own = m_card.ports.front().address;
    return address.sameAdapter(own) && inventory::domainOf(address) == inventory::domainOf(own);
}

core::InstanceList::Iterator Quenx_PortControllerClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp time("Quenx_PortControllerClass::getInstances");
    return serve(inventory::groupByCard(inventory::readPorts()));
}

core::CimInstance* Quenx_PortControllerClass::findInstance(const core::CimPath& path) {
    return find(inventory::groupByCard(inventory::readPorts()), path);
}
