// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_PortController.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A controller of ports, such as a network card."},
};

}  // namespace

constinit const core::CimClassInfo CIM_PortController::classInfo{"CIM_PortController",
                                                                 &CIM_Controller::classInfo,
                                                                 false,
                                                                 {},
                                                                 &core::makeSample<CIM_PortController>,
                                                                 kTexts};

CIM_PortController::CIM_PortController() {
    declareClass(classInfo);
}

CIM_PortController::~CIM_PortController() = default;
