#include "Providers/Schema/CIM_Dependency.h"

constinit const core::CimClassInfo CIM_Dependency::classInfo{
    "CIM_Dependency", nullptr, true, {}, &core::makeSample<CIM_Dependency>};

CIM_Dependency::CIM_Dependency() {
    Antecedent.setKey();
    Dependent.setKey();
    declareClass(classInfo);
}

CIM_Dependency::~CIM_Dependency() = default;
