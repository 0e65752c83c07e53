// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_EnabledLogicalElement.h"
#include "Utils/Export.h"

/// DMTF CIM_ServiceAccessPoint: where something can be used.
class QUENX_EXPORT CIM_ServiceAccessPoint : public CIM_EnabledLogicalElement {
  public:
    static const core::CimClassInfo classInfo;

    CIM_ServiceAccessPoint();
    ~CIM_ServiceAccessPoint() override;

    core::CimPropertyString SystemCreationClassName{"SystemCreationClassName", this};
    core::CimPropertyString SystemName{"SystemName", this};
    core::CimPropertyString CreationClassName{"CreationClassName", this};
    core::CimPropertyString Name{"Name", this};
};
