#include "Providers/Schema/CIM_ElementSoftwareIdentity.h"

constinit const core::CimClassInfo CIM_ElementSoftwareIdentity::classInfo{
    "CIM_ElementSoftwareIdentity",
    &CIM_Dependency::classInfo,
    true,
    {},
    &core::makeSample<CIM_ElementSoftwareIdentity>};

CIM_ElementSoftwareIdentity::CIM_ElementSoftwareIdentity() {
    Antecedent.setKey();
    Dependent.setKey();
    declareClass(classInfo);
}

CIM_ElementSoftwareIdentity::~CIM_ElementSoftwareIdentity() = default;
