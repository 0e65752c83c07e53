// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Quenx_ElementSoftwareIdentity.h"

#include <map>

#include "Framework/Classes/CimBroker.h"
#include "MidAPI/ma.h"
#include "Providers/SoftwareInventory/Quenx_EthernetPort.h"
#include "Providers/SoftwareInventory/Quenx_SoftwareIdentity.h"
#include "Providers/SoftwareInventory/SoftwareInventoryAgent.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"

namespace {

core::InstanceRange ownInstances(const core::CimClassInfo& info) {
    return core::InstanceRange(
        core::GetCimBroker()->getInstances(info.name, core::SoftwareInventoryAgent::CIM_PROVIDER_NAME));
}

std::map<std::string, Quenx_EthernetPort*> byAdapterName(core::InstanceRange& ports) {
    std::map<std::string, Quenx_EthernetPort*> index;
    for (core::CimInstance* instance : ports) {
        auto* const port = dynamic_cast<Quenx_EthernetPort*>(instance);
        if (port != nullptr) index.emplace(port->getAdapterName(), port);
    }
    return index;
}

void associate(const Quenx_SoftwareIdentity* identity, const Quenx_EthernetPort* port, Rebuild& rebuilt) {
    auto& association = rebuilt.add<Quenx_ElementSoftwareIdentity>();
    association.Antecedent = identity;
    association.Dependent = port;
    association.UpgradeCondition =
        ma::getCanBeUpdated(port->getAdapterName()) ? 2 : 4;            // by the owner; never
    association.ElementSoftwareStatus = std::vector<std::uint16_t>{2};  // current
}

}  // namespace

constinit const core::CimClassInfo Quenx_ElementSoftwareIdentity::classInfo{
    "Quenx_ElementSoftwareIdentity", &CIM_ElementSoftwareIdentity::classInfo, true, {}, nullptr};

Quenx_ElementSoftwareIdentity::Quenx_ElementSoftwareIdentity() {
    declareClass(classInfo);
}

Quenx_ElementSoftwareIdentity::~Quenx_ElementSoftwareIdentity() = default;

std::string Quenx_ElementSoftwareIdentity::getClassName() const {
    return classInfo.name;
}

utils::SafeList<core::CimInstance*>::Iterator Quenx_ElementSoftwareIdentityClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp time("Quenx_ElementSoftwareIdentityClass::getInstances");
    // The ranges hold what the associations refer to.
    core::InstanceRange ports = ownInstances(Quenx_EthernetPort::classInfo);
    core::InstanceRange identities = ownInstances(Quenx_SoftwareIdentity::classInfo);
    const auto portOf = byAdapterName(ports);
    Rebuild rebuilt(m_instances);
    for (core::CimInstance* instance : identities) {
        const auto* const identity = dynamic_cast<Quenx_SoftwareIdentity*>(instance);
        if (identity == nullptr) continue;
        const auto port = portOf.find(identity->getAdapterName());
        if (port != portOf.end()) associate(identity, port->second, rebuilt);
    }
    rebuilt.publish();
    return m_instances.getElements(false);
}
