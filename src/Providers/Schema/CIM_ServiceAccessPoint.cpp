// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_ServiceAccessPoint.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A way to reach a service."},
};

}  // namespace

constinit const core::CimClassInfo CIM_ServiceAccessPoint::classInfo{
    "CIM_ServiceAccessPoint",
    &CIM_EnabledLogicalElement::classInfo,
    false,
    {},
    &core::makeSample<CIM_ServiceAccessPoint>,
    kTexts};

CIM_ServiceAccessPoint::CIM_ServiceAccessPoint() {
    SystemCreationClassName.setKey();
    SystemName.setKey();
    CreationClassName.setKey();
    Name.setKey();
    declareClass(classInfo);
}

CIM_ServiceAccessPoint::~CIM_ServiceAccessPoint() = default;
