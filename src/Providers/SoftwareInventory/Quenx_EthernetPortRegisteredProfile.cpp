// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Quenx_EthernetPortRegisteredProfile.h"

constinit const core::CimClassInfo Quenx_EthernetPortRegisteredProfile::classInfo{
    "Quenx_RegisteredProfile", &CIM_RegisteredProfile::classInfo, false, {}, nullptr};

Quenx_EthernetPortRegisteredProfile::Quenx_EthernetPortRegisteredProfile() {
    declareClass(classInfo);
}

Quenx_EthernetPortRegisteredProfile::~Quenx_EthernetPortRegisteredProfile() = default;

std::string Quenx_EthernetPortRegisteredProfile::getClassName() const {
    return classInfo.name;
}

std::string Quenx_EthernetPortRegisteredProfile::getUniqId() const {
    return "EthernetPort";
}

void Quenx_EthernetPortRegisteredProfile::refresh() {
    const core::RecursiveLocker lock(getMutex());
    InstanceID = "Quenx:" + getUniqId();
    SpecificationType = 2;       // profile
    RegisteredOrganization = 2;  // DMTF
    OtherRegisteredOrganization.setNull();
    RegisteredName = "Ethernet Port";
    RegisteredVersion = "1.0.1";                     // of DSP1014
    AdvertiseTypes = std::vector<std::uint16_t>{1};  // other
    AdvertiseTypeDescriptions = std::vector<std::string>{"WS-Identify"};
    Caption = RegisteredName;
    Description = "Ethernet Port Profile for Tarvel(R) Ethernet Adapters";
    ElementName.setNull();
}

Quenx_EthernetPortRegisteredProfileClass::Quenx_EthernetPortRegisteredProfileClass()
    : SingletonClass("RegisteredProfile::getInstances", __FILE__, __LINE__) {}
