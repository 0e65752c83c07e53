// SPDX-License-Identifier: Apache-2.0
// What else a host and its machine may do to an update.
#include <thread>

#include "Framework/Classes/InstanceList.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Interposed.h"

namespace {

class OddHostTest : public test::UpdateTest {};

TEST_F(OddHostTest, SetsTheClockBackWhileAnUpdateRuns) {
    for (const bool fails : {false, true}) {
        const std::uint64_t begin = os::getMonotonicuSeconds();
        const auto millisecondsOf = [](const core::InstanceValue& job) {
            return core::parseDatetime(text(job, "ElapsedTime"))->getMiliseconds();
        };
        if (fails) m_adapters->injectFault("eth0", {.at = ma::Operation::Write});
        m_backend->hold("writeFlashImage");
        const test::CallResult result = install(goodImage(), "eth0");
        ASSERT_TRUE(result.job);
        m_backend->waitUntilHeld();
        test::clockOffset = -3600;
        const std::uint64_t verification = millisecondsOf(m_requests.getInstance(*result.job));
        utils::Thread::msleep(20);
        m_backend->letGo();
        const std::uint64_t elapsed = millisecondsOf(waitForEnd(*result.job));
        test::clockOffset = 0;
        EXPECT_LE(elapsed, (os::getMonotonicuSeconds() - begin) / 1000);
        EXPECT_TRUE(fails ? elapsed == verification : elapsed >= verification + 20) << elapsed;
    }
}

TEST_F(OddHostTest, RefusesThreadsToJobsThatAreThenWaitedForTogether) {
    std::string image = goodImage();
    std::vector<std::uint16_t> options{5};
    std::vector<std::string> values;
    core::drainReaper([] {});  // which leaves no thread that frees jobs
    test::refusesThreads = true;
    for (int i = 0; i < 4; ++i)
        EXPECT_EQ(install(image, "eth0").returnValue, 4U);
    EXPECT_EQ(m_log.count("Creation of new job returns: 106"), 4U);
    EXPECT_TRUE(m_requests.enumerateInstanceNames("Quenx_ConcreteJob").empty());
    {
        core::InstanceList list;
        auto* const job = new Quenx_ConcreteJob("eth0", 5, image, options, values);
        list.add(job);
        EXPECT_EQ(job->requestStateChange(RequestedStateStart, utils::Time()), 4U);
        EXPECT_EQ(job->getJobState(), JobStateException);
    }
    test::refusesThreads = false;
    // Their destructors, which wait, are left to whoever has to wait anyway.
    EXPECT_EQ(m_log.count("Destroying JobThread"), 0U);
    const auto begin = std::chrono::steady_clock::now();
    core::drainReaper([] {});
    // Three seconds, and not fifteen.
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(12));
    EXPECT_EQ(m_log.count("waiting for terminate"), 5U);
    expectUpdateWorks();
}

TEST_F(OddHostTest, CancelsAThreadThatIsInACall) {
    const std::string image = goodImage();
    m_backend->hold("prepareFlashImage");
    std::thread caller([&] {
        install(image, "eth0");
        pthread_testcancel();
        ADD_FAILURE() << "goes on although it was cancelled";
    });
    m_backend->waitUntilHeld();
    ASSERT_EQ(pthread_cancel(caller.native_handle()), 0);
    m_backend->letGo();
    caller.join();
    EXPECT_EQ(m_requests.enumerateInstanceNames("Quenx_ConcreteJob").size(), 1U);
    deleteJobs();
    expectUpdateWorks();
}

TEST_F(OddHostTest, HasNoMemoryWhileTheConfigurationIsReadAndSaysSo) {
    const std::string path = m_folder.write("ban.conf", "# a line\nOEMCustomizeable=5\n");
    bool struck = true;
    std::uint64_t n = 1;
    for (; struck; ++n) {
        utils::SMASHv2Config config(path);
        test::SyslogCapture::clear();
        const test::AllocationFailure failure(test::AllocationFailure::On::ThisThread, n);
        const bool isEnabled = config.isDowngradeEnabled();
        struck = failure.hasStruck();
        EXPECT_TRUE(!isEnabled || test::SyslogCapture::contains(
                                      " Reading configuration values from the config file - failed"))
            << "allocation " << n;
    }
    EXPECT_GT(n, 3U);
}

}  // namespace
