// SPDX-License-Identifier: Apache-2.0
#pragma once

/// One class of the schema, as the DMTF's declarations and the rule of repetition make it; kept apart from
/// the bindings, so that a row missing or swapped there shows. The classes behind the service, its jobs and
/// its associations repeat what they inherit, those of the inventory do not.
struct SchemaRow {
    const char* name;
    const char* superclass;  ///< empty for a root
    /// The members that the class itself has, in order, each `Name:Kind`, where the kind is what follows
    /// core::CimProperty, or > and the class for a reference. A leading + marks what its declaration holds
    /// (what it adds, newly makes a key of, or refers to anew), a trailing * a key. A last word ... stands
    /// for the members of the superclass that are not among them.
    const char* properties;
};

// clang-format off
inline constexpr SchemaRow kSchemaTable[] = {
    {"CIM_ManagedElement", "",
     "+InstanceID:String +Caption:String +Description:String +ElementName:String +Generation:Uint64"},
    {"CIM_ManagedSystemElement", "CIM_ManagedElement",
     "+InstallDate:Datetime +Name:String +OperationalStatus:Uint16_arr "
     "+StatusDescriptions:String_arr +Status:String +HealthState:Uint16 +CommunicationStatus:Uint16 "
     "+DetailedStatus:Uint16 +OperatingStatus:Uint16 +PrimaryStatus:Uint16 ..."},
    {"CIM_LogicalElement", "CIM_ManagedSystemElement", "..."},
    {"CIM_Job", "CIM_LogicalElement",
     "+JobStatus:String +TimeSubmitted:Datetime +ScheduledStartTime:Datetime +StartTime:Datetime "
     "+ElapsedTime:Datetime +JobRunTimes:Uint32 +RunMonth:Uint8 +RunDay:Sint8 +RunDayOfWeek:Sint8 "
     "+RunStartInterval:Datetime +LocalOrUtcTime:Uint16 +UntilTime:Datetime +Notify:String "
     "+Owner:String +Priority:Uint32 +PercentComplete:Uint16 +DeleteOnCompletion:Boolean "
     "+ErrorCode:Uint16 +ErrorDescription:String +RecoveryAction:Uint16 +OtherRecoveryAction:String "
     "..."},
    {"CIM_ConcreteJob", "CIM_Job",
     "+InstanceID:String* Name:String +JobState:Uint16 +TimeOfLastStateChange:Datetime "
     "+TimeBeforeRemoval:Datetime +JobInParameters:String +JobOutParameters:String "
     "+MethodName:String ..."},
    {"CIM_EnabledLogicalElement", "CIM_LogicalElement",
     "+EnabledState:Uint16 +OtherEnabledState:String +RequestedState:Uint16 +EnabledDefault:Uint16 "
     "+TimeOfLastStateChange:Datetime +AvailableRequestedStates:Uint16_arr "
     "+TransitioningToState:Uint16 ..."},
    {"CIM_Service", "CIM_EnabledLogicalElement",
     "+SystemCreationClassName:String* +SystemName:String* +CreationClassName:String* +Name:String* "
     "+PrimaryOwnerName:String +PrimaryOwnerContact:String +StartMode:String +Started:Boolean ..."},
    {"CIM_SoftwareInstallationService", "CIM_Service", "..."},
    {"CIM_Capabilities", "CIM_ManagedElement", "+InstanceID:String* ElementName:String ..."},
    {"CIM_SoftwareInstallationServiceCapabilities", "CIM_Capabilities",
     "+SupportedAsynchronousActions:Uint16_arr +SupportedSynchronousActions:Uint16_arr "
     "+SupportedTargetTypes:String_arr +SupportedExtendedResourceTypes:Uint16_arr "
     "+CanAddToCollection:Boolean +SupportedInstallOptions:Uint16_arr "
     "+OtherSupportedExtendedResourceTypeDescriptions:String_arr "
     "+SupportedExtendedResourceTypesMajorVersions:Uint16_arr "
     "+SupportedExtendedResourceTypesMinorVersions:Uint16_arr "
     "+SupportedExtendedResourceTypesRevisionNumbers:Uint16_arr "
     "+SupportedExtendedResourceTypesBuildNumbers:Uint16_arr +SupportedURISchemes:Uint16_arr ..."},
    {"CIM_RegisteredSpecification", "CIM_ManagedElement",
     "+InstanceID:String* +SpecificationType:Uint16 +OtherSpecificationType:String "
     "+RegisteredOrganization:Uint16 +OtherRegisteredOrganization:String +RegisteredName:String "
     "+RegisteredVersion:String +AdvertiseTypes:Uint16_arr +AdvertiseTypeDescriptions:String_arr ..."},
    {"CIM_RegisteredProfile", "CIM_RegisteredSpecification",
     "SpecificationType:Uint16 +ImplementedFeatures:String_arr ..."},
    {"CIM_Dependency", "", "+Antecedent:>CIM_ManagedElement* +Dependent:>CIM_ManagedElement*"},
    {"CIM_ReferencedSpecification", "CIM_Dependency",
     "+Antecedent:>CIM_RegisteredSpecification* +Dependent:>CIM_RegisteredSpecification*"},
    {"CIM_ReferencedProfile", "CIM_ReferencedSpecification",
     "+Antecedent:>CIM_RegisteredProfile* +Dependent:>CIM_RegisteredProfile*"},
    {"CIM_AffectedJobElement", "",
     "+AffectedElement:>CIM_ManagedElement* +AffectingElement:>CIM_Job* +ElementEffects:Uint16_arr "
     "+OtherElementEffectsDescriptions:String_arr"},
    {"CIM_OwningJobElement", "", "+OwningElement:>CIM_ManagedElement* +OwnedElement:>CIM_Job*"},
    {"CIM_ServiceAffectsElement", "",
     "+AffectedElement:>CIM_ManagedElement* +AffectingElement:>CIM_Service* "
     "+ElementEffects:Uint16_arr +OtherElementEffectsDescriptions:String_arr +AssignedSequence:Uint16"},
    {"CIM_ElementCapabilities", "",
     "+ManagedElement:>CIM_ManagedElement* +Capabilities:>CIM_Capabilities* "
     "+Characteristics:Uint16_arr"},
    {"CIM_ElementConformsToProfile", "",
     "+ConformantStandard:>CIM_RegisteredProfile* +ManagedElement:>CIM_ManagedElement*"},
    {"CIM_LogicalDevice", "CIM_EnabledLogicalElement",
     "+SystemCreationClassName:String* +SystemName:String* +CreationClassName:String* "
     "+DeviceID:String* +PowerManagementSupported:Boolean +PowerManagementCapabilities:Uint16_arr "
     "+Availability:Uint16 +StatusInfo:Uint16 +LastErrorCode:Uint32 +ErrorDescription:String "
     "+ErrorCleared:Boolean +OtherIdentifyingInfo:String_arr +PowerOnHours:Uint64 "
     "+TotalPowerOnHours:Uint64 +IdentifyingDescriptions:String_arr "
     "+AdditionalAvailability:Uint16_arr +MaxQuiesceTime:Uint64"},
    {"CIM_LogicalPort", "CIM_LogicalDevice",
     "+Speed:Uint64 +MaxSpeed:Uint64 +RequestedSpeed:Uint64 +UsageRestriction:Uint16 "
     "+PortType:Uint16 +OtherPortType:String"},
    {"CIM_NetworkPort", "CIM_LogicalPort",
     "+OtherNetworkPortType:String +PortNumber:Uint16 +LinkTechnology:Uint16 "
     "+OtherLinkTechnology:String +PermanentAddress:String +NetworkAddresses:String_arr "
     "+FullDuplex:Boolean +AutoSense:Boolean +SupportedMaximumTransmissionUnit:Uint64 "
     "+ActiveMaximumTransmissionUnit:Uint64"},
    {"CIM_EthernetPort", "CIM_NetworkPort",
     "+MaxDataSize:Uint32 +Capabilities:Uint16_arr "
     "+CapabilityDescriptions:String_arr +EnabledCapabilities:Uint16_arr "
     "+OtherEnabledCapabilities:String_arr"},
    {"CIM_Controller", "CIM_LogicalDevice",
     "+TimeOfLastReset:Datetime +ProtocolSupported:Uint16 +MaxNumberControlled:Uint32 "
     "+ProtocolDescription:String"},
    {"CIM_PortController", "CIM_Controller", "+ControllerType:Uint16 +OtherControllerType:String"},
    {"CIM_SoftwareIdentity", "CIM_LogicalElement",
     "+InstanceID:String* +MajorVersion:Uint16 +MinorVersion:Uint16 +RevisionNumber:Uint16 "
     "+BuildNumber:Uint16 +VersionString:String +TargetOperatingSystems:String_arr "
     "+Manufacturer:String +Languages:String_arr +Classifications:Uint16_arr "
     "+ClassificationDescriptions:String_arr +SerialNumber:String +TargetTypes:String_arr "
     "+IdentityInfoValue:String_arr +IdentityInfoType:String_arr +ReleaseDate:Datetime "
     "+IsEntity:Boolean +ExtendedResourceType:Uint16 +OtherExtendedResourceTypeDescription:String "
     "+MinExtendedResourceTypeMajorVersion:Uint16 +MinExtendedResourceTypeMinorVersion:Uint16 "
     "+MinExtendedResourceTypeRevisionNumber:Uint16 +MinExtendedResourceTypeBuildNumber:Uint16 "
     "+TargetOSTypes:Uint16_arr +LargeBuildNumber:Uint32 +IsLargeBuildNumber:Boolean"},
    {"CIM_ServiceAccessPoint", "CIM_EnabledLogicalElement",
     "+SystemCreationClassName:String* +SystemName:String* +CreationClassName:String* +Name:String*"},
    {"CIM_RemoteServiceAccessPoint", "CIM_ServiceAccessPoint",
     "+AccessInfo:String +InfoFormat:Uint16 +OtherInfoFormatDescription:String +AccessContext:Uint16 "
     "+OtherAccessContext:String"},
    {"CIM_SoftwareIdentityResource", "CIM_RemoteServiceAccessPoint",
     "+ResourceType:Uint16 +OtherResourceType:String +ExtendedResourceType:Uint16 "
     "+OtherExtendedResourceTypeDescription:String +ExtendedResourceTypeMajorVersion:Uint16 "
     "+ExtendedResourceTypeMinorVersion:Uint16 +ExtendedResourceTypeRevisionNumber:Uint16 "
     "+ExtendedResourceTypeBuildNumber:Uint16"},
    {"CIM_ElementSoftwareIdentity", "CIM_Dependency",
     "+Antecedent:>CIM_SoftwareIdentity* Dependent:>CIM_ManagedElement* +UpgradeCondition:Uint16 "
     "+OtherUpgradeCondition:String +ElementSoftwareStatus:Uint16_arr"},
};
// clang-format on
