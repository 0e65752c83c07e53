#include "Providers/Schema/CIM_LogicalPort.h"

constinit const core::CimClassInfo CIM_LogicalPort::classInfo{
    "CIM_LogicalPort", &CIM_LogicalDevice::classInfo, false, {}, &core::makeSample<CIM_LogicalPort>};

CIM_LogicalPort::CIM_LogicalPort() {
    declareClass(classInfo);
}

CIM_LogicalPort::~CIM_LogicalPort() = default;
