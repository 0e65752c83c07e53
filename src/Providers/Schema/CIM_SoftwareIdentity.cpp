#include "Providers/Schema/CIM_SoftwareIdentity.h"

constinit const core::CimClassInfo CIM_SoftwareIdentity::classInfo{"CIM_SoftwareIdentity",
                                                                   &CIM_LogicalElement::classInfo,
                                                                   false,
                                                                   {},
                                                                   &core::makeSample<CIM_SoftwareIdentity>};

CIM_SoftwareIdentity::CIM_SoftwareIdentity() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_SoftwareIdentity::~CIM_SoftwareIdentity() = default;
