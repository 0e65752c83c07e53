// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_AffectedJobElement.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A job affects an element."},
};

}  // namespace

constinit const core::CimClassInfo CIM_AffectedJobElement::classInfo{
    "CIM_AffectedJobElement", nullptr, true, {}, &core::makeSample<CIM_AffectedJobElement>, kTexts};

CIM_AffectedJobElement::CIM_AffectedJobElement() {
    AffectedElement.setKey();
    AffectingElement.setKey();
    declareClass(classInfo);
}

CIM_AffectedJobElement::~CIM_AffectedJobElement() = default;
