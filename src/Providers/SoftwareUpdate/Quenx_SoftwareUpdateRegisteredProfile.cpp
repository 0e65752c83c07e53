// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_SoftwareUpdateRegisteredProfile.h"

#include "Providers/RegisteredProfile.h"

void Quenx_SoftwareUpdateRegisteredProfile::refresh() {
    registerProfile(*this, kSoftwareUpdateProfile, "Software Update", "1.0.0",
                    "Software Update Profile for Tarvel(R) Ethernet Adapters");
}

Quenx_SoftwareUpdateRegisteredProfileClass::Quenx_SoftwareUpdateRegisteredProfileClass()
    : SingletonClass("RegisteredProfile::getInstances", __FILE__, __LINE__) {}
