#include "Providers/Schema/CIM_NetworkPort.h"

constinit const core::CimClassInfo CIM_NetworkPort::classInfo{
    "CIM_NetworkPort", &CIM_LogicalPort::classInfo, false, {}, &core::makeSample<CIM_NetworkPort>};

CIM_NetworkPort::CIM_NetworkPort() {
    declareClass(classInfo);
}

CIM_NetworkPort::~CIM_NetworkPort() = default;
