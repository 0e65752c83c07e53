// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateElementConformsToProfile.h"

#include "Framework/Classes/CimBroker.h"
#include "Providers/Schema/CIM_RegisteredProfile.h"
#include "Providers/Schema/CIM_SoftwareInstallationService.h"
#include "Providers/SoftwareUpdate/AssociationEnds.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"

constinit const core::CimClassInfo Quenx_SoftwareUpdateElementConformsToProfile::classInfo{
    "Quenx_ElementConformsToProfile", &CIM_ElementConformsToProfile::classInfo, true, {}, nullptr};

Quenx_SoftwareUpdateElementConformsToProfile::~Quenx_SoftwareUpdateElementConformsToProfile() = default;

std::string Quenx_SoftwareUpdateElementConformsToProfile::getClassName() const {
    return classInfo.name;
}

utils::SafeList<core::CimInstance*>::Iterator
Quenx_SoftwareUpdateElementConformsToProfileClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("ElementConformsToProfile::getInstances");
    Rebuild rebuilt(m_instances);
    core::CimBroker* broker = core::GetCimBroker();
    core::InstanceRange profiles(broker->getInstances("Quenx_RegisteredProfile", ""));
    QUENX_DEBUG("Quenx_RegisteredProfile return %d instances", static_cast<int>(profiles.size()));
    core::InstanceRange services(broker->getInstances("Quenx_SoftwareInstallationService", ""));
    QUENX_DEBUG("Quenx_SoftwareInstallationService return %d instances", static_cast<int>(services.size()));
    for (const core::CimInstance* each : profiles) {
        const auto* profile = dynamic_cast<const CIM_RegisteredProfile*>(each);
        if (profile == nullptr) continue;
        const std::string id = profile->InstanceID.get();
        QUENX_DEBUG("['%s']", id.c_str());
        // Every provider registers its profiles under this class.
        if (id != kSoftwareUpdateProfile) continue;
        for (const core::CimInstance* other : services) {
            const auto* service = dynamic_cast<const CIM_SoftwareInstallationService*>(other);
            if (service == nullptr) continue;
            QUENX_DEBUG("['%s']", service->Name.get().c_str());
            auto& conformance = rebuilt.add<Quenx_SoftwareUpdateElementConformsToProfile>();
            conformance.ConformantStandard = profile;
            conformance.ManagedElement = service;
        }
    }
    rebuilt.publish();
    QUENX_DEBUG("return %d", static_cast<int>(m_instances.size()));
    return m_instances.getElements(false);
}
