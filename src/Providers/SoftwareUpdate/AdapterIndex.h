#pragma once

#include <map>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

#include "Framework/Classes/InstanceList.h"
#include "Providers/InventoryInterfaces.h"
#include "Providers/Schema/CIM_ManagedElement.h"

/// A port as the inventory serves it.
struct IndexedPort {
    const CIM_ManagedElement* element;
    std::string adapterName;
    utils::PCIAddr address;
};

/// A snapshot of the ports and controllers, indexed so that joining them costs their sum and not their
/// product. Holds the instances while it lives.
class AdapterIndex {
  public:
    /// Asks the broker for both classes, of any provider.
    AdapterIndex();

    const std::vector<IndexedPort>& ports() const { return m_ports; }
    /// The first port of that name; null when there is none.
    const IndexedPort* findPort(const std::string& adapterName) const;
    /// The controllers that hold the port's address.
    std::vector<const CIM_ManagedElement*> controllersOf(const IndexedPort& port) const;

  private:
    struct IndexedController {
        const CIM_ManagedElement* element;
        const inventory::PortController* controller;
    };
    using BusAndDevice = std::pair<unsigned, unsigned>;

    core::InstanceRange m_portInstances;
    core::InstanceRange m_controllerInstances;
    std::vector<IndexedPort> m_ports;
    std::unordered_map<std::string, std::size_t> m_portsByName;
    std::multimap<BusAndDevice, IndexedController> m_controllers;
};
