// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_ElementSoftwareIdentity.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "The software of an element."},
};

}  // namespace

constinit const core::CimClassInfo CIM_ElementSoftwareIdentity::classInfo{
    "CIM_ElementSoftwareIdentity",
    &CIM_Dependency::classInfo,
    true,
    {},
    &core::makeSample<CIM_ElementSoftwareIdentity>,
    kTexts};

CIM_ElementSoftwareIdentity::CIM_ElementSoftwareIdentity() {
    Antecedent.setKey();
    Dependent.setKey();
    declareClass(classInfo);
}

CIM_ElementSoftwareIdentity::~CIM_ElementSoftwareIdentity() = default;
