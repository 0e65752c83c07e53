// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_LogicalDevice.h"
#include "Utils/Export.h"

/// DMTF CIM_LogicalPort: where a device is connected to others.
class QUENX_EXPORT CIM_LogicalPort : public CIM_LogicalDevice {
  public:
    static const core::CimClassInfo classInfo;

    CIM_LogicalPort();
    ~CIM_LogicalPort() override;

    core::CimPropertyUint64 Speed{"Speed", this};
    core::CimPropertyUint64 MaxSpeed{"MaxSpeed", this};
    core::CimPropertyUint64 RequestedSpeed{"RequestedSpeed", this};
    core::CimPropertyUint16 UsageRestriction{"UsageRestriction", this};
    core::CimPropertyUint16 PortType{"PortType", this};
    core::CimPropertyString OtherPortType{"OtherPortType", this};
};
