// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_SoftwareIdentityResource.h"

#include "Framework/Model/CimClassInfo.h"
#include "Providers/Schema/ValueMapTexts.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "Where the file of a software identity is."},
    {"ResourceType", "The kind of resource.",
     "0=Unknown;1=Other;2=Installer and Payload;3=Installer;4=Payload;5=Installability checker;6=Security "
     "Advisory;7=Engineering Advisory;9=Technical release notes;10=Change "
     "notification;11=Whitepaper;12=Marketing Documentation;..=DMTF Reserved;0x8000..0xFFFF=Vendor Reserved"},
    {"ExtendedResourceType", "The package type.", schema::kExtendedResourceTypes},
};

}  // namespace

constinit const core::CimClassInfo CIM_SoftwareIdentityResource::classInfo{
    "CIM_SoftwareIdentityResource",
    &CIM_RemoteServiceAccessPoint::classInfo,
    false,
    {},
    &core::makeSample<CIM_SoftwareIdentityResource>,
    kTexts};

CIM_SoftwareIdentityResource::CIM_SoftwareIdentityResource() {
    declareClass(classInfo);
}

CIM_SoftwareIdentityResource::~CIM_SoftwareIdentityResource() = default;
