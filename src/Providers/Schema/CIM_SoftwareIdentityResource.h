#pragma once

#include "Framework/Model/CimProperties.h"
#include "Providers/Schema/CIM_RemoteServiceAccessPoint.h"
#include "Utils/Export.h"

/// DMTF CIM_SoftwareIdentityResource: where the file of a software identity is.
class QUENX_EXPORT CIM_SoftwareIdentityResource : public CIM_RemoteServiceAccessPoint {
  public:
    static const core::CimClassInfo classInfo;

    CIM_SoftwareIdentityResource();
    ~CIM_SoftwareIdentityResource() override;

    core::CimPropertyUint16 ResourceType{"ResourceType", this};
    core::CimPropertyString OtherResourceType{"OtherResourceType", this};
    core::CimPropertyUint16 ExtendedResourceType{"ExtendedResourceType", this};
    core::CimPropertyString OtherExtendedResourceTypeDescription{"OtherExtendedResourceTypeDescription",
                                                                 this};
    core::CimPropertyUint16 ExtendedResourceTypeMajorVersion{"ExtendedResourceTypeMajorVersion", this};
    core::CimPropertyUint16 ExtendedResourceTypeMinorVersion{"ExtendedResourceTypeMinorVersion", this};
    core::CimPropertyUint16 ExtendedResourceTypeRevisionNumber{"ExtendedResourceTypeRevisionNumber", this};
    core::CimPropertyUint16 ExtendedResourceTypeBuildNumber{"ExtendedResourceTypeBuildNumber", this};

    // Repeated from the superclasses: the ones here are served.
    core::CimPropertyString AccessInfo{"AccessInfo", this};
    core::CimPropertyUint16 InfoFormat{"InfoFormat", this};
    core::CimPropertyString OtherInfoFormatDescription{"OtherInfoFormatDescription", this};
    core::CimPropertyUint16 AccessContext{"AccessContext", this};
    core::CimPropertyString OtherAccessContext{"OtherAccessContext", this};
    core::CimPropertyString SystemCreationClassName{"SystemCreationClassName", this};
    core::CimPropertyString SystemName{"SystemName", this};
    core::CimPropertyString CreationClassName{"CreationClassName", this};
    core::CimPropertyString Name{"Name", this};
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
