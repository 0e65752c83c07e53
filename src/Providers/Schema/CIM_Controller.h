// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_LogicalDevice.h"
#include "Utils/Export.h"

/// DMTF CIM_Controller: a device that controls others.
class QUENX_EXPORT CIM_Controller : public CIM_LogicalDevice {
  public:
    static const core::CimClassInfo classInfo;

    CIM_Controller();
    ~CIM_Controller() override;

    core::CimPropertyDatetime TimeOfLastReset{"TimeOfLastReset", this};
    core::CimPropertyUint16 ProtocolSupported{"ProtocolSupported", this};
    core::CimPropertyUint32 MaxNumberControlled{"MaxNumberControlled", this};
    core::CimPropertyString ProtocolDescription{"ProtocolDescription", this};
};
