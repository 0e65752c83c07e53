// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_Service.h"
#include "Utils/Export.h"

/// DMTF CIM_SoftwareInstallationService: a service that installs software, firmware included.
class QUENX_EXPORT CIM_SoftwareInstallationService : public CIM_Service {
  public:
    static const core::CimClassInfo classInfo;

    CIM_SoftwareInstallationService();
    ~CIM_SoftwareInstallationService() override;

    // Repeated from the superclasses: the ones here are served.
    core::CimPropertyString SystemCreationClassName{"SystemCreationClassName", this};
    core::CimPropertyString SystemName{"SystemName", this};
    core::CimPropertyString CreationClassName{"CreationClassName", this};
    core::CimPropertyString Name{"Name", this};
    core::CimPropertyString PrimaryOwnerName{"PrimaryOwnerName", this};
    core::CimPropertyString PrimaryOwnerContact{"PrimaryOwnerContact", this};
    core::CimPropertyString StartMode{"StartMode", this};
    core::CimPropertyBoolean Started{"Started", this};
    core::CimPropertyUint16 EnabledState{"EnabledState", this};
    core::CimPropertyString OtherEnabledState{"OtherEnabledState", this};
    core::CimPropertyUint16 RequestedState{"RequestedState", this};
    core::CimPropertyUint16 EnabledDefault{"EnabledDefault", this};
    core::CimPropertyDatetime TimeOfLastStateChange{"TimeOfLastStateChange", this};
    core::CimPropertyUint16_arr AvailableRequestedStates{"AvailableRequestedStates", this};
    core::CimPropertyUint16 TransitioningToState{"TransitioningToState", this};
    core::CimPropertyDatetime InstallDate{"InstallDate", this};
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
