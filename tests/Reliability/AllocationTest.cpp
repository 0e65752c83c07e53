// SPDX-License-Identifier: Apache-2.0
// Memory runs out at the n-th allocation of an update, for every n.
#include <thread>

#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Effort.h"
#include "Reliability/Interposed.h"
#include "Support/TestRoms.h"

namespace {

using On = test::AllocationFailure::On;

constexpr unsigned kJobStarted = 4096;
constexpr unsigned kInsufficientMemory = 4100;

class AllocationTest : public test::UpdateTest {
  protected:
    /// One update, with the n-th allocation failing. False when it was never reached.
    bool failAt(On on, std::uint64_t n, bool releases) {
        test::CallResult result;
        bool struck = false;
        {
            const test::AllocationFailure failure(on, n);
            try {
                result.returnValue =
                    m_requests.invokeMethod(m_service, "InstallFromURI", m_arguments).returnValue;
            } catch (const std::exception& error) {
                result.error = error.what();
            }
            // A worker that was started goes on, whatever its request came to.
            while (on == On::OtherThreads && !claim().empty())
                std::this_thread::yield();
            struck = failure.hasStruck();
        }
        deleteJobs();
        if (!claim().empty()) {
            // Kept by a failure that is no refusal, and by nothing else.
            EXPECT_FALSE(releases);
            EXPECT_EQ(claim(), "eth0");
            EXPECT_TRUE(result.returnValue == 2U || !result.error.empty()) << result.returnValue;
            setClaim("");
        }
        const std::string flash = test::describeRom(m_adapters->flashContent("eth0"));
        EXPECT_TRUE(flash == "IMG_PXE 2, IMG_UEFI 1" || flash == m_old) << flash;
        EXPECT_TRUE(struck || result.returnValue == kJobStarted) << result.error;
        m_isTold = m_isTold || result.returnValue == kInsufficientMemory;
        return struck;
    }
    void failEverywhere(On on, std::uint64_t step, bool releases) {
        // What is built once and kept, exists from here on.
        m_config.initialize();
        for (int i = 0; i < 2; ++i)
            failAt(on, 1U << 30, releases);
        const std::int64_t before = test::liveBytes();
        std::uint64_t n = 1;
        for (; failAt(on, n, releases); n += step)
            ASSERT_FALSE(HasFailure()) << "at allocation " << n;
        EXPECT_GT(n, on == On::ThisThread ? 200U : 20U);
        EXPECT_EQ(test::liveBytes(), before);
        test::count("allocations failed", (n - 1) / step);
        expectUpdateWorks();
    }

    bool m_isTold = false;  ///< by a return value, that memory ran out
    const std::string m_image = goodImage();
    const std::string m_old = test::describeRom(m_adapters->flashContent("eth0"));
    const core::CimPath m_service = service();
    const std::vector<core::Argument> m_arguments =
        argumentsOf("URI=" + m_image + "; Target=" + port("eth0").toString() +
                    "; InstallOptions=5,32768; InstallOptionsValues=,IMG_PXE+IMG_UEFI");
};

TEST_F(AllocationTest, FailingInTheRequestAndInTheWorker) {
    const test::LogLevelGuard silent(0);
    for (const bool releases : {false, true}) {
        SCOPED_TRACE(releases);
        m_folder.write("quenx.conf", releases ? "ReleaseClaimAfterCheck=1\n" : "\n");
        failEverywhere(On::ThisThread, 1, releases);
    }
    EXPECT_TRUE(m_isTold);
    failEverywhere(On::OtherThreads, 1, true);
}

TEST_F(AllocationTest, FailingWhileEverythingIsLogged) {
    // Destructors that log, and refusals on their way, must survive it.
    test::SyslogCapture::keep(false);
    failEverywhere(On::ThisThread, test::effort.everything ? 1 : 23, false);
    m_folder.write("quenx.conf", "ReleaseClaimAfterCheck=1\n");
    failEverywhere(On::OtherThreads, test::effort.everything ? 1 : 5, true);
    test::SyslogCapture::keep(true);
}

}  // namespace
