// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_Dependency.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "One element depends on another."},
};

}  // namespace

constinit const core::CimClassInfo CIM_Dependency::classInfo{
    "CIM_Dependency", nullptr, true, {}, &core::makeSample<CIM_Dependency>, kTexts};

CIM_Dependency::CIM_Dependency() {
    Antecedent.setKey();
    Dependent.setKey();
    declareClass(classInfo);
}

CIM_Dependency::~CIM_Dependency() = default;
