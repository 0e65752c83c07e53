// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_LogicalPort.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "Where a device is connected to others."},
};

}  // namespace

constinit const core::CimClassInfo CIM_LogicalPort::classInfo{
    "CIM_LogicalPort", &CIM_LogicalDevice::classInfo, false, {}, &core::makeSample<CIM_LogicalPort>, kTexts};

CIM_LogicalPort::CIM_LogicalPort() {
    declareClass(classInfo);
}

CIM_LogicalPort::~CIM_LogicalPort() = default;
