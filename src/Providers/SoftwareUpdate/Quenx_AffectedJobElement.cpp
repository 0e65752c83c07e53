// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_AffectedJobElement.h"

#include "Framework/Classes/CimBroker.h"
#include "Providers/SoftwareUpdate/AssociationEnds.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"

namespace {

void associate(const Quenx_ConcreteJob& job, const CIM_ManagedElement* affected, Rebuild& rebuilt) {
    auto& association = rebuilt.add<Quenx_AffectedJobElement>();
    association.AffectedElement = affected;
    association.AffectingElement = &job;
    association.ElementEffects.setNull();
    association.OtherElementEffectsDescriptions.setNull();
}

}  // namespace

constinit const core::CimClassInfo Quenx_AffectedJobElement::classInfo{
    "Quenx_AffectedJobElement", &CIM_AffectedJobElement::classInfo, true, {}, nullptr};

Quenx_AffectedJobElement::~Quenx_AffectedJobElement() = default;

std::string Quenx_AffectedJobElement::getClassName() const {
    return classInfo.name;
}

utils::SafeList<core::CimInstance*>::Iterator Quenx_AffectedJobElementClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("Quenx_AffectedJobElementClass::getInstances");
    Rebuild rebuilt(m_instances);
    core::InstanceRange jobs(core::GetCimBroker()->getInstances(
        "Quenx_ConcreteJob", core::SoftwareUpdateAgent::CIM_PROVIDER_NAME));
    const AdapterIndex adapters;
    for (const core::CimInstance* each : jobs) {
        const auto* job = dynamic_cast<const Quenx_ConcreteJob*>(each);
        const IndexedPort* port = job == nullptr ? nullptr : adapters.findPort(job->getAdapterName());
        // The adapter may have gone since the job was made.
        if (port == nullptr) continue;
        associate(*job, port->element, rebuilt);
        for (const CIM_ManagedElement* controller : port->controllers)
            associate(*job, controller, rebuilt);
    }
    rebuilt.publish();
    return m_instances.getElements(false);
}
