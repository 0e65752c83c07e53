// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_ManagedElement.h"
#include "Utils/Export.h"

/// DMTF CIM_ManagedSystemElement: a part of a system.
class QUENX_EXPORT CIM_ManagedSystemElement : public CIM_ManagedElement {
  public:
    static const core::CimClassInfo classInfo;

    CIM_ManagedSystemElement();
    ~CIM_ManagedSystemElement() override;

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

    // Repeated from the superclasses: the ones here are served.
    core::CimPropertyString InstanceID{"InstanceID", this};
    core::CimPropertyString Caption{"Caption", this};
    core::CimPropertyString Description{"Description", this};
    core::CimPropertyString ElementName{"ElementName", this};
    core::CimPropertyUint64 Generation{"Generation", this};
};
