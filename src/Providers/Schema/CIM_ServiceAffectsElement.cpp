// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_ServiceAffectsElement.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A service has an effect on an element."},
};

}  // namespace

constinit const core::CimClassInfo CIM_ServiceAffectsElement::classInfo{
    "CIM_ServiceAffectsElement", nullptr, true, {}, &core::makeSample<CIM_ServiceAffectsElement>, kTexts};

CIM_ServiceAffectsElement::CIM_ServiceAffectsElement() {
    AffectedElement.setKey();
    AffectingElement.setKey();
    declareClass(classInfo);
}

CIM_ServiceAffectsElement::~CIM_ServiceAffectsElement() = default;
