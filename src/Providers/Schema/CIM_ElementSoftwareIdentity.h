// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_Dependency.h"
#include "Providers/Schema/CimPropertyRefT.h"
#include "Utils/Export.h"

/// DMTF CIM_ElementSoftwareIdentity: the software of an element.
class QUENX_EXPORT CIM_ElementSoftwareIdentity : public CIM_Dependency {
  public:
    static const core::CimClassInfo classInfo;

    CIM_ElementSoftwareIdentity();
    ~CIM_ElementSoftwareIdentity() override;

    core::CimPropertyRefT<CIM_SoftwareIdentity> Antecedent{"Antecedent", this};
    core::CimPropertyRefT<CIM_ManagedElement> Dependent{"Dependent", this};
    core::CimPropertyUint16 UpgradeCondition{"UpgradeCondition", this};
    core::CimPropertyString OtherUpgradeCondition{"OtherUpgradeCondition", this};
    core::CimPropertyUint16_arr ElementSoftwareStatus{"ElementSoftwareStatus", this};
};
