// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/AssociationEnds.h"

#include "Utils/Exception.h"

const CIM_SoftwareInstallationService* onlyOne(Services& services) {
    // With two providers of this kind in one process nobody could tell which service owns a job.
    QUENX_ASSERT_TEXT(services.count() == 1, __FILE__, __LINE__, "(int)services.size() == 1");
    return services.first();
}

AdapterIndex::AdapterIndex() {
    for (const inventory::EthernetPort* port : m_portInstances) {
        m_ports.push_back(
            {dynamic_cast<const CIM_ManagedElement*>(port), port->getAdapterName(), port->getPCIAddress()});
        m_portsByName.emplace(m_ports.back().adapterName, m_ports.size() - 1);
    }
    // The controllers are the outer loop, so that one is in the cache while the ports pass by: a thousand
    // ports on their cards are a quarter of a million questions.
    for (const inventory::PortController* controller : m_controllerInstances) {
        for (IndexedPort& port : m_ports) {
            if (controller->holds(port.address))
                port.controllers.push_back(dynamic_cast<const CIM_ManagedElement*>(controller));
        }
    }
}

const IndexedPort* AdapterIndex::findPort(const std::string& adapterName) const {
    const auto port = m_portsByName.find(adapterName);
    return port == m_portsByName.end() ? nullptr : &m_ports[port->second];
}
