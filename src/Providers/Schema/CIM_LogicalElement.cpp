// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_LogicalElement.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "The logical parts of a system: devices, services, software."},
};

}  // namespace

constinit const core::CimClassInfo CIM_LogicalElement::classInfo{"CIM_LogicalElement",
                                                                 &CIM_ManagedSystemElement::classInfo,
                                                                 false,
                                                                 {},
                                                                 &core::makeSample<CIM_LogicalElement>,
                                                                 kTexts};

CIM_LogicalElement::CIM_LogicalElement() {
    declareClass(classInfo);
}

CIM_LogicalElement::~CIM_LogicalElement() = default;
