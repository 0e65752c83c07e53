// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/AssociationEnds.h"

#include "Framework/Classes/CimBroker.h"
#include "Utils/Exception.h"

utils::SafeList<core::CimInstance*>::Iterator allServices() {
    return core::GetCimBroker()->getInstances("Quenx_SoftwareInstallationService", "");
}

const core::CimInstance* onlyService(core::InstanceRange& services) {
    // With two providers of this kind in one process nobody could tell which service owns a job.
    QUENX_ASSERT_TEXT(services.size() == 1, __FILE__, __LINE__, "(int)services.size() == 1");
    return *services.begin();
}

AdapterIndex::AdapterIndex()
    : m_portInstances(core::GetCimBroker()->getInstances("Quenx_EthernetPort", "")),
      m_controllerInstances(core::GetCimBroker()->getInstances("Quenx_PortController", "")) {
    for (const core::CimInstance* each : m_portInstances) {
        const auto* port = dynamic_cast<const inventory::EthernetPort*>(each);
        if (port == nullptr) continue;
        m_ports.push_back(
            {dynamic_cast<const CIM_ManagedElement*>(each), port->getAdapterName(), port->getPCIAddress()});
        m_portsByName.emplace(m_ports.back().adapterName, m_ports.size() - 1);
    }
    // The controllers are the outer loop, so that one is in the cache while the ports pass by: a thousand
    // ports on their cards are a quarter of a million questions.
    for (const core::CimInstance* each : m_controllerInstances) {
        const auto* controller = dynamic_cast<const inventory::PortController*>(each);
        if (controller == nullptr) continue;
        for (IndexedPort& port : m_ports) {
            if (controller->holds(port.address))
                port.controllers.push_back(dynamic_cast<const CIM_ManagedElement*>(each));
        }
    }
}

const IndexedPort* AdapterIndex::findPort(const std::string& adapterName) const {
    const auto port = m_portsByName.find(adapterName);
    return port == m_portsByName.end() ? nullptr : &m_ports[port->second];
}
