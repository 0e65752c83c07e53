// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_Service.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "The availability of functionality that can be managed."},
};

}  // namespace

constinit const core::CimClassInfo CIM_Service::classInfo{
    "CIM_Service", &CIM_EnabledLogicalElement::classInfo, false, {}, &core::makeSample<CIM_Service>, kTexts};

CIM_Service::CIM_Service() {
    SystemCreationClassName.setKey();
    SystemName.setKey();
    CreationClassName.setKey();
    Name.setKey();
    declareClass(classInfo);
}

CIM_Service::~CIM_Service() = default;
