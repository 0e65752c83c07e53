// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_LogicalPort.h"
#include "Utils/Export.h"

/// DMTF CIM_NetworkPort: where a device is connected to a network.
class QUENX_EXPORT CIM_NetworkPort : public CIM_LogicalPort {
  public:
    static const core::CimClassInfo classInfo;

    CIM_NetworkPort();
    ~CIM_NetworkPort() override;

    core::CimPropertyString OtherNetworkPortType{"OtherNetworkPortType", this};
    core::CimPropertyUint16 PortNumber{"PortNumber", this};
    core::CimPropertyUint16 LinkTechnology{"LinkTechnology", this};
    core::CimPropertyString OtherLinkTechnology{"OtherLinkTechnology", this};
    core::CimPropertyString PermanentAddress{"PermanentAddress", this};
    core::CimPropertyString_arr NetworkAddresses{"NetworkAddresses", this};
    core::CimPropertyBoolean FullDuplex{"FullDuplex", this};
    core::CimPropertyBoolean AutoSense{"AutoSense", this};
    core::CimPropertyUint64 SupportedMaximumTransmissionUnit{"SupportedMaximumTransmissionUnit", this};
    core::CimPropertyUint64 ActiveMaximumTransmissionUnit{"ActiveMaximumTransmissionUnit", this};
};
