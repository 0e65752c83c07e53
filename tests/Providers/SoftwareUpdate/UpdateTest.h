// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Providers/SoftwareUpdate/HookedBackend.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"
#include "Providers/SoftwareUpdate/UpdateClient.h"
#include "Support/ProviderLibrary.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Utils/Os/Linux/LinuxOSLocker.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

namespace test {

/// The provider as a host has it, on simulated adapters: a configuration, the adapter locker, the inventory
/// loaded and an agent in this process, the log at the debug level.
class UpdateTest : public ::testing::Test, public UpdateClient {
  protected:
    UpdateTest();
    ~UpdateTest() override;

    /// Installs an image that suits eth0, and expects state 7.
    void expectUpdateWorks() const;
    /// Deletes all jobs, each at its end, and waits until none is left in memory.
    void deleteJobs() const;

    /// Writes a file and gives its URI.
    std::string file(const std::string& name, const std::vector<std::uint8_t>& content) const;
    /// A small image with the types and revisions of eth0.
    std::string goodImage() const;

    static std::string claim() { return Quenx_ConcreteJob::m_servicedAdapter.get(); }
    static void setClaim(const std::string& adapter) { Quenx_ConcreteJob::m_servicedAdapter = adapter; }

    TempFolder m_folder;
    utils::SMASHv2Config m_config;
    std::optional<os::OSLockerLinux> m_locker;
    LogLevelGuard m_logLevel{2};
    SyslogCapture m_log;
    SimulatedAdapters m_adapters;
    std::shared_ptr<HookedBackend> m_backend;
    ProviderLibrary m_inventory;
    std::unique_ptr<core::SoftwareUpdateAgent> m_agent;
};

}  // namespace test
