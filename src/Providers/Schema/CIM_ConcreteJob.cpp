#include "Providers/Schema/CIM_ConcreteJob.h"

constinit const core::CimClassInfo CIM_ConcreteJob::classInfo{
    "CIM_ConcreteJob", &CIM_Job::classInfo, false, {}, &core::makeSample<CIM_ConcreteJob>};

CIM_ConcreteJob::CIM_ConcreteJob() {
    InstanceID.setKey();
    declareClass(classInfo);
}

CIM_ConcreteJob::~CIM_ConcreteJob() = default;
