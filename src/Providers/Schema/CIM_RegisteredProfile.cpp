// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_RegisteredProfile.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A profile that is implemented, and where it may be advertised."},
};

}  // namespace

constinit const core::CimClassInfo CIM_RegisteredProfile::classInfo{"CIM_RegisteredProfile",
                                                                    &CIM_RegisteredSpecification::classInfo,
                                                                    false,
                                                                    {},
                                                                    &core::makeSample<CIM_RegisteredProfile>,
                                                                    kTexts};

CIM_RegisteredProfile::CIM_RegisteredProfile() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_RegisteredProfile::~CIM_RegisteredProfile() = default;
