// SPDX-License-Identifier: Apache-2.0
#include <sys/utsname.h>

#include <ctime>
#include <fstream>

#include "Framework/Requests/CimRequests.h"
#include "Support/ProviderLibrary.h"

namespace {

constexpr const char* kClass = "Quenx_OperatingSystem";

/// The sample provider, loaded as a host does it, and the requests that a front makes.
class OperatingSystemTest : public testing::Test {
  protected:
    core::MethodResult count(const core::CimValue& program) {
        const core::CimPath path = m_requests.enumerateInstanceNames(kClass).at(0);
        return m_requests.invokeMethod(path, "CountProcesses", {{"Program", program}});
    }
    static core::CimValue text(const std::string& value) {
        return core::CimValue::of(core::CimType::String, value);
    }

    test::ProviderLibrary m_library{QUENX_SAMPLE_PROVIDER};
    core::CimRequests m_requests{"root/cimv2"};
};

TEST_F(OperatingSystemTest, ServesWhatTheSystemItselfSays) {
    utsname names{};
    uname(&names);
    const auto instances = m_requests.enumerateInstances("CIM_ManagedElement");
    ASSERT_EQ(instances.size(), 1U);
    const core::InstanceValue instance = m_requests.getInstance(instances.front().path);
    EXPECT_EQ(instance.text("Name"), names.nodename);
    EXPECT_EQ(instance.text("Version"), names.release);
    EXPECT_GT(instance.number("NumberOfProcesses"), 0U);
    EXPECT_GT(instance.number("TotalVisibleMemorySize"), instance.number("FreePhysicalMemory"));
    const auto started = instance.get<utils::Time>("LastBootUpTime");
    ASSERT_TRUE(started.has_value() && !started->isPeriod());
    EXPECT_LE(started->getSeconds(), static_cast<std::uint64_t>(std::time(nullptr)));
    EXPECT_EQ(m_requests.enumerateInstanceNames(kClass).at(0).toString(), instance.path.toString());
}

TEST_F(OperatingSystemTest, CountsTheProcessesOfAProgram) {
    std::string own;
    std::getline(std::ifstream("/proc/self/comm"), own);
    const core::MethodResult found = count(text(own));
    EXPECT_EQ(found.returnValue, 0U);
    ASSERT_EQ(found.outputs.size(), 1U);
    EXPECT_GE(std::stoi(core::valueText(found.outputs.front().value)), 1);
    EXPECT_EQ(core::valueText(count(text("no such program here")).outputs.at(0).value), "0");
    EXPECT_EQ(count(text("")).returnValue, 5U);
    EXPECT_EQ(count(core::CimValue::null(core::CimType::String)).returnValue, 5U);
}

}  // namespace
