// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CimPropertyRefT.h"
#include "Utils/Export.h"

/// DMTF CIM_ElementCapabilities: the capabilities of an element.
class QUENX_EXPORT CIM_ElementCapabilities : public core::CimInstance {
  public:
    static const core::CimClassInfo classInfo;

    CIM_ElementCapabilities();
    ~CIM_ElementCapabilities() override;

    core::CimPropertyRefT<CIM_ManagedElement> ManagedElement{"ManagedElement", this};
    core::CimPropertyRefT<CIM_Capabilities> Capabilities{"Capabilities", this};
    core::CimPropertyUint16_arr Characteristics{"Characteristics", this};
};
