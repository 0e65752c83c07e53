// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimInstance.h"
#include "Providers/Schema/CimPropertyRefT.h"
#include "Utils/Export.h"

/// DMTF CIM_Dependency: one element needs another, or is about it.
class QUENX_EXPORT CIM_Dependency : public core::CimInstance {
  public:
    static const core::CimClassInfo classInfo;

    CIM_Dependency();
    ~CIM_Dependency() override;

    core::CimPropertyRefT<CIM_ManagedElement> Antecedent{"Antecedent", this};
    core::CimPropertyRefT<CIM_ManagedElement> Dependent{"Dependent", this};
};
