// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Quenx_ElementSoftwareIdentity.h"

#include <map>

#include "MidAPI/ma.h"
#include "Providers/SoftwareInventory/Quenx_EthernetPort.h"
#include "Providers/SoftwareInventory/Quenx_SoftwareIdentity.h"

namespace {

// Values of the DMTF value maps of CIM_ElementSoftwareIdentity.
constexpr std::uint16_t kUpgradedByOwner = 2;
constexpr std::uint16_t kNeverUpgraded = 4;
constexpr std::uint16_t kStatusCurrent = 2;
constexpr std::uint16_t kStatusNext = 3;

void associate(const Quenx_SoftwareIdentity* identity, const Quenx_EthernetPort* port, Rebuild& rebuilt) {
    auto& association = rebuilt.add<Quenx_ElementSoftwareIdentity>();
    association.Antecedent = identity;
    association.Dependent = port;
    association.UpgradeCondition =
        ma::getCanBeUpdated(port->getAdapterName()) ? kUpgradedByOwner : kNeverUpgraded;
    association.ElementSoftwareStatus = {identity->isDormant() ? kStatusNext : kStatusCurrent};
}

}  // namespace

core::InstanceList::Iterator Quenx_ElementSoftwareIdentityClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp time("Quenx_ElementSoftwareIdentityClass::getInstances");
    // These hold what the associations refer to.
    const InstancesOf<const Quenx_EthernetPort> ports("Quenx_EthernetPort", inventory::kProviderName);
    const InstancesOf<const Quenx_SoftwareIdentity> identities("Quenx_SoftwareIdentity",
                                                               inventory::kProviderName);
    std::map<std::string, const Quenx_EthernetPort*> portOf;
    for (const Quenx_EthernetPort* port : ports)
        portOf.emplace(port->getAdapterName(), port);
    Rebuild rebuilt(m_instances);
    for (const Quenx_SoftwareIdentity* identity : identities) {
        const auto port = portOf.find(identity->getAdapterName());
        if (port != portOf.end()) associate(identity, port->second, rebuilt);
    }
    return rebuilt.publish();
}
