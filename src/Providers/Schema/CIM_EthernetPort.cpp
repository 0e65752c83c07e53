#include "Providers/Schema/CIM_EthernetPort.h"

constinit const core::CimClassInfo CIM_EthernetPort::classInfo{
    "CIM_EthernetPort", &CIM_NetworkPort::classInfo, false, {}, &core::makeSample<CIM_EthernetPort>};

CIM_EthernetPort::CIM_EthernetPort() {
    declareClass(classInfo);
}

CIM_EthernetPort::~CIM_EthernetPort() = default;
