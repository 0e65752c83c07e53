// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_LogicalDevice.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A hardware device as it is seen by management."},
};

}  // namespace

constinit const core::CimClassInfo CIM_LogicalDevice::classInfo{"CIM_LogicalDevice",
                                                                &CIM_EnabledLogicalElement::classInfo,
                                                                false,
                                                                {},
                                                                &core::makeSample<CIM_LogicalDevice>,
                                                                kTexts};

CIM_LogicalDevice::CIM_LogicalDevice() {
    SystemCreationClassName.setKey();
    SystemName.setKey();
    CreationClassName.setKey();
    DeviceID.setKey();
    declareClass(classInfo);
}

CIM_LogicalDevice::~CIM_LogicalDevice() = default;
