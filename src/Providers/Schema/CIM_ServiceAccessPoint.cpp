#include "Providers/Schema/CIM_ServiceAccessPoint.h"

constinit const core::CimClassInfo CIM_ServiceAccessPoint::classInfo{
    "CIM_ServiceAccessPoint",
    &CIM_EnabledLogicalElement::classInfo,
    false,
    {},
    &core::makeSample<CIM_ServiceAccessPoint>};

CIM_ServiceAccessPoint::CIM_ServiceAccessPoint() {
    SystemCreationClassName.setKey();
    SystemName.setKey();
    CreationClassName.setKey();
    Name.setKey();
    declareClass(classInfo);
}

CIM_ServiceAccessPoint::~CIM_ServiceAccessPoint() = default;
