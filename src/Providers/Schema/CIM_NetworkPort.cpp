// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_NetworkPort.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A port for network communication."},
    {"LinkTechnology", "The kind of link.",
     "0=Unknown;1=Other;2=Ethernet;3=IB;4=FC;5=FDDI;6=ATM;7=Token Ring;8=Frame "
     "Relay;9=Infrared;10=BlueTooth;11=Wireless LAN"},
};

}  // namespace

constinit const core::CimClassInfo CIM_NetworkPort::classInfo{
    "CIM_NetworkPort", &CIM_LogicalPort::classInfo, false, {}, &core::makeSample<CIM_NetworkPort>, kTexts};

CIM_NetworkPort::CIM_NetworkPort() {
    declareClass(classInfo);
}

CIM_NetworkPort::~CIM_NetworkPort() = default;
