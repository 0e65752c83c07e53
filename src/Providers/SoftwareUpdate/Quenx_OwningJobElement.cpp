// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_OwningJobElement.h"

#include "Providers/Schema/CIM_Job.h"
#include "Providers/SoftwareUpdate/AssociationEnds.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"

core::InstanceList::Iterator Quenx_OwningJobElementClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("Quenx_OwningJobElementClass::getInstances");
    Rebuild rebuilt(m_instances);
    Services services;
    const InstancesOf<const CIM_Job> jobs("Quenx_ConcreteJob", core::SoftwareUpdateAgent::CIM_PROVIDER_NAME);
    const CIM_SoftwareInstallationService* owner = onlyOne(services);
    for (const CIM_Job* job : jobs) {
        auto& association = rebuilt.add<Quenx_OwningJobElement>();
        association.OwningElement = owner;
        association.OwnedElement = job;
    }
    return rebuilt.publish();
}
