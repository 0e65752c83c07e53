// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Quenx_EthernetPortRegisteredProfile.h"

#include "Providers/RegisteredProfile.h"

void Quenx_EthernetPortRegisteredProfile::refresh() {
    // The version is that of DSP1014.
    registerProfile(*this, kEthernetPortProfile, "Ethernet Port", "1.0.1",
                    "Ethernet Port Profile for Tarvel(R) Ethernet Adapters");
}

Quenx_EthernetPortRegisteredProfileClass::Quenx_EthernetPortRegisteredProfileClass()
    : SingletonClass("RegisteredProfile::getInstances", __FILE__, __LINE__) {}
