// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_Job.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A unit of work for a system."},
    {"LocalOrUtcTime", "Whether the times of the job are local times.", "1=Local Time;2=UTC Time"},
    {"RecoveryAction", "What to do when the job fails.",
     "0=Unknown;1=Other;2=Do Not Continue;3=Continue With Next Job;4=Re-run Job;5=Run Recovery Job"},
};

}  // namespace

constinit const core::CimClassInfo CIM_Job::classInfo{"CIM_Job", &CIM_LogicalElement::classInfo, false,
                                                      {},        &core::makeSample<CIM_Job>,     kTexts};

CIM_Job::CIM_Job() {
    declareClass(classInfo);
}

CIM_Job::~CIM_Job() = default;
