#include "Providers/Schema/CIM_RegisteredProfile.h"

constinit const core::CimClassInfo CIM_RegisteredProfile::classInfo{"CIM_RegisteredProfile",
                                                                    &CIM_RegisteredSpecification::classInfo,
                                                                    false,
                                                                    {},
                                                                    &core::makeSample<CIM_RegisteredProfile>};

CIM_RegisteredProfile::CIM_RegisteredProfile() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_RegisteredProfile::~CIM_RegisteredProfile() = default;
