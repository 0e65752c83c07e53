// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_ManagedElement.h"
#include "Utils/Export.h"

/// DMTF CIM_Capabilities: what a managed element can do.
class QUENX_EXPORT CIM_Capabilities : public CIM_ManagedElement {
  public:
    static const core::CimClassInfo classInfo;

    CIM_Capabilities();
    ~CIM_Capabilities() override;

    core::CimPropertyString InstanceID{"InstanceID", this};
    core::CimPropertyString ElementName{"ElementName", this};

    // Repeated from the superclasses: the ones here are served.
    core::CimPropertyString Caption{"Caption", this};
    core::CimPropertyString Description{"Description", this};
    core::CimPropertyUint64 Generation{"Generation", this};
};
