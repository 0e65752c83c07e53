// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_ElementCapabilities.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "The capabilities of an element."},
};

}  // namespace

constinit const core::CimClassInfo CIM_ElementCapabilities::classInfo{
    "CIM_ElementCapabilities", nullptr, true, {}, &core::makeSample<CIM_ElementCapabilities>, kTexts};

CIM_ElementCapabilities::CIM_ElementCapabilities() {
    ManagedElement.setKey();
    Capabilities.setKey();
    declareClass(classInfo);
}

CIM_ElementCapabilities::~CIM_ElementCapabilities() = default;
