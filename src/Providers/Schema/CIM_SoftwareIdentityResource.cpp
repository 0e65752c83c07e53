#include "Providers/Schema/CIM_SoftwareIdentityResource.h"

constinit const core::CimClassInfo CIM_SoftwareIdentityResource::classInfo{
    "CIM_SoftwareIdentityResource",
    &CIM_RemoteServiceAccessPoint::classInfo,
    false,
    {},
    &core::makeSample<CIM_SoftwareIdentityResource>};

CIM_SoftwareIdentityResource::CIM_SoftwareIdentityResource() {
    declareClass(classInfo);
}

CIM_SoftwareIdentityResource::~CIM_SoftwareIdentityResource() = default;
