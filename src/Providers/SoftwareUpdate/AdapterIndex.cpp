#include "Providers/SoftwareUpdate/AdapterIndex.h"

#include "Framework/Classes/CimBroker.h"

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
    for (const core::CimInstance* each : m_controllerInstances) {
        const auto* controller = dynamic_cast<const inventory::PortController*>(each);
        if (controller == nullptr) continue;
        const utils::PCIAddr address = controller->getPCIAddress();
        m_controllers.emplace(BusAndDevice(address.bus, address.device),
                              IndexedController{dynamic_cast<const CIM_ManagedElement*>(each), controller});
    }
}

const IndexedPort* AdapterIndex::findPort(const std::string& adapterName) const {
    const auto found = m_portsByName.find(adapterName);
    return found == m_portsByName.end() ? nullptr : &m_ports[found->second];
}

std::vector<const CIM_ManagedElement*> AdapterIndex::controllersOf(const IndexedPort& port) const {
    std::vector<const CIM_ManagedElement*> holders;
    const auto [begin, end] = m_controllers.equal_range(BusAndDevice(port.address.bus, port.address.device));
    for (auto each = begin; each != end; ++each) {
        if (each->second.controller->holds(port.address)) holders.push_back(each->second.element);
    }
    return holders;
}
