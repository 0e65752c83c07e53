// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateElementConformsToProfile.h"

#include "Providers/RegisteredProfile.h"
#include "Providers/SoftwareUpdate/AssociationEnds.h"

core::InstanceList::Iterator Quenx_SoftwareUpdateElementConformsToProfileClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("ElementConformsToProfile::getInstances");
    Rebuild rebuilt(m_instances);
    InstancesOf<const CIM_RegisteredProfile> profiles("Quenx_RegisteredProfile");
    QUENX_DEBUG("Quenx_RegisteredProfile return %d instances", profiles.count());
    Services services;
    QUENX_DEBUG("Quenx_SoftwareInstallationService return %d instances", services.count());
    for (const CIM_RegisteredProfile* profile : profiles) {
        const std::string id = profile->InstanceID.get();
        QUENX_DEBUG("['%s']", id.c_str());
        // Every provider registers its profiles under this class.
        if (id != kSoftwareUpdateProfile) continue;
        for (const CIM_SoftwareInstallationService* service : services) {
            QUENX_DEBUG("['%s']", service->Name.get().c_str());
            auto& conformance = rebuilt.add<Quenx_SoftwareUpdateElementConformsToProfile>();
            conformance.ConformantStandard = profile;
            conformance.ManagedElement = service;
        }
    }
    auto published = rebuilt.publish();
    QUENX_DEBUG("return %d", static_cast<int>(published.size()));
    return published;
}
