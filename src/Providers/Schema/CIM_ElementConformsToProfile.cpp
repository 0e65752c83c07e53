// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_ElementConformsToProfile.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "An element conforms to a profile."},
};

}  // namespace

constinit const core::CimClassInfo CIM_ElementConformsToProfile::classInfo{
    "CIM_ElementConformsToProfile",
    nullptr,
    true,
    {},
    &core::makeSample<CIM_ElementConformsToProfile>,
    kTexts};

CIM_ElementConformsToProfile::CIM_ElementConformsToProfile() {
    ConformantStandard.setKey();
    ManagedElement.setKey();
    declareClass(classInfo);
}

CIM_ElementConformsToProfile::~CIM_ElementConformsToProfile() = default;
