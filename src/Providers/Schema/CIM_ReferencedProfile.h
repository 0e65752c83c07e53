// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/Schema/CIM_ReferencedSpecification.h"
#include "Providers/Schema/CimPropertyRefT.h"
#include "Utils/Export.h"

/// DMTF CIM_ReferencedProfile: one registered profile refers to another.
class QUENX_EXPORT CIM_ReferencedProfile : public CIM_ReferencedSpecification {
  public:
    static const core::CimClassInfo classInfo;

    CIM_ReferencedProfile();
    ~CIM_ReferencedProfile() override;

    core::CimPropertyRefT<CIM_RegisteredProfile> Antecedent{"Antecedent", this};
    core::CimPropertyRefT<CIM_RegisteredProfile> Dependent{"Dependent", this};
};
