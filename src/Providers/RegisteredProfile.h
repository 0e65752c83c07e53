// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/Schema/CIM_RegisteredProfile.h"

// How providers register the DMTF profiles that they implement (DSP1033). All serve them as
// "Quenx_RegisteredProfile", and tell them apart by InstanceID.

inline constexpr const char* kSoftwareUpdateProfile = "Quenx:SoftwareUpdate";
inline constexpr const char* kEthernetPortProfile = "Quenx:EthernetPort";

/// Sets the values of a profile. The name of the profile is its caption, too.
inline void registerProfile(CIM_RegisteredProfile& profile, const char* instanceId, const char* name,
                            const char* version, const char* description) {
    // Values of the DMTF value maps of CIM_RegisteredProfile.
    constexpr std::uint16_t kSpecificationType = 2;
    constexpr std::uint16_t kOrganizationDmtf = 2;
    constexpr std::uint16_t kAdvertiseOther = 1;

    const core::RecursiveLocker lock(profile.getMutex());
    profile.InstanceID = instanceId;
    profile.SpecificationType = kSpecificationType;
    profile.RegisteredOrganization = kOrganizationDmtf;
    profile.OtherRegisteredOrganization.setNull();
    profile.RegisteredName = name;
    profile.RegisteredVersion = version;
    profile.AdvertiseTypes = {kAdvertiseOther};
    profile.AdvertiseTypeDescriptions = std::vector<std::string>{"WS-Identify"};
    profile.Caption = name;
    profile.Description = description;
    profile.ElementName.setNull();
}
