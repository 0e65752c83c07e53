// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_OwningJobElement.h"

#include "Framework/Classes/CimBroker.h"
#include "Providers/Schema/CIM_Job.h"
#include "Providers/Schema/CIM_ManagedElement.h"
#include "Providers/SoftwareUpdate/AssociationEnds.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"

constinit const core::CimClassInfo Quenx_OwningJobElement::classInfo{
    "Quenx_OwningJobElement", &CIM_OwningJobElement::classInfo, true, {}, nullptr};

Quenx_OwningJobElement::~Quenx_OwningJobElement() = default;

std::string Quenx_OwningJobElement::getClassName() const {
    return classInfo.name;
}

utils::SafeList<core::CimInstance*>::Iterator Quenx_OwningJobElementClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("Quenx_OwningJobElementClass::getInstances");
    Rebuild rebuilt(m_instances);
    core::InstanceRange services(allServices());
    core::InstanceRange jobs(core::GetCimBroker()->getInstances(
        "Quenx_ConcreteJob", core::SoftwareUpdateAgent::CIM_PROVIDER_NAME));
    const auto* owner = dynamic_cast<const CIM_ManagedElement*>(onlyService(services));
    for (const core::CimInstance* job : jobs) {
        auto& association = rebuilt.add<Quenx_OwningJobElement>();
        association.OwningElement = owner;
        association.OwnedElement = dynamic_cast<const CIM_Job*>(job);
    }
    rebuilt.publish();
    return m_instances.getElements(false);
}
