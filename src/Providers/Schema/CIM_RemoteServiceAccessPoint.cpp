// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_RemoteServiceAccessPoint.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A way to reach a service elsewhere."},
    {"InfoFormat", "How the access information is written.",
     "1=Other;2=Host Name;3=IPv4 Address;4=IPv6 Address;5=IPX Address;6=DECnet Address;7=SNA "
     "Address;8=Autonomous System Number;9=MPLS Label;100=IPv4 Network Address;200=URL;201=FQDN;..=DMTF "
     "Reserved;32768..65535=Vendor Reserved"},
};

}  // namespace

constinit const core::CimClassInfo CIM_RemoteServiceAccessPoint::classInfo{
    "CIM_RemoteServiceAccessPoint",
    &CIM_ServiceAccessPoint::classInfo,
    false,
    {},
    &core::makeSample<CIM_RemoteServiceAccessPoint>,
    kTexts};

CIM_RemoteServiceAccessPoint::CIM_RemoteServiceAccessPoint() {
    declareClass(classInfo);
}

CIM_RemoteServiceAccessPoint::~CIM_RemoteServiceAccessPoint() = default;
