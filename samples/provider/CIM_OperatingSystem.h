// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Framework/Model/CimProperty.h"
#include "Providers/Schema/CIM_EnabledLogicalElement.h"

/// DMTF CIM_OperatingSystem: the software that runs a computer. Of its properties those that are served here.
class CIM_OperatingSystem : public CIM_EnabledLogicalElement {
  public:
    static const core::CimClassInfo classInfo;

    CIM_OperatingSystem();
    ~CIM_OperatingSystem() override;

    core::CimPropertyString CSCreationClassName{"CSCreationClassName", this};
    core::CimPropertyString CSName{"CSName", this};
    core::CimPropertyString CreationClassName{"CreationClassName", this};
    core::CimPropertyString Name{"Name", this};
    core::CimPropertyUint16 OSType{"OSType", this};
    core::CimPropertyString Version{"Version", this};
    core::CimPropertyDatetime LastBootUpTime{"LastBootUpTime", this};
    core::CimPropertyUint32 NumberOfProcesses{"NumberOfProcesses", this};
    core::CimPropertyUint64 TotalVisibleMemorySize{"TotalVisibleMemorySize", this};
    core::CimPropertyUint64 FreePhysicalMemory{"FreePhysicalMemory", this};
};
