// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_NetworkPort.h"
#include "Utils/Export.h"

/// DMTF CIM_EthernetPort: where a device is connected to an Ethernet.
class QUENX_EXPORT CIM_EthernetPort : public CIM_NetworkPort {
  public:
    static const core::CimClassInfo classInfo;

    CIM_EthernetPort();
    ~CIM_EthernetPort() override;

    core::CimPropertyUint32 MaxDataSize{"MaxDataSize", this};
    core::CimPropertyUint16_arr Capabilities{"Capabilities", this};
    core::CimPropertyString_arr CapabilityDescriptions{"CapabilityDescriptions", this};
    core::CimPropertyUint16_arr EnabledCapabilities{"EnabledCapabilities", this};
    core::CimPropertyString_arr OtherEnabledCapabilities{"OtherEnabledCapabilities", this};
};
