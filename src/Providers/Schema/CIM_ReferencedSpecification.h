// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/Schema/CIM_Dependency.h"
#include "Providers/Schema/CimPropertyRefT.h"
#include "Utils/Export.h"

/// DMTF CIM_ReferencedSpecification: one registered document refers to another.
class QUENX_EXPORT CIM_ReferencedSpecification : public CIM_Dependency {
  public:
    static const core::CimClassInfo classInfo;

    CIM_ReferencedSpecification();
    ~CIM_ReferencedSpecification() override;

    core::CimPropertyRefT<CIM_RegisteredSpecification> Antecedent{"Antecedent", this};
    core::CimPropertyRefT<CIM_RegisteredSpecification> Dependent{"Dependent", this};
};
