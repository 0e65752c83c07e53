#include "Providers/Schema/CIM_ManagedElement.h"

constinit const core::CimClassInfo CIM_ManagedElement::classInfo{
    "CIM_ManagedElement", nullptr, false, {}, &core::makeSample<CIM_ManagedElement>};

CIM_ManagedElement::CIM_ManagedElement() {
    declareClass(classInfo);
}

CIM_ManagedElement::~CIM_ManagedElement() = default;
