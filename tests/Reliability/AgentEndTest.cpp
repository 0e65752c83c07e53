// The agent goes while it has jobs that were never started, that run and that have ended.
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"

namespace {

using AgentEndTest = test::UpdateTest;

TEST_F(AgentEndTest, FreesJobsInEveryState) {
    waitForEnd(*install(goodImage(), "eth0").job);
    auto& registry = *static_cast<Quenx_ConcreteJobClass*>(
        utils::Singleton<ConcreteJobFactory>::getInstance()->getCimClass());
    std::string uri = goodImage();
    std::vector<unsigned short> options = {5};
    std::vector<std::string> values;
    registry.addJob(new Quenx_ConcreteJob("eth0", 77, uri, options, values));
    EXPECT_EQ(claim(), "eth0");
    Quenx_ConcreteJob::m_servicedAdapter = std::string();
    std::atomic<bool> written{false};
    m_backend->hook = [&written](const std::string& operation, const std::string&) {
        if (operation == "writeFlashImage") utils::Thread::msleep(100);
        if (operation == "updateCapabilityWord") written = true;
    };
    EXPECT_EQ(install(goodImage(), "eth1").returnValue, 4096U);
    const auto jobs = m_requests.enumerateInstances("Quenx_ConcreteJob");
    ASSERT_EQ(jobs.size(), 3U);
    EXPECT_EQ(state(jobs[0]), JobStateCompleted);
    EXPECT_EQ(state(jobs[1]), JobStateNew);
    EXPECT_FALSE(hasEnded(jobs[2]));
    m_agent.reset();
    EXPECT_TRUE(written);
    EXPECT_EQ(claim(), "");
    EXPECT_EQ(test::SyslogCapture::count("Destroying JobThread") -
                  test::SyslogCapture::count(", waiting for terminate"),
              3U);
    EXPECT_THROW(m_requests.enumerateInstances("Quenx_ConcreteJob"), core::CimError);
}

}  // namespace
