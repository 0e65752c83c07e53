// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_EnabledLogicalElement.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr const char* kEnabledStates =
    "0=Unknown;1=Other;2=Enabled;3=Disabled;4=Shutting Down;5=Not Applicable;6=Enabled but Offline;7=In "
    "Test;8=Deferred;9=Quiesce;10=Starting;11..32767=DMTF Reserved;32768..65535=Vendor Reserved";

constexpr const char* kRequestedStates =
    "0=Unknown;2=Enabled;3=Disabled;4=Shut Down;5=No "
    "Change;6=Offline;7=Test;8=Deferred;9=Quiesce;10=Reboot;11=Reset;12=Not Applicable;..=DMTF "
    "Reserved;32768..65535=Vendor Reserved";

constexpr core::CimElementText kTexts[] = {
    {"", "A logical element that can be enabled and disabled."},
    {"EnabledState", "Whether the element is enabled.", kEnabledStates},
    {"RequestedState", "The state that was last asked for.", kRequestedStates},
    {"EnabledDefault", "The state after a start.",
     "2=Enabled;3=Disabled;5=Not Applicable;6=Enabled but Offline;7=No Default;9=Quiesce;..=DMTF "
     "Reserved;32768..65535=Vendor Reserved"},
    {"TransitioningToState", "The state that the element is on its way to.", kRequestedStates},
};

}  // namespace

constinit const core::CimClassInfo CIM_EnabledLogicalElement::classInfo{
    "CIM_EnabledLogicalElement",
    &CIM_LogicalElement::classInfo,
    false,
    {},
    &core::makeSample<CIM_EnabledLogicalElement>,
    kTexts};

CIM_EnabledLogicalElement::CIM_EnabledLogicalElement() {
    declareClass(classInfo);
}

CIM_EnabledLogicalElement::~CIM_EnabledLogicalElement() = default;
