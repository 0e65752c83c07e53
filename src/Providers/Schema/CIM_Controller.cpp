// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_Controller.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A device that controls others."},
};

}  // namespace

constinit const core::CimClassInfo CIM_Controller::classInfo{
    "CIM_Controller", &CIM_LogicalDevice::classInfo, false, {}, &core::makeSample<CIM_Controller>, kTexts};

CIM_Controller::CIM_Controller() {
    declareClass(classInfo);
}

CIM_Controller::~CIM_Controller() = default;
