// SPDX-License-Identifier: Apache-2.0
// What else a host and its machine may do to an update.
#include "Framework/Classes/InstanceList.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Interposed.h"

namespace {

class OddHostTest : public test::UpdateTest {};

TEST_F(OddHostTest, SetsTheClockBackWhileAnUpdateRuns) {
    m_backend->hook = [](const std::string& called, const std::string&) {
        if (called == "writeFlashImage") test::clockOffset = -3600;
    };
    const test::CallResult result = install(goodImage(), "eth0");
    ASSERT_TRUE(result.job);
    const std::string elapsed = text(waitForEnd(*result.job), "ElapsedTime");
    test::clockOffset = 0;
    EXPECT_TRUE(elapsed.starts_with("0000000000")) << elapsed;
}

TEST_F(OddHostTest, RefusesThreadsToJobsThatAreThenWaitedForTogether) {
    const std::string image = goodImage();
    test::refusesThreads = true;
    for (int i = 0; i < 5; ++i)
        EXPECT_EQ(install(image, "eth0").returnValue, 4U);
    test::refusesThreads = false;
    const auto begin = std::chrono::steady_clock::now();
    core::drainReaper([] {});
    // Three seconds, and not fifteen.
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(12));
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
