// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateReferencedProfile.h"

#include "Providers/RegisteredProfile.h"

core::InstanceList::Iterator Quenx_SoftwareUpdateReferencedProfileClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("ReferencedProfile::getInstances");
    Rebuild rebuilt(m_instances);
    InstancesOf<const CIM_RegisteredProfile> profiles("Quenx_RegisteredProfile");
    QUENX_DEBUG("Quenx_RegisteredProfile return %d instances", profiles.count());
    // Of several with one InstanceID the last counts.
    const CIM_RegisteredProfile* antecedent = nullptr;
    const CIM_RegisteredProfile* dependent = nullptr;
    for (const CIM_RegisteredProfile* profile : profiles) {
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
    auto published = rebuilt.publish();
    QUENX_DEBUG("return %d", static_cast<int>(published.size()));
    return published;
}
