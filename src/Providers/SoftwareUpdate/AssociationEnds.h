// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <unordered_map>
#include <vector>

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_SoftwareInstallationService.h"
#include "Providers/Schema/ProviderInterfaces.h"

// What the associations join, found through the broker, whoever provides it.

/// The installation services.
struct Services : InstancesOf<const CIM_SoftwareInstallationService> {
    Services() : InstancesOf("Quenx_SoftwareInstallationService") {}
};
/// The one among them, which they hold. Throws the assertion "(int)services.size() == 1" when there is not
/// exactly one.
const CIM_SoftwareInstallationService* onlyOne(Services& services);

/// A port as the inventory serves it, with the controllers that hold its address.
struct IndexedPort {
    const CIM_ManagedElement* element;
    std::string adapterName;
    utils::PCIAddr address;
    std::vector<const CIM_ManagedElement*> controllers{};
};

/// A snapshot of the ports and controllers. Holds the instances while it lives.
class AdapterIndex {
  public:
    /// Asks each controller about the ports that it may hold: only the controller knows which addresses it
    /// holds.
    AdapterIndex();

    const std::vector<IndexedPort>& ports() const { return m_ports; }
    /// The first port of that name; null when there is none.
    const IndexedPort* findPort(const std::string& adapterName) const;

  private:
    InstancesOf<const inventory::EthernetPort> m_portInstances{"Quenx_EthernetPort"};
    InstancesOf<const inventory::PortController> m_controllerInstances{"Quenx_PortController"};
    std::vector<IndexedPort> m_ports;
    std::unordered_map<std::string, std::size_t> m_portsByName;
};
