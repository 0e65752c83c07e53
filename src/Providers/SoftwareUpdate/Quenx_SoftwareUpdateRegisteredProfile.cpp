// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateRegisteredProfile.h"

#include "Providers/SoftwareUpdate/AssociationEnds.h"

namespace {

// Values of the DMTF value maps of CIM_RegisteredProfile.
constexpr std::uint16_t kSpecificationType = 2;
constexpr std::uint16_t kOrganizationDmtf = 2;
constexpr std::uint16_t kAdvertiseOther = 1;

}  // namespace

constinit const core::CimClassInfo Quenx_SoftwareUpdateRegisteredProfile::classInfo{
    "Quenx_RegisteredProfile", &CIM_RegisteredProfile::classInfo, false, {}, nullptr};

Quenx_SoftwareUpdateRegisteredProfile::~Quenx_SoftwareUpdateRegisteredProfile() = default;

std::string Quenx_SoftwareUpdateRegisteredProfile::getClassName() const {
    return classInfo.name;
}

void Quenx_SoftwareUpdateRegisteredProfile::refresh() {
    const core::RecursiveLocker lock(getMutex());
    InstanceID = kSoftwareUpdateProfile;
    SpecificationType = kSpecificationType;
    RegisteredOrganization = kOrganizationDmtf;
    OtherRegisteredOrganization.setNull();
    RegisteredName = "Software Update";
    RegisteredVersion = "1.0.0";
    AdvertiseTypes = {kAdvertiseOther};
    AdvertiseTypeDescriptions = std::vector<std::string>{"WS-Identify"};
    Caption = RegisteredName;
    Description = "Software Update Profile for Tarvel(R) Ethernet Adapters";
    ElementName.setNull();
}

Quenx_SoftwareUpdateRegisteredProfileClass::Quenx_SoftwareUpdateRegisteredProfileClass()
    : SingletonClass("RegisteredProfile::getInstances", __FILE__, __LINE__) {}
