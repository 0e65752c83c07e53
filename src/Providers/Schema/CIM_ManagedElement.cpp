// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_ManagedElement.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "The root of the object hierarchy."},
};

}  // namespace

constinit const core::CimClassInfo CIM_ManagedElement::classInfo{
    "CIM_ManagedElement", nullptr, false, {}, &core::makeSample<CIM_ManagedElement>, kTexts};

CIM_ManagedElement::CIM_ManagedElement() {
    declareClass(classInfo);
}

CIM_ManagedElement::~CIM_ManagedElement() = default;
