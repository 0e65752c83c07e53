#include "Providers/SoftwareInventory/Quenx_ElementSoftwareIdentity.h"

#include <map>
#include <memory>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/InstanceList.h"
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

std::unique_ptr<Quenx_ElementSoftwareIdentity> associate(const Quenx_SoftwareIdentity* identity,
                                                         const Quenx_EthernetPort* port) {
    auto association = std::make_unique<Quenx_ElementSoftwareIdentity>();
    association->Antecedent = identity;
    association->Dependent = port;
    association->UpgradeCondition =
        ma::getCanBeUpdated(port->getAdapterName()) ? 2 : 4;              // by the owner; never
    association->ElementSoftwareStatus = std::vector<unsigned short>{2};  // current
    return association;
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

std::string Quenx_ElementSoftwareIdentityClass::getClassName() {
    return Quenx_ElementSoftwareIdentity::classInfo.name;
}

utils::SafeList<core::CimInstance*>::Iterator Quenx_ElementSoftwareIdentityClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp time("Quenx_ElementSoftwareIdentityClass::getInstances");
    core::InstanceRange ports =
        ownInstances(Quenx_EthernetPort::classInfo);  // the ranges hold what they walk
    core::InstanceRange identities = ownInstances(Quenx_SoftwareIdentity::classInfo);
    const auto portOf = byAdapterName(ports);
    core::InstanceList rebuilt;
    for (core::CimInstance* instance : identities) {
        const auto* const identity = dynamic_cast<Quenx_SoftwareIdentity*>(instance);
        if (identity == nullptr) continue;
        const auto port = portOf.find(identity->getAdapterName());
        if (port != portOf.end()) rebuilt.add(associate(identity, port->second).release());
    }
    m_list.publish(rebuilt);
    return m_list.getElements(false);
}
