// The property values of the service instance.
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationService.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace {

constexpr unsigned short kOperationalStatusOk = 2;

}  // namespace

void Quenx_SoftwareInstallationService::refresh() {
    const std::string hostname = os::getHostname();
    const core::RecursiveLocker lock(getMutex());
    Caption = "Ethernet Firmware Update";
    Description = "Firmware Update Service for Tarvel(R) Ethernet Adapters";
    // ElementName stays null although Caption is set (intended).
    for (core::CimProperty* unknown : std::initializer_list<core::CimProperty*>{&ElementName,
                                                                                &InstanceID,
                                                                                &Generation,
                                                                                &InstallDate,
                                                                                &StatusDescriptions,
                                                                                &Status,
                                                                                &HealthState,
                                                                                &PrimaryStatus,
                                                                                &DetailedStatus,
                                                                                &OperatingStatus,
                                                                                &CommunicationStatus,
                                                                                &EnabledState,
                                                                                &OtherEnabledState,
                                                                                &RequestedState,
                                                                                &EnabledDefault,
                                                                                &TimeOfLastStateChange,
                                                                                &AvailableRequestedStates,
                                                                                &TransitioningToState,
                                                                                &StartMode,
                                                                                &Started}) {
        unknown->setNull();
    }
    OperationalStatus.clear();
    OperationalStatus.push_back(kOperationalStatusOk);
    SystemCreationClassName = getCreationClassName();
    SystemName = hostname;
    CreationClassName = getClassName();
    Name = fmt("Quenx:%s", getUniqId().c_str());
    PrimaryOwnerName = "Tarvel Corporation";
    PrimaryOwnerContact = "https://www.tarvel.example";
}
