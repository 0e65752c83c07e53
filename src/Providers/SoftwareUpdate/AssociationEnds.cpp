// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/AssociationEnds.h"

#include <algorithm>
#include <map>
#include <utility>

#include "Utils/Exception.h"

const CIM_SoftwareInstallationService* onlyOne(Services& services) {
    // With two providers of this kind in one process nobody could tell which service owns a job.
    QUENX_ASSERT_TEXT(services.count() == 1, __FILE__, __LINE__, "(int)services.size() == 1");
    return services.first();
}

namespace {

using Device = std::pair<std::uint8_t, std::uint8_t>;

Device deviceOf(const utils::PCIAddr& address) {
    return {address.bus, address.device};
}

}  // namespace

AdapterIndex::AdapterIndex() {
    std::map<Device, std::vector<std::size_t>> portsByDevice;
    for (const inventory::EthernetPort* port : m_portInstances) {
        m_ports.push_back(
            {dynamic_cast<const CIM_ManagedElement*>(port), port->getAdapterName(), port->getPCIAddress()});
        m_portsByName.emplace(m_ports.back().adapterName, m_ports.size() - 1);
        portsByDevice[deviceOf(m_ports.back().address)].push_back(m_ports.size() - 1);
    }
    for (const inventory::PortController* controller : m_controllerInstances) {
        const auto ask = [&](IndexedPort& port) {
            if (controller->holds(port.address))
                port.controllers.push_back(dynamic_cast<const CIM_ManagedElement*>(controller));
        };
        // Ten thousand ports would otherwise be twenty-five million questions.
        if (controller->holdsOneDevice()) {
            for (const std::size_t port : portsByDevice[deviceOf(controller->getPCIAddress())])
                ask(m_ports[port]);
        } else {
            std::ranges::for_each(m_ports, ask);
        }
    }
}

const IndexedPort* AdapterIndex::findPort(const std::string& adapterName) const {
    const auto port = m_portsByName.find(adapterName);
    return port == m_portsByName.end() ? nullptr : &m_ports[port->second];
}
