// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CimPropertyRefT.h"
#include "Utils/Export.h"

/// DMTF CIM_ServiceAffectsElement: a service can change an element.
class QUENX_EXPORT CIM_ServiceAffectsElement : public core::CimInstance {
  public:
    static const core::CimClassInfo classInfo;

    CIM_ServiceAffectsElement();
    ~CIM_ServiceAffectsElement() override;

    core::CimPropertyRefT<CIM_ManagedElement> AffectedElement{"AffectedElement", this};
    core::CimPropertyRefT<CIM_Service> AffectingElement{"AffectingElement", this};
    core::CimPropertyUint16_arr ElementEffects{"ElementEffects", this};
    core::CimPropertyString_arr OtherElementEffectsDescriptions{"OtherElementEffectsDescriptions", this};
    core::CimPropertyUint16 AssignedSequence{"AssignedSequence", this};
};
