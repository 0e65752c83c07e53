// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_EnabledLogicalElement.h"
#include "Utils/Export.h"

/// DMTF CIM_LogicalDevice: a device as its functions show it, apart from its hardware.
class QUENX_EXPORT CIM_LogicalDevice : public CIM_EnabledLogicalElement {
  public:
    static const core::CimClassInfo classInfo;

    CIM_LogicalDevice();
    ~CIM_LogicalDevice() override;

    core::CimPropertyString SystemCreationClassName{"SystemCreationClassName", this};
    core::CimPropertyString SystemName{"SystemName", this};
    core::CimPropertyString CreationClassName{"CreationClassName", this};
    core::CimPropertyString DeviceID{"DeviceID", this};
    core::CimPropertyBoolean PowerManagementSupported{"PowerManagementSupported", this};
    core::CimPropertyUint16_arr PowerManagementCapabilities{"PowerManagementCapabilities", this};
    core::CimPropertyUint16 Availability{"Availability", this};
    core::CimPropertyUint16 StatusInfo{"StatusInfo", this};
    core::CimPropertyUint32 LastErrorCode{"LastErrorCode", this};
    core::CimPropertyString ErrorDescription{"ErrorDescription", this};
    core::CimPropertyBoolean ErrorCleared{"ErrorCleared", this};
    core::CimPropertyString_arr OtherIdentifyingInfo{"OtherIdentifyingInfo", this};
    core::CimPropertyUint64 PowerOnHours{"PowerOnHours", this};
    core::CimPropertyUint64 TotalPowerOnHours{"TotalPowerOnHours", this};
    core::CimPropertyString_arr IdentifyingDescriptions{"IdentifyingDescriptions", this};
    core::CimPropertyUint16_arr AdditionalAvailability{"AdditionalAvailability", this};
    core::CimPropertyUint64 MaxQuiesceTime{"MaxQuiesceTime", this};
};
