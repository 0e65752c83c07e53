// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Framework/Requests/CimRequests.h"
#include "Framework/Requests/NotedCall.h"
#include "Providers/SoftwareUpdate/HookedBackend.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Providers/SoftwareUpdate/SoftwareUpdateAgent.h"
#include "Support/ProviderLibrary.h"
#include "Support/SimulatedAdapters.h"
#include "Support/SyslogCapture.h"
#include "Utils/Os/Linux/LinuxOSLocker.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

namespace test {

/// What a call of a method came to.
struct CallResult {
    unsigned int returnValue = 0;
    std::string error;  ///< the text of the CIM error; the return value means nothing then
    std::optional<core::CimPath> job;
    std::string characteristics;
    core::ReasonId reason = core::ReasonId::None;  ///< as it was noted on the way
};

/// The provider as a host has it, on simulated adapters: a configuration, the adapter locker, the inventory
/// loaded and an agent in this process, the log at the debug level; and a client of it, which any thread may
/// use.
class UpdateTest : public ::testing::Test {
  protected:
    UpdateTest();
    ~UpdateTest() override;

    /// "Quenx_EthernetPort" or another class, by its Name.
    core::CimPath pathNamed(const std::string& className, const std::string& name) const;
    core::CimPath port(const std::string& adapter) const { return pathNamed("Quenx_EthernetPort", adapter); }
    core::CimPath service() const {
        return m_requests.enumerateInstanceNames("Quenx_SoftwareInstallationService").at(0);
    }

    /// Arguments of the methods, from "Name=value; Name=value". The elements of an array are joined by
    /// commas; the word null stands for no value.
    static std::vector<core::Argument> argumentsOf(const std::string& text);
    CallResult call(const std::string& method, const std::string& arguments) const;
    /// InstallFromURI with options, on an instance or on the port of an adapter.
    CallResult install(const std::string& uri, const core::CimPath& target, const std::string& options = "5",
                       const std::string& values = "") const;
    CallResult install(const std::string& uri, const char* adapter) const {
        return install(uri, port(adapter));
    }

    /// Follows the job to its end.
    core::InstanceValue waitForEnd(const core::CimPath& job) const;

    static std::uint64_t state(const core::InstanceValue& job) { return job.number("JobState"); }
    /// A property as text, an array's elements joined by commas; empty when it is null or not there.
    static std::string text(const core::InstanceValue& instance, const char* property);
    /// The properties' texts, separated by "; ".
    static std::string row(const core::InstanceValue& instance, const std::vector<const char*>& properties);
    /// The row of each instance of the class.
    std::vector<std::string> table(const std::string& className,
                                   const std::vector<const char*>& properties) const;

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
    /// Has no state of its own.
    mutable core::CimRequests m_requests{"root/cimv2"};
};

}  // namespace test
