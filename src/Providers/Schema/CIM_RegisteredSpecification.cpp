#include "Providers/Schema/CIM_RegisteredSpecification.h"

constinit const core::CimClassInfo CIM_RegisteredSpecification::classInfo{
    "CIM_RegisteredSpecification",
    &CIM_ManagedElement::classInfo,
    false,
    {},
    &core::makeSample<CIM_RegisteredSpecification>};

CIM_RegisteredSpecification::CIM_RegisteredSpecification() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_RegisteredSpecification::~CIM_RegisteredSpecification() = default;
