#include "Providers/Schema/CIM_Service.h"

constinit const core::CimClassInfo CIM_Service::classInfo{
    "CIM_Service", &CIM_EnabledLogicalElement::classInfo, false, {}, &core::makeSample<CIM_Service>};

CIM_Service::CIM_Service() {
    SystemCreationClassName.setKey();
    SystemName.setKey();
    CreationClassName.setKey();
    Name.setKey();
    declareClass(classInfo);
}

CIM_Service::~CIM_Service() = default;
