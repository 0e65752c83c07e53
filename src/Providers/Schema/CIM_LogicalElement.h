// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_ManagedSystemElement.h"
#include "Utils/Export.h"

/// DMTF CIM_LogicalElement: a part of a system that is not a physical thing.
class QUENX_EXPORT CIM_LogicalElement : public CIM_ManagedSystemElement {
  public:
    static const core::CimClassInfo classInfo;

    CIM_LogicalElement();
    ~CIM_LogicalElement() override;

    // Repeated from the superclasses: the ones here are served.
    core::CimPropertyDatetime InstallDate{"InstallDate", this};
    core::CimPropertyString Name{"Name", this};
    core::CimPropertyUint16_arr OperationalStatus{"OperationalStatus", this};
    core::CimPropertyString_arr StatusDescriptions{"StatusDescriptions", this};
    core::CimPropertyString Status{"Status", this};
    core::CimPropertyUint16 HealthState{"HealthState", this};
    core::CimPropertyUint16 CommunicationStatus{"CommunicationStatus", this};
    core::CimPropertyUint16 DetailedStatus{"DetailedStatus", this};
    core::CimPropertyUint16 OperatingStatus{"OperatingStatus", this};
    core::CimPropertyUint16 PrimaryStatus{"PrimaryStatus", this};
    core::CimPropertyString InstanceID{"InstanceID", this};
    core::CimPropertyString Caption{"Caption", this};
    core::CimPropertyString Description{"Description", this};
    core::CimPropertyString ElementName{"ElementName", this};
    core::CimPropertyUint64 Generation{"Generation", this};
};
