// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <unordered_map>
#include <vector>

#include "Framework/Classes/InstanceList.h"
#include "Providers/Schema/CIM_ManagedElement.h"
#include "Providers/Schema/InventoryInterfaces.h"

// What the associations join, found through the broker, whoever provides it.

/// The InstanceIDs by which registered profiles are told apart. The second is registered by the provider that
/// serves the ports.
inline constexpr const char* kSoftwareUpdateProfile = "Quenx:SoftwareUpdate";
inline constexpr const char* kEthernetPortProfile = "Quenx:EthernetPort";

/// Enumerates the installation services.
utils::SafeList<core::CimInstance*>::Iterator allServices();
/// The one among them, which the range holds. Throws the assertion "(int)services.size() == 1" when there is
/// not exactly one.
const core::CimInstance* onlyService(core::InstanceRange& services);

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
    /// Asks every controller about every port: only the controller knows which addresses it holds.
    AdapterIndex();

    const std::vector<IndexedPort>& ports() const { return m_ports; }
    /// The first port of that name; null when there is none.
    const IndexedPort* findPort(const std::string& adapterName) const;

  private:
    core::InstanceRange m_portInstances;
    core::InstanceRange m_controllerInstances;
    std::vector<IndexedPort> m_ports;
    std::unordered_map<std::string, std::size_t> m_portsByName;
};
