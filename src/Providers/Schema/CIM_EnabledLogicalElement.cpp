#include "Providers/Schema/CIM_EnabledLogicalElement.h"

constinit const core::CimClassInfo CIM_EnabledLogicalElement::classInfo{
    "CIM_EnabledLogicalElement",
    &CIM_LogicalElement::classInfo,
    false,
    {},
    &core::makeSample<CIM_EnabledLogicalElement>};

CIM_EnabledLogicalElement::CIM_EnabledLogicalElement() {
    declareClass(classInfo);
}

CIM_EnabledLogicalElement::~CIM_EnabledLogicalElement() = default;
