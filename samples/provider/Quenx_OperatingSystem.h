// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "CIM_OperatingSystem.h"
#include "Framework/Model/CimPropertyList.h"
#include "Providers/ClassObjects.h"

/// The system that this process runs on.
class Quenx_OperatingSystem final : public CIM_OperatingSystem {
  public:
    static const core::CimClassInfo classInfo;

    explicit Quenx_OperatingSystem(const std::string& host);
    std::string getClassName() const override { return classInfo.name; }

    /// Sets every value that can change. Called at each look, by any thread.
    void refresh();

  private:
    /// uint32 CountProcesses([IN] string Program, [OUT] uint32 Count)
    unsigned int countProcesses(core::CimPropertyList& in, core::CimPropertyList& out,
                                core::CimInstance*& result);
};

/// Serves the one instance, which stays the same object as long as the machine keeps its name.
class Quenx_OperatingSystemClass : public CachedClass<Quenx_OperatingSystem, std::string> {
  public:
    core::InstanceList::Iterator getInstances() override;
    /// A request for one instance comes here, where getInstances() would build or refresh them all.
    core::CimInstance* findInstance(const core::CimPath& path);
};
