// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimInstance.h"
#include "Framework/Model/CimProperty.h"
#include "Utils/Export.h"

/// DMTF CIM_ManagedElement: root of everything that can be managed.
class QUENX_EXPORT CIM_ManagedElement : public core::CimInstance {
  public:
    static const core::CimClassInfo classInfo;

    CIM_ManagedElement();
    ~CIM_ManagedElement() override;

    core::CimPropertyString InstanceID{"InstanceID", this};
    core::CimPropertyString Caption{"Caption", this};
    core::CimPropertyString Description{"Description", this};
    core::CimPropertyString ElementName{"ElementName", this};
    core::CimPropertyUint64 Generation{"Generation", this};
};
