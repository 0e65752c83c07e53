#include "Framework/Model/SchemaQualifiers.h"

#include <algorithm>
#include <iterator>
#include <span>

#include "Framework/Model/CimType.h"

namespace core {

namespace {

/// Values are written "value=meaning;value=meaning", so that a row reads as a row.
struct Row {
    std::string_view className;
    std::string_view element;  ///< empty: the class itself
    std::string_view description;
    std::string_view values = {};
};

constexpr std::string_view ENABLED_STATES =
    "0=Unknown;1=Other;2=Enabled;3=Disabled;4=Shutting Down;5=Not Applicable;6=Enabled but Offline;7=In Test;"
    "8=Deferred;9=Quiesce;10=Starting;11..32767=DMTF Reserved;32768..65535=Vendor Reserved";
constexpr std::string_view REQUESTED_STATES =
    "0=Unknown;2=Enabled;3=Disabled;4=Shut Down;5=No Change;6=Offline;7=Test;8=Deferred;9=Quiesce;10=Reboot;"
    "11=Reset;12=Not Applicable;..=DMTF Reserved;32768..65535=Vendor Reserved";
constexpr std::string_view INSTALL_RESULTS =
    "0=Job Completed with No Error;1=Not Supported;2=Unspecified Error;3=Timeout;4=Failed;5=Invalid "
    "Parameter;"
    "6=Target In Use;..=DMTF Reserved;4096=Method Parameters Checked - Job Started;4097=Unsupported "
    "TargetType;"
    "4098=Unattended/silent installation not supported;4099=Downgrade/Reinstall not supported;"
    "4100=Not enough memory;4101=Not enough swap space;4102=Unsupported version transition;"
    "4103=Not enough disk space;4104=Software and target operating system mismatch;4105=Missing dependencies;"
    "4106=Not applicable to target;4107=No supported path to image;4108=Cannot add to Collection;"
    "4109=Asynchronous Job already in progress;..=Method Reserved;32768..65535=Vendor Specific";
constexpr std::string_view INSTALL_OPTIONS =
    "2=Defer target/system reset;3=Force "
    "installation;4=Install;5=Update;6=Repair;7=Reboot;8=Password;9=Uninstall;"
    "10=Log;11=SilentMode;12=AdministrativeMode;13=ScheduleInstallAt;..=DMTF Reserved;32768..65535=Vendor "
    "Specific";
constexpr std::string_view INSTALL_ACTIONS =
    "2=None supported;3=Install From Software Identity;4=Install from ByteStream;5=Install from URI;"
    "..=DMTF Reserved;0x8000..0xFFFF=Vendor Reserved";
constexpr std::string_view EXTENDED_RESOURCE_TYPES =
    "0=Unknown;1=Other;2=Not Applicable;3=Linux RPM;4=HP-UX Depot;5=Windows MSI;6=Solaris Package;"
    "7=Macintosh Disk Image;8=Debian linux Package;9=VMware vSphere Installation Bundle;"
    "10=VMware Software Bulletin;11=HP Smart Component;12..32767=DMTF Reserved;32768..65535=Vendor Reserved";

constexpr Row CLASSES[] = {
    {"CIM_ManagedElement", "", "The root of the object hierarchy."},
    {"CIM_ManagedSystemElement", "", "Any part of a system that is managed, physical or logical."},
    {"CIM_LogicalElement", "", "The logical parts of a system: devices, services, software."},
    {"CIM_EnabledLogicalElement", "", "A logical element that can be enabled and disabled."},
    {"CIM_Job", "", "A unit of work for a system."},
    {"CIM_ConcreteJob", "", "A job that is run and can be followed."},
    {"CIM_Service", "", "The availability of functionality that can be managed."},
    {"CIM_SoftwareInstallationService", "", "A service that installs software, firmware included."},
    {"CIM_Capabilities", "", "What another element is able to do."},
    {"CIM_SoftwareInstallationServiceCapabilities", "",
     "What a software installation service is able to do."},
    {"CIM_RegisteredSpecification", "", "A published document that an implementation conforms to."},
    {"CIM_RegisteredProfile", "", "A profile that is implemented, and where it may be advertised."},
    {"CIM_Dependency", "", "One element depends on another."},
    {"CIM_AffectedJobElement", "", "A job affects an element."},
    {"CIM_OwningJobElement", "", "The element that is responsible for a job."},
    {"CIM_ServiceAffectsElement", "", "A service has an effect on an element."},
    {"CIM_ElementCapabilities", "", "The capabilities of an element."},
    {"CIM_ElementConformsToProfile", "", "An element conforms to a profile."},
    {"CIM_ReferencedSpecification", "", "One registered document refers to another."},
    {"CIM_ReferencedProfile", "", "One profile refers to another."},
    {"CIM_LogicalDevice", "", "A hardware device as it is seen by management."},
    {"CIM_LogicalPort", "", "Where a device is connected to others."},
    {"CIM_NetworkPort", "", "A port for network communication."},
    {"CIM_EthernetPort", "", "A port to an Ethernet."},
    {"CIM_Controller", "", "A device that controls others."},
    {"CIM_PortController", "", "A controller of ports, such as a network card."},
    {"CIM_SoftwareIdentity", "", "A piece of software, installed or to be installed, and its version."},
    {"CIM_ServiceAccessPoint", "", "A way to reach a service."},
    {"CIM_RemoteServiceAccessPoint", "", "A way to reach a service elsewhere."},
    {"CIM_SoftwareIdentityResource", "", "Where the file of a software identity is."},
    {"CIM_ElementSoftwareIdentity", "", "The software of an element."},
};

constexpr Row ELEMENTS[] = {
    {"CIM_ManagedSystemElement", "OperationalStatus", "The current statuses of the element.",
     "0=Unknown;1=Other;2=OK;3=Degraded;4=Stressed;5=Predictive Failure;6=Error;7=Non-Recoverable "
     "Error;8=Starting;"
     "9=Stopping;10=Stopped;11=In Service;12=No Contact;13=Lost Communication;14=Aborted;15=Dormant;"
     "16=Supporting Entity in Error;17=Completed;18=Power Mode;19=Relocating;..=DMTF Reserved;"
     "0x8000..=Vendor Reserved"},
    {"CIM_ManagedSystemElement", "HealthState", "The current health of the element.",
     "0=Unknown;5=OK;10=Degraded/Warning;15=Minor failure;20=Major failure;25=Critical failure;"
     "30=Non-recoverable error;..=DMTF Reserved;32768..65535=Vendor Specific"},
    {"CIM_ManagedSystemElement", "PrimaryStatus", "The status at a glance.",
     "0=Unknown;1=OK;2=Degraded;3=Error;..=DMTF Reserved;0x8000..=Vendor Reserved"},
    {"CIM_ManagedSystemElement", "DetailedStatus", "More of the primary status.",
     "0=Not Available;1=No Additional Information;2=Stressed;3=Predictive Failure;4=Non-Recoverable Error;"
     "5=Supporting Entity in Error;..=DMTF Reserved;0x8000..=Vendor Reserved"},
    {"CIM_ManagedSystemElement", "OperatingStatus", "What the element is doing.",
     "0=Unknown;1=Not Available;2=Servicing;3=Starting;4=Stopping;5=Stopped;6=Aborted;7=Dormant;8=Completed;"
     "9=Migrating;10=Emigrating;11=Immigrating;12=Snapshotting;13=Shutting Down;14=In Test;15=Transitioning;"
     "16=In Service;..=DMTF Reserved;0x8000..=Vendor Reserved"},
    {"CIM_ManagedSystemElement", "CommunicationStatus", "Whether the element can be communicated with.",
     "0=Unknown;1=Not Available;2=Communication OK;3=Lost Communication;4=No Contact;..=DMTF Reserved;"
     "0x8000..=Vendor Reserved"},
    {"CIM_EnabledLogicalElement", "EnabledState", "Whether the element is enabled.", ENABLED_STATES},
    {"CIM_EnabledLogicalElement", "RequestedState", "The state that was last asked for.", REQUESTED_STATES},
    {"CIM_EnabledLogicalElement", "EnabledDefault", "The state after a start.",
     "2=Enabled;3=Disabled;5=Not Applicable;6=Enabled but Offline;7=No Default;9=Quiesce;..=DMTF Reserved;"
     "32768..65535=Vendor Reserved"},
    {"CIM_EnabledLogicalElement", "TransitioningToState", "The state that the element is on its way to.",
     REQUESTED_STATES},
    {"CIM_Job", "LocalOrUtcTime", "Whether the times of the job are local times.", "1=Local Time;2=UTC Time"},
    {"CIM_Job", "RecoveryAction", "What to do when the job fails.",
     "0=Unknown;1=Other;2=Do Not Continue;3=Continue With Next Job;4=Re-run Job;5=Run Recovery Job"},
    {"CIM_ConcreteJob", "JobState", "The state of the job.",
     "2=New;3=Starting;4=Running;5=Suspended;6=Shutting Down;7=Completed;8=Terminated;9=Killed;10=Exception;"
     "11=Service;12=Query Pending;13..32767=DMTF Reserved;32768..65535=Vendor Reserved"},
    {"CIM_SoftwareInstallationService", "CheckSoftwareIdentity",
     "Says whether a software identity could be installed on a target.", INSTALL_RESULTS},
    {"CIM_SoftwareInstallationService", "CheckSoftwareIdentity.InstallCharacteristics",
     "What an installation would bring with it.",
     "2=Target automatic reset;3=System automatic reset;4=Separate target reset Required;"
     "5=Separate system reset Required;6=Manual Reboot Required;7=No Reboot Required;8=User Intervention "
     "Recommended;"
     "9=MAY be added to specified Collection;..=DMTF Reserved;0x7FFF..0xFFFF=Vendor Specific"},
    {"CIM_SoftwareInstallationService", "InstallFromSoftwareIdentity",
     "Starts a job that installs a software identity on a target.", INSTALL_RESULTS},
    {"CIM_SoftwareInstallationService", "InstallFromSoftwareIdentity.InstallOptions",
     "How to install; 5 (Update) has to be among them.", INSTALL_OPTIONS},
    {"CIM_SoftwareInstallationService", "InstallFromSoftwareIdentity.InstallOptionsValues",
     "Values for the options, at the same places."},
    {"CIM_SoftwareInstallationService", "InstallFromURI",
     "Starts a job that installs the image at a URI on a target.", INSTALL_RESULTS},
    {"CIM_SoftwareInstallationService", "InstallFromURI.InstallOptions",
     "How to install; 5 (Update) has to be among them. 32768 chooses image types.", INSTALL_OPTIONS},
    {"CIM_SoftwareInstallationService", "InstallFromURI.InstallOptionsValues",
     "Values for the options, at the same places; for 32768 the image types, joined by plus signs."},
    {"CIM_SoftwareInstallationServiceCapabilities", "SupportedAsynchronousActions",
     "Methods that start a job.", INSTALL_ACTIONS},
    {"CIM_SoftwareInstallationServiceCapabilities", "SupportedSynchronousActions",
     "Methods that do without a job.", INSTALL_ACTIONS},
    {"CIM_SoftwareInstallationServiceCapabilities", "SupportedInstallOptions",
     "Install options that are supported.", INSTALL_OPTIONS},
    {"CIM_SoftwareInstallationServiceCapabilities", "SupportedURISchemes", "URI schemes that are supported.",
     "2=data;3=file;4=ftp;5=http;6=https;7=nfs;8=tftp;..=DMTF Reserved;0x8000..0xFFFF=Vendor Specific"},
    {"CIM_SoftwareInstallationServiceCapabilities", "SupportedExtendedResourceTypes",
     "Package types that are supported.", EXTENDED_RESOURCE_TYPES},
    {"CIM_RegisteredSpecification", "RegisteredOrganization", "Who published the document.",
     "1=Other;2=DMTF;3=CompTIA;4=Consortium for Service Innovation;5=FAST;6=GGF;7=INTAP;8=itSMF;9=NAC;"
     "10=Northwest Energy Efficiency Alliance;11=SNIA;12=TM Forum;13=The Open "
     "Group;14=ANSI;15=IEEE;16=IETF;17=INCITS;"
     "18=ISO;19=W3C;20=OGF;..=DMTF Reserved"},
    {"CIM_RegisteredSpecification", "AdvertiseTypes", "How the profile is made known.",
     "1=Other;2=Not Advertised;3=SLP"},
    {"CIM_NetworkPort", "LinkTechnology", "The kind of link.",
     "0=Unknown;1=Other;2=Ethernet;3=IB;4=FC;5=FDDI;6=ATM;7=Token Ring;8=Frame Relay;9=Infrared;10=BlueTooth;"
     "11=Wireless LAN"},
    {"CIM_SoftwareIdentity", "Classifications", "What kinds of software it is.",
     "0=Unknown;1=Other;2=Driver;3=Configuration Software;4=Application "
     "Software;5=Instrumentation;6=Firmware/BIOS;"
     "7=Diagnostic Software;8=Operating System;9=Middleware;10=Firmware;11=BIOS/FCode;12=Support/Service "
     "Pack;"
     "13=Software Bundle;..=DMTF Reserved;0x8000..0xFFFF=Vendor Reserved"},
    {"CIM_SoftwareIdentity", "ExtendedResourceType", "The package type.", EXTENDED_RESOURCE_TYPES},
    {"CIM_RemoteServiceAccessPoint", "InfoFormat", "How the access information is written.",
     "1=Other;2=Host Name;3=IPv4 Address;4=IPv6 Address;5=IPX Address;6=DECnet Address;7=SNA Address;"
     "8=Autonomous System Number;9=MPLS Label;100=IPv4 Network Address;200=URL;201=FQDN;..=DMTF Reserved;"
     "32768..65535=Vendor Reserved"},
    {"CIM_SoftwareIdentityResource", "ResourceType", "The kind of resource.",
     "0=Unknown;1=Other;2=Installer and Payload;3=Installer;4=Payload;5=Installability checker;6=Security "
     "Advisory;"
     "7=Engineering Advisory;9=Technical release notes;10=Change notification;11=Whitepaper;"
     "12=Marketing Documentation;..=DMTF Reserved;0x8000..0xFFFF=Vendor Reserved"},
    {"CIM_SoftwareIdentityResource", "ExtendedResourceType", "The package type.", EXTENDED_RESOURCE_TYPES},
};

std::vector<ValueMeaning> splitValues(std::string_view text) {
    std::vector<ValueMeaning> values;
    while (!text.empty()) {
        const std::string_view one = text.substr(0, text.find(';'));
        text.remove_prefix(std::min(text.size(), one.size() + 1));
        const std::size_t equals = one.find('=');
        values.push_back({one.substr(0, equals), one.substr(equals + 1)});
    }
    return values;
}

SchemaQualifiers find(std::span<const Row> rows, std::string_view className, std::string_view element) {
    const auto row = std::find_if(rows.begin(), rows.end(), [&](const Row& one) {
        return sameName(one.className, className) && sameName(one.element, element);
    });
    if (row == rows.end()) return {};
    return {row->description, splitValues(row->values)};
}

}  // namespace

SchemaQualifiers classQualifiers(std::string_view className) {
    return find(CLASSES, className, "");
}

SchemaQualifiers elementQualifiers(std::string_view className, std::string_view element) {
    return find(ELEMENTS, className, element);
}

}  // namespace core
