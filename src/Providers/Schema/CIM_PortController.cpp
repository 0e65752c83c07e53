#include "Providers/Schema/CIM_PortController.h"

constinit const core::CimClassInfo CIM_PortController::classInfo{
    "CIM_PortController", &CIM_Controller::classInfo, false, {}, &core::makeSample<CIM_PortController>};

CIM_PortController::CIM_PortController() {
    declareClass(classInfo);
}

CIM_PortController::~CIM_PortController() = default;
