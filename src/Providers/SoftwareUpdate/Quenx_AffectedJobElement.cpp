// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_AffectedJobElement.h"

#include "Providers/SoftwareUpdate/AssociationEnds.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"

namespace {

void associate(const Quenx_ConcreteJob* job, const CIM_ManagedElement* affected, Rebuild& rebuilt) {
    auto& association = rebuilt.add<Quenx_AffectedJobElement>();
    association.AffectedElement = affected;
    association.AffectingElement = job;
    setNull(association.ElementEffects, association.OtherElementEffectsDescriptions);
}

}  // namespace

core::InstanceList::Iterator Quenx_AffectedJobElementClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("Quenx_AffectedJobElementClass::getInstances");
    Rebuild rebuilt(m_instances);
    const InstancesOf<const Quenx_ConcreteJob> jobs("Quenx_ConcreteJob",
                                                    core::SoftwareUpdateAgent::CIM_PROVIDER_NAME);
    const AdapterIndex adapters;
    for (const Quenx_ConcreteJob* job : jobs) {
        const IndexedPort* port = adapters.findPort(job->getAdapterName());
        // The adapter may have gone since the job was made.
        if (port == nullptr) continue;
        associate(job, port->element, rebuilt);
        for (const CIM_ManagedElement* controller : port->controllers)
            associate(job, controller, rebuilt);
    }
    return rebuilt.publish();
}
