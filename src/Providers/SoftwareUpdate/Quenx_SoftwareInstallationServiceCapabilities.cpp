// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationServiceCapabilities.h"

#include "Providers/Schema/ValueMaps.h"
#include "Providers/SoftwareUpdate/Quenx_SoftwareInstallationService.h"
#include "Utils/Utils.h"

namespace {

// Values of the DMTF value maps of CIM_SoftwareInstallationServiceCapabilities.
constexpr std::uint16_t kInstallFromSoftwareIdentity = 3;
constexpr std::uint16_t kInstallFromUri = 5;
constexpr std::uint16_t kNoSynchronousAction = 2;
constexpr std::uint16_t kNoExtendedResourceType = 2;
constexpr std::uint16_t kFileScheme = 3;

}  // namespace

std::string Quenx_SoftwareInstallationServiceCapabilities::getUniqId() {
    return fmt("Capabilities@%s", Quenx_SoftwareInstallationService::getUniqId().c_str());
}

void Quenx_SoftwareInstallationServiceCapabilities::refresh() {
    const core::RecursiveLocker lock(getMutex());
    Caption = "Capabilities for Ethernet Firmware Update";
    Description = "Capabilities for Firmware Update Service for Tarvel(R) Ethernet Adapters";
    ElementName = Caption;
    InstanceID = fmt("Quenx:%s", getUniqId().c_str());

    SupportedAsynchronousActions = {kInstallFromUri, kInstallFromSoftwareIdentity};
    SupportedSynchronousActions = {kNoSynchronousAction};
    SupportedTargetTypes.setNull();
    for (std::size_t i = 1; i < TargetTypesDescription.size(); ++i) {
        SupportedTargetTypes.push_back(TargetTypesDescription[i]);
    }
    SupportedExtendedResourceTypes = {kNoExtendedResourceType};
    CanAddToCollection = false;
    SupportedInstallOptions = {InstallOption::ForceInstallation, InstallOption::Update,
                               InstallOption::TargetTypes};
    setNull(Generation, OtherSupportedExtendedResourceTypeDescriptions,
            SupportedExtendedResourceTypesMajorVersions, SupportedExtendedResourceTypesMinorVersions,
            SupportedExtendedResourceTypesRevisionNumbers, SupportedExtendedResourceTypesBuildNumbers);
    SupportedURISchemes = {kFileScheme};
}

// The label is the service's: the two classes have always been timed under one name.
Quenx_SoftwareInstallationServiceCapabilitiesClass::Quenx_SoftwareInstallationServiceCapabilitiesClass()
    : SingletonClass("SoftwareInstallationService::getInstances", __FILE__, __LINE__) {}
