// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CimPropertyRefT.h"
#include "Utils/Export.h"

/// DMTF CIM_AffectedJobElement: a job changes an element while it runs.
class QUENX_EXPORT CIM_AffectedJobElement : public core::CimInstance {
  public:
    static const core::CimClassInfo classInfo;

    CIM_AffectedJobElement();
    ~CIM_AffectedJobElement() override;

    core::CimPropertyRefT<CIM_ManagedElement> AffectedElement{"AffectedElement", this};
    core::CimPropertyRefT<CIM_Job> AffectingElement{"AffectingElement", this};
    core::CimPropertyUint16_arr ElementEffects{"ElementEffects", this};
    core::CimPropertyString_arr OtherElementEffectsDescriptions{"OtherElementEffectsDescriptions", this};
};
