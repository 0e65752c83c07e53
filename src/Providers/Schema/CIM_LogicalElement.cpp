#include "Providers/Schema/CIM_LogicalElement.h"

constinit const core::CimClassInfo CIM_LogicalElement::classInfo{"CIM_LogicalElement",
                                                                 &CIM_ManagedSystemElement::classInfo,
                                                                 false,
                                                                 {},
                                                                 &core::makeSample<CIM_LogicalElement>};

CIM_LogicalElement::CIM_LogicalElement() {
    declareClass(classInfo);
}

CIM_LogicalElement::~CIM_LogicalElement() = default;
