#include "Providers/Schema/CIM_ManagedSystemElement.h"

constinit const core::CimClassInfo CIM_ManagedSystemElement::classInfo{
    "CIM_ManagedSystemElement",
    &CIM_ManagedElement::classInfo,
    false,
    {},
    &core::makeSample<CIM_ManagedSystemElement>};

CIM_ManagedSystemElement::CIM_ManagedSystemElement() {
    declareClass(classInfo);
}

CIM_ManagedSystemElement::~CIM_ManagedSystemElement() = default;
