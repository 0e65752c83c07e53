// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_SoftwareIdentity.h"

#include "Framework/Model/CimClassInfo.h"
#include "Providers/Schema/ValueMapTexts.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A piece of software, installed or to be installed, and its version."},
    {"Classifications", "What kinds of software it is.",
     "0=Unknown;1=Other;2=Driver;3=Configuration Software;4=Application "
     "Software;5=Instrumentation;6=Firmware/BIOS;7=Diagnostic Software;8=Operating "
     "System;9=Middleware;10=Firmware;11=BIOS/FCode;12=Support/Service Pack;13=Software Bundle;..=DMTF "
     "Reserved;0x8000..0xFFFF=Vendor Reserved"},
    {"ExtendedResourceType", "The package type.", schema::kExtendedResourceTypes},
};

}  // namespace

constinit const core::CimClassInfo CIM_SoftwareIdentity::classInfo{"CIM_SoftwareIdentity",
                                                                   &CIM_LogicalElement::classInfo,
                                                                   false,
                                                                   {},
                                                                   &core::makeSample<CIM_SoftwareIdentity>,
                                                                   kTexts};

CIM_SoftwareIdentity::CIM_SoftwareIdentity() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_SoftwareIdentity::~CIM_SoftwareIdentity() = default;
