// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_EthernetPort.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A port to an Ethernet."},
};

}  // namespace

constinit const core::CimClassInfo CIM_EthernetPort::classInfo{
    "CIM_EthernetPort", &CIM_NetworkPort::classInfo, false, {}, &core::makeSample<CIM_EthernetPort>, kTexts};

CIM_EthernetPort::CIM_EthernetPort() {
    declareClass(classInfo);
}

CIM_EthernetPort::~CIM_EthernetPort() = default;
