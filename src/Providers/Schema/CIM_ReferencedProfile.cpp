// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_ReferencedProfile.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "One profile refers to another."},
};

}  // namespace

constinit const core::CimClassInfo CIM_ReferencedProfile::classInfo{"CIM_ReferencedProfile",
                                                                    &CIM_ReferencedSpecification::classInfo,
                                                                    true,
                                                                    {},
                                                                    &core::makeSample<CIM_ReferencedProfile>,
                                                                    kTexts};

CIM_ReferencedProfile::CIM_ReferencedProfile() {
    Antecedent.setKey();
    Dependent.setKey();
    declareClass(classInfo);
}

CIM_ReferencedProfile::~CIM_ReferencedProfile() = default;
