#include "Providers/SoftwareUpdate/Quenx_OwningJobElement.h"

#include "Framework/CimBroker.h"
#include "Providers/Schema/CIM_Job.h"
#include "Providers/Schema/CIM_ManagedElement.h"
#include "Providers/SoftwareUpdate/Rebuild.h"
#include "Providers/SoftwareUpdate/ServiceLookup.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"

constinit const core::CimClassInfo Quenx_OwningJobElement::classInfo{
    "Quenx_OwningJobElement", &CIM_OwningJobElement::classInfo, true, {}, nullptr};

Quenx_OwningJobElement::~Quenx_OwningJobElement() = default;

std::string Quenx_OwningJobElement::getClassName() const {
    return classInfo.name;
}

std::string Quenx_OwningJobElementClass::getClassName() {
    return Quenx_OwningJobElement::classInfo.name;
}

utils::SafeList<core::CimInstance*>::Iterator Quenx_OwningJobElementClass::getInstances() {
    QUENX_DEBUG("getInstances");
    const utils::TimeStamp timing("Quenx_OwningJobElementClass::getInstances");
    rebuild(m_instances, [](core::InstanceList& rebuilt) {
        const auto service = theService();
        const auto* owner = dynamic_cast<const CIM_ManagedElement*>(service.get());
        for (const core::CimInstance* job : core::InstanceRange(core::GetCimBroker()->getInstances(
                 "Quenx_ConcreteJob", core::SoftwareUpdateAgent::CIM_PROVIDER_NAME))) {
            auto association = std::make_unique<Quenx_OwningJobElement>();
            association->OwningElement = owner;
            association->OwnedElement = dynamic_cast<const CIM_Job*>(job);
            rebuilt.add(association.release());
        }
    });
    return m_instances.getElements(false);
}
