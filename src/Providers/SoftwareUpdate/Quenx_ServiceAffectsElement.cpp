// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_ServiceAffectsElement.h"

#include <algorithm>

#include "MidAPI/ma.h"
#include "Providers/SoftwareUpdate/AssociationEnds.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationServiceCapabilities.h"

namespace {

void associate(const CIM_Service* service, const CIM_ManagedElement* affected, Rebuild& rebuilt) {
    auto& association = rebuilt.add<Quenx_ServiceAffectsElement>();
    association.AffectedElement = affected;
    association.AffectingElement = service;
    setNull(association.ElementEffects, association.OtherElementEffectsDescriptions,
            association.AssignedSequence);
}

bool isSupportedType(const std::string& type) {
    constexpr auto& kNames = Quenx_SoftwareInstallationServiceCapabilities::TargetTypesDescription;
    return std::find(std::next(kNames.begin()), kNames.end(), type) != kNames.end();
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

core::InstanceList::Iterator Quenx_ServiceAffectsElementClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("Quenx_ServiceAffectsElementClass::getInstances");
    Rebuild rebuilt(m_instances);
    Services services;
    const AdapterIndex adapters;
    const InstancesOf<const inventory::SoftwareIdentity> identities("Quenx_SoftwareIdentity");
    const CIM_SoftwareInstallationService* service = onlyOne(services);
    associateAdapters(service, adapters, rebuilt);
    for (const inventory::SoftwareIdentity* identity : identities) {
        if (!isInstallable(*identity)) continue;
        associate(service, dynamic_cast<const CIM_ManagedElement*>(identity), rebuilt);
    }
    return rebuilt.publish();
}
