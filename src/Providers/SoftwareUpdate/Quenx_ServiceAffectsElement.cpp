// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_ServiceAffectsElement.h"

#include <algorithm>

#include "Framework/Classes/CimBroker.h"
#include "MidAPI/ma.h"
#include "Providers/Schema/CIM_Service.h"
#include "Providers/SoftwareUpdate/AssociationEnds.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationServiceCapabilities.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"

namespace {

void associate(const CIM_Service* service, const CIM_ManagedElement* affected, Rebuild& rebuilt) {
    auto& association = rebuilt.add<Quenx_ServiceAffectsElement>();
    association.AffectedElement = affected;
    association.AffectingElement = service;
    association.ElementEffects.setNull();
    association.OtherElementEffectsDescriptions.setNull();
    association.AssignedSequence.setNull();
}

bool isSupportedType(const std::string& type) {
    constexpr auto& names = Quenx_SoftwareInstallationServiceCapabilities::TargetTypesDescription;
    return std::find(std::next(names.begin()), names.end(), type) != names.end();
}

/// A firmware image with target types, all of which the service supports.
bool isInstallable(const inventory::SoftwareIdentity& identity) {
    if (identity.getTypeCode() != inventory::SoftwareIdentity::FirmwareImage) return false;
    const utils::StringArray types = identity.getTargetTypes();
    // An image with one type that the service does not know would be refused as a whole.
    return !types.empty() && std::all_of(types.begin(), types.end(), isSupportedType);
}

void associateAdapters(const CIM_Service* service, const AdapterIndex& adapters, Rebuild& rebuilt) {
    for (const IndexedPort& port : adapters.ports()) {
        // The adapter API may be slow, so it is asked only about ports whose answer counts.
        if (port.controllers.empty() || !ma::getCanBeUpdated(port.adapterName)) continue;
        for (const CIM_ManagedElement* controller : port.controllers) {
            associate(service, port.element, rebuilt);
            associate(service, controller, rebuilt);
        }
    }
}

}  // namespace

constinit const core::CimClassInfo Quenx_ServiceAffectsElement::classInfo{
    "Quenx_ServiceAffectsElement", &CIM_ServiceAffectsElement::classInfo, true, {}, nullptr};

Quenx_ServiceAffectsElement::~Quenx_ServiceAffectsElement() = default;

std::string Quenx_ServiceAffectsElement::getClassName() const {
    return classInfo.name;
}

utils::SafeList<core::CimInstance*>::Iterator Quenx_ServiceAffectsElementClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("Quenx_ServiceAffectsElementClass::getInstances");
    Rebuild rebuilt(m_instances);
    core::InstanceRange services(allServices());
    const AdapterIndex adapters;
    core::InstanceRange identities(core::GetCimBroker()->getInstances("Quenx_SoftwareIdentity", ""));
    const auto* service = dynamic_cast<const CIM_Service*>(onlyService(services));
    associateAdapters(service, adapters, rebuilt);
    for (const core::CimInstance* each : identities) {
        const auto* identity = dynamic_cast<const inventory::SoftwareIdentity*>(each);
        if (identity == nullptr || !isInstallable(*identity)) continue;
        associate(service, dynamic_cast<const CIM_ManagedElement*>(each), rebuilt);
    }
    rebuilt.publish();
    return m_instances.getElements(false);
}
