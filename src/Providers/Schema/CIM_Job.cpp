#include "Providers/Schema/CIM_Job.h"

constinit const core::CimClassInfo CIM_Job::classInfo{
    "CIM_Job", &CIM_LogicalElement::classInfo, false, {}, &core::makeSample<CIM_Job>};

CIM_Job::CIM_Job() {
    declareClass(classInfo);
}

CIM_Job::~CIM_Job() = default;
