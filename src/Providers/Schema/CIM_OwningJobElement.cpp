// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_OwningJobElement.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "The element that is responsible for a job."},
};

}  // namespace

constinit const core::CimClassInfo CIM_OwningJobElement::classInfo{
    "CIM_OwningJobElement", nullptr, true, {}, &core::makeSample<CIM_OwningJobElement>, kTexts};

CIM_OwningJobElement::CIM_OwningJobElement() {
    OwningElement.setKey();
    OwnedElement.setKey();
    declareClass(classInfo);
}

CIM_OwningJobElement::~CIM_OwningJobElement() = default;
