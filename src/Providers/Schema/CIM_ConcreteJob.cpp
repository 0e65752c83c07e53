// SPDX-License-Identifier: Apache-2.0
#include "Providers/Schema/CIM_ConcreteJob.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

constexpr core::CimElementText kTexts[] = {
    {"", "A job that is run and can be followed."},
    {"JobState", "The state of the job.",
     "2=New;3=Starting;4=Running;5=Suspended;6=Shutting "
     "Down;7=Completed;8=Terminated;9=Killed;10=Exception;11=Service;12=Query Pending;13..32767=DMTF "
     "Reserved;32768..65535=Vendor Reserved"},
};

}  // namespace

constinit const core::CimClassInfo CIM_ConcreteJob::classInfo{
    "CIM_ConcreteJob", &CIM_Job::classInfo, false, {}, &core::makeSample<CIM_ConcreteJob>, kTexts};

CIM_ConcreteJob::CIM_ConcreteJob() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_ConcreteJob::~CIM_ConcreteJob() = default;
