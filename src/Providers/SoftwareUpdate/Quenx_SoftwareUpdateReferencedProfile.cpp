// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateReferencedProfile.h"

#include "Framework/Classes/CimBroker.h"
#include "Providers/Schema/CIM_RegisteredProfile.h"
#include "Providers/SoftwareUpdate/AssociationEnds.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"

constinit const core::CimClassInfo Quenx_SoftwareUpdateReferencedProfile::classInfo{
    "Quenx_ReferencedProfile", &CIM_ReferencedProfile::classInfo, true, {}, nullptr};

Quenx_SoftwareUpdateReferencedProfile::~Quenx_SoftwareUpdateReferencedProfile() = default;

std::string Quenx_SoftwareUpdateReferencedProfile::getClassName() const {
    return classInfo.name;
}

utils::SafeList<core::CimInstance*>::Iterator Quenx_SoftwareUpdateReferencedProfileClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("ReferencedProfile::getInstances");
    Rebuild rebuilt(m_instances);
    core::InstanceRange profiles(core::GetCimBroker()->getInstances("Quenx_RegisteredProfile", ""));
    QUENX_DEBUG("Quenx_RegisteredProfile return %d instances", static_cast<int>(profiles.size()));
    // Of several with one InstanceID the last counts.
    const CIM_RegisteredProfile* antecedent = nullptr;
    const CIM_RegisteredProfile* dependent = nullptr;
    for (const core::CimInstance* each : profiles) {
        const auto* profile = dynamic_cast<const CIM_RegisteredProfile*>(each);
        if (profile == nullptr) continue;
        const std::string id = profile->InstanceID.get();
        if (id == kEthernetPortProfile) antecedent = profile;
        if (id == kSoftwareUpdateProfile) dependent = profile;
    }
    // The port profile is another provider's, which may not be loaded.
    if (antecedent != nullptr && dependent != nullptr) {
        auto& reference = rebuilt.add<Quenx_SoftwareUpdateReferencedProfile>();
        reference.Antecedent = antecedent;
        reference.Dependent = dependent;
    }
    rebuilt.publish();
    QUENX_DEBUG("return %d", static_cast<int>(m_instances.size()));
    return m_instances.getElements(false);
}
