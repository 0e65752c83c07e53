// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_LogicalElement.h"
#include "Utils/Export.h"

/// DMTF CIM_EnabledLogicalElement: a logical element that can be enabled and disabled.
class QUENX_EXPORT CIM_EnabledLogicalElement : public CIM_LogicalElement {
  public:
    static const core::CimClassInfo classInfo;

    CIM_EnabledLogicalElement();
    ~CIM_EnabledLogicalElement() override;

    core::CimPropertyUint16 EnabledState{"EnabledState", this};
    core::CimPropertyString OtherEnabledState{"OtherEnabledState", this};
    core::CimPropertyUint16 RequestedState{"RequestedState", this};
    core::CimPropertyUint16 EnabledDefault{"EnabledDefault", this};
    core::CimPropertyDatetime TimeOfLastStateChange{"TimeOfLastStateChange", this};
    core::CimPropertyUint16_arr AvailableRequestedStates{"AvailableRequestedStates", this};
    core::CimPropertyUint16 TransitioningToState{"TransitioningToState", this};

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
