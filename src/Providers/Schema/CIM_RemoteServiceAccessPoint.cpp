#include "Providers/Schema/CIM_RemoteServiceAccessPoint.h"

constinit const core::CimClassInfo CIM_RemoteServiceAccessPoint::classInfo{
    "CIM_RemoteServiceAccessPoint",
    &CIM_ServiceAccessPoint::classInfo,
    false,
    {},
    &core::makeSample<CIM_RemoteServiceAccessPoint>};

CIM_RemoteServiceAccessPoint::CIM_RemoteServiceAccessPoint() {
    declareClass(classInfo);
}

CIM_RemoteServiceAccessPoint::~CIM_RemoteServiceAccessPoint() = default;
