#include "Providers/Schema/CIM_ReferencedProfile.h"

constinit const core::CimClassInfo CIM_ReferencedProfile::classInfo{"CIM_ReferencedProfile",
                                                                    &CIM_ReferencedSpecification::classInfo,
                                                                    true,
                                                                    {},
                                                                    &core::makeSample<CIM_ReferencedProfile>};

CIM_ReferencedProfile::CIM_ReferencedProfile() {
    Antecedent.setKey();
    Dependent.setKey();
    declareClass(classInfo);
}

CIM_ReferencedProfile::~CIM_ReferencedProfile() = default;
