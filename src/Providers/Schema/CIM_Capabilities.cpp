#include "Providers/Schema/CIM_Capabilities.h"

constinit const core::CimClassInfo CIM_Capabilities::classInfo{
    "CIM_Capabilities", &CIM_ManagedElement::classInfo, false, {}, &core::makeSample<CIM_Capabilities>};

CIM_Capabilities::CIM_Capabilities() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_Capabilities::~CIM_Capabilities() = default;
