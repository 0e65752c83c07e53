// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_Controller.h"
#include "Utils/Export.h"

/// DMTF CIM_PortController: the device behind a number of ports.
class QUENX_EXPORT CIM_PortController : public CIM_Controller {
  public:
    static const core::CimClassInfo classInfo;

    CIM_PortController();
    ~CIM_PortController() override;

    core::CimPropertyUint16 ControllerType{"ControllerType", this};
    core::CimPropertyString OtherControllerType{"OtherControllerType", this};
};
