// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_ReferencedSpecification.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "One registered document refers to another."},
};

}  // namespace

constinit const core::CimClassInfo CIM_ReferencedSpecification::classInfo{
    "CIM_ReferencedSpecification",
    &CIM_Dependency::classInfo,
    true,
    {},
    &core::makeSample<CIM_ReferencedSpecification>,
    kTexts};

CIM_ReferencedSpecification::CIM_ReferencedSpecification() {
    Antecedent.setKey();
    Dependent.setKey();
    declareClass(classInfo);
}

CIM_ReferencedSpecification::~CIM_ReferencedSpecification() = default;
