// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_Capabilities.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "What another element is able to do."},
};

}  // namespace

constinit const core::CimClassInfo CIM_Capabilities::classInfo{"CIM_Capabilities",
                                                               &CIM_ManagedElement::classInfo,
                                                               false,
                                                               {},
                                                               &core::makeSample<CIM_Capabilities>,
                                                               kTexts};

CIM_Capabilities::CIM_Capabilities() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_Capabilities::~CIM_Capabilities() = default;
