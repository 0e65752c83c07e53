// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimInstance.h"
#include "Providers/Schema/CimPropertyRefT.h"
#include "Utils/Export.h"

/// DMTF CIM_ElementConformsToProfile: an element does what a registered profile asks.
class QUENX_EXPORT CIM_ElementConformsToProfile : public core::CimInstance {
  public:
    static const core::CimClassInfo classInfo;

    CIM_ElementConformsToProfile();
    ~CIM_ElementConformsToProfile() override;

    core::CimPropertyRefT<CIM_RegisteredProfile> ConformantStandard{"ConformantStandard", this};
    core::CimPropertyRefT<CIM_ManagedElement> ManagedElement{"ManagedElement", this};
};
