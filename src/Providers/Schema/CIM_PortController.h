#pragma once

#include "Framework/Model/CimProperties.h"
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

    // Repeated from the superclasses: the ones here are served.
    core::CimPropertyDatetime TimeOfLastReset{"TimeOfLastReset", this};
    core::CimPropertyUint16 ProtocolSupported{"ProtocolSupported", this};
    core::CimPropertyUint32 MaxNumberControlled{"MaxNumberControlled", this};
    core::CimPropertyString ProtocolDescription{"ProtocolDescription", this};
    core::CimPropertyString SystemCreationClassName{"SystemCreationClassName", this};
    core::CimPropertyString SystemName{"SystemName", this};
    core::CimPropertyString CreationClassName{"CreationClassName", this};
    core::CimPropertyString DeviceID{"DeviceID", this};
    core::CimPropertyBoolean PowerManagementSupported{"PowerManagementSupported", this};
    core::CimPropertyUint16_arr PowerManagementCapabilities{"PowerManagementCapabilities", this};
    core::CimPropertyUint16 Availability{"Availability", this};
    core::CimPropertyUint16 StatusInfo{"StatusInfo", this};
    core::CimPropertyUint32 LastErrorCode{"LastErrorCode", this};
    core::CimPropertyString ErrorDescription{"ErrorDescription", this};
    core::CimPropertyBoolean ErrorCleared{"ErrorCleared", this};
    core::CimPropertyString_arr OtherIdentifyingInfo{"OtherIdentifyingInfo", this};
    core::CimPropertyUint64 PowerOnHours{"PowerOnHours", this};
    core::CimPropertyUint64 TotalPowerOnHours{"TotalPowerOnHours", this};
    core::CimPropertyString_arr IdentifyingDescriptions{"IdentifyingDescriptions", this};
    core::CimPropertyUint16_arr AdditionalAvailability{"AdditionalAvailability", this};
    core::CimPropertyUint64 MaxQuiesceTime{"MaxQuiesceTime", this};
    core::CimPropertyUint16 EnabledState{"EnabledState", this};
    core::CimPropertyString OtherEnabledState{"OtherEnabledState", this};
    core::CimPropertyUint16 RequestedState{"RequestedState", this};
    core::CimPropertyUint16 EnabledDefault{"EnabledDefault", this};
    core::CimPropertyDatetime TimeOfLastStateChange{"TimeOfLastStateChange", this};
    core::CimPropertyUint16_arr AvailableRequestedStates{"AvailableRequestedStates", this};
    core::CimPropertyUint16 TransitioningToState{"TransitioningToState", this};
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
