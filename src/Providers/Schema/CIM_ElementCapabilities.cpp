#include "Providers/Schema/CIM_ElementCapabilities.h"

constinit const core::CimClassInfo CIM_ElementCapabilities::classInfo{
    "CIM_ElementCapabilities", nullptr, true, {}, &core::makeSample<CIM_ElementCapabilities>};

CIM_ElementCapabilities::CIM_ElementCapabilities() {
    ManagedElement.setKey();
    Capabilities.setKey();
    declareClass(classInfo);
}

CIM_ElementCapabilities::~CIM_ElementCapabilities() = default;
