// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_ServiceAccessPoint.h"
#include "Utils/Export.h"

/// DMTF CIM_RemoteServiceAccessPoint: where something can be reached, and how it is addressed.
class QUENX_EXPORT CIM_RemoteServiceAccessPoint : public CIM_ServiceAccessPoint {
  public:
    static const core::CimClassInfo classInfo;

    CIM_RemoteServiceAccessPoint();
    ~CIM_RemoteServiceAccessPoint() override;

    core::CimPropertyString AccessInfo{"AccessInfo", this};
    core::CimPropertyUint16 InfoFormat{"InfoFormat", this};
    core::CimPropertyString OtherInfoFormatDescription{"OtherInfoFormatDescription", this};
    core::CimPropertyUint16 AccessContext{"AccessContext", this};
    core::CimPropertyString OtherAccessContext{"OtherAccessContext", this};
};
