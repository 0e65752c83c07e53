// SPDX-License-Identifier: Apache-2.0
#include "CIM_OperatingSystem.h"

#include "Framework/Model/CimClassInfo.h"

namespace {

// What a client reads as the qualifier Description.
constexpr core::CimElementText kTexts[] = {
    {"", "The software that runs a computer."},
    {"OSType", "The kind of system; 36 is LINUX."},
    {"LastBootUpTime", "When it was started."},
    {"NumberOfProcesses", "How many processes run now."},
    {"TotalVisibleMemorySize", "Its memory, in kilobytes."},
    {"FreePhysicalMemory", "Memory that nobody uses now, in kilobytes."},
};

}  // namespace

// Constant-initialised: another library's static initialiser may ask for it before ours have run.
constinit const core::CimClassInfo CIM_OperatingSystem::classInfo{"CIM_OperatingSystem",
                                                                  &CIM_EnabledLogicalElement::classInfo,
                                                                  false,
                                                                  {},
                                                                  &core::makeSample<CIM_OperatingSystem>,
                                                                  kTexts};

CIM_OperatingSystem::CIM_OperatingSystem() {
    for (core::CimPropertyString* key : {&CSCreationClassName, &CSName, &CreationClassName, &Name})
        key->setKey();
    declareClass(classInfo);
}

CIM_OperatingSystem::~CIM_OperatingSystem() = default;
