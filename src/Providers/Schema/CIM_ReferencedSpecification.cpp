#include "Providers/Schema/CIM_ReferencedSpecification.h"

constinit const core::CimClassInfo CIM_ReferencedSpecification::classInfo{
    "CIM_ReferencedSpecification",
    &CIM_Dependency::classInfo,
    true,
    {},
    &core::makeSample<CIM_ReferencedSpecification>};

CIM_ReferencedSpecification::CIM_ReferencedSpecification() {
    Antecedent.setKey();
    Dependent.setKey();
    declareClass(classInfo);
}

CIM_ReferencedSpecification::~CIM_ReferencedSpecification() = default;
