// SPDX-License-Identifier: Apache-2.0
// Every call that an update makes fails, throws or stalls, one at a time.
#include <thread>

#include "Framework/Classes/InstanceList.h"
#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Effort.h"
#include "Reliability/Interposed.h"
#include "Support/TestRoms.h"

namespace {

using ma::Fault;
using test::CallResult;
using utils::FirmwareType;

constexpr unsigned kFailed = 4;
constexpr unsigned kJobStarted = 4096;

/// Whose call is struck.
enum class On { Request, Worker };
enum class How { Throw, Refuse, Stall };

class FaultTableTest : public test::UpdateTest {
  protected:
    /// What an update on eth4, whose iSCSI image is not renewed, comes to: so every call is made.
    struct Row {
        std::string name;
        std::function<void()> arm;
        unsigned returnValue;
        unsigned jobState = 0;  ///< with a job only
        unsigned errorCode = 0;
        std::string errorText{};
        std::string line{};       ///< of the log, if there is one to see
        bool keepsClaim = false;  ///< without ReleaseClaimAfterCheck
    };

    std::vector<Row> table();
    /// Throws at, or holds up, one operation of the adapter API.
    std::function<void()> strike(const std::string& operation, On on, How how);
    /// Has the adapter itself fail.
    std::function<void()> order(ma::Operation at, Fault::Action action, uint16_t percent = 0,
                                uint32_t code = 17) {
        return [=, this] {
            m_adapters->injectFault("eth4", Fault{at, action, percent, code, "on order", 30});
        };
    }
    void run(const Row& row, bool releases);
    void disarm();

    std::string components() const { return test::describeRom(m_adapters->flashContent("eth4")); }
    CallResult installOnEth4(const std::string& uri) const {
        return install(uri, m_port, {32768, 5}, {"IMG_UEFI"});
    }

    const core::CimPath m_port = port("eth4");
    std::atomic<int> m_struck{0};
    std::optional<os::OSLocker::AutoOSLocker> m_busy;
    uint16_t m_revision = 1;
};

std::function<void()> FaultTableTest::strike(const std::string& operation, On on, How how) {
    return [=, this, request = std::this_thread::get_id()] {
        m_struck = 0;
        const bool isProgress = operation == "getFlashImageUpdateProgress";
        m_backend->hook = [=, this](const std::string& called, const std::string&) {
            // The worker gives the request the time to ask.
            for (int i = 0; isProgress && called == "writeFlashImage" && m_struck == 0 && i < 30'000; ++i)
                utils::Thread::msleep(1);
            const bool isRequest = std::this_thread::get_id() == request;
            if (called != operation || isRequest != (on == On::Request)) return;
            ++m_struck;
            if (how == How::Stall) return utils::Thread::msleep(30);
            if (how == How::Refuse) throw utils::EInvalidParameter("odd");
            if (on == On::Worker) throw 42;
            throw std::runtime_error(operation);
        };
    };
}

std::vector<FaultTableTest::Row> FaultTableTest::table() {
    using Operation = ma::Operation;
    using Action = Fault::Action;
    const std::string timeout = "Timeout Error";
    const std::string disabled = "Access to the KD is disabled at this moment.";
    std::vector<Row> rows = {
        // New: the image is being verified.
        {"no adapters", order(Operation::Enumerate, Action::Fail), 5},
        {"target look-up", strike("enumerateAdapters", On::Request, How::Throw), 5},
        {"preparation throws", strike("prepareFlashImage", On::Request, How::Throw), 2, 0, 0, "", "", true},
        // The type of a refusal, which alone does not say that nothing was done to the adapter.
        {"preparation refuses", strike("prepareFlashImage", On::Request, How::Refuse), 5, 0, 0, "",
         "Exception: 'SMASHv2:EInvalidParameter:odd'", true},
        {"preparation stalls", strike("prepareFlashImage", On::Request, How::Stall), kJobStarted, 7},
        {"preparation fails", [this] { m_backend->prepareStatus = 6; }, 2, 0, 0, "",
         "Unspecified Error for '"},
        // Starting: the job leaves the list at once.
        {"no thread", [] { test::refusesThreads = true; }, kFailed, 0, 0, "", "Failed to start job for '"},
        // Running.
        {"no locker", [this] { m_locker.reset(); }, kJobStarted, 10, 4, timeout, disabled},
        {"locker is busy", [this] { m_busy.emplace(); }, kJobStarted, 7},
        {"version fails", order(Operation::FirmwareVersion, Action::Fail), kJobStarted, 7},
        {"boot type fails", order(Operation::BootType, Action::Fail), kJobStarted, 7},
        {"write fails at once", order(Operation::Write, Action::Fail), kJobStarted, 10, 17, "on order"},
        {"write fails late", order(Operation::Write, Action::Fail, 100), kJobStarted, 10, 17, "on order"},
        {"write throws late", order(Operation::Write, Action::Throw, 50), kJobStarted, 10, 4, timeout},
        {"write stalls", order(Operation::Write, Action::Stall, 50), kJobStarted, 7},
        {"write loses power", order(Operation::Write, Action::PowerLoss, 50), kJobStarted, 10, 4, timeout},
        {"word fails", order(Operation::CapabilityWord, Action::Fail), kJobStarted, 10, 17, "on order"},
        {"word fails widely", order(Operation::CapabilityWord, Action::Fail, 0, 0x10005), kJobStarted, 10, 5,
         "on order"},
        {"word succeeds with a text", [this] { m_backend->capabilityText = "worn"; }, kJobStarted, 7, 0,
         "worn"},
        {"progress throws", strike("getFlashImageUpdateProgress", On::Request, How::Throw), kJobStarted, 7},
        {"progress stalls", strike("getFlashImageUpdateProgress", On::Request, How::Stall), kJobStarted, 7},
    };
    for (const char* operation : {"getAdapterFirmwareVersion", "getPCIAddress", "enumerateAdapters",
                                  "setBootType", "writeFlashImage", "updateCapabilityWord"}) {
        rows.push_back({std::string(operation) + " throws", strike(operation, On::Worker, How::Throw),
                        kJobStarted, 10, 4, timeout, disabled});
        rows.push_back(
            {std::string(operation) + " stalls", strike(operation, On::Worker, How::Stall), kJobStarted, 7});
    }
    return rows;
}

void FaultTableTest::disarm() {
    m_backend->hook = nullptr;
    m_backend->prepareStatus.reset();
    m_backend->capabilityText.reset();
    m_adapters->clearFaults("eth4");
    test::refusesThreads = false;
    m_busy.reset();
    if (!m_locker) m_locker.emplace();
}

void FaultTableTest::run(const Row& row, bool releases) {
    test::SyslogCapture::clear();
    const std::string before = components();
    const std::string uri =
        file("update.rom",
             test::madeRom({{FirmwareType::iSCSI, 1}, {FirmwareType::UEFI, ++m_revision}}, 0x15ad, 0x07b0));
    m_struck = -1;
    row.arm();
    const CallResult result = installOnEth4(uri);
    EXPECT_EQ(result.returnValue, row.returnValue) << result.error;
    ASSERT_EQ(result.job.has_value(), row.returnValue == kJobStarted);
    if (result.job) {
        const core::InstanceValue job = waitForEnd(*result.job);
        EXPECT_EQ(state(job), row.jobState);
        EXPECT_EQ(number(job, "ErrorCode"), row.errorCode);
        EXPECT_EQ(text(job, "ErrorDescription"), row.errorText);
        EXPECT_EQ(number(job, "PercentComplete"), 100U);
        m_requests.deleteInstance(*result.job);
    }
    EXPECT_TRUE(m_requests.enumerateInstanceNames("Quenx_ConcreteJob").empty());
    EXPECT_TRUE(test::SyslogCapture::contains(row.line));
    EXPECT_NE(m_struck, 0) << "the fault was never reached";
    disarm();
    // Whole, and new where the flash was written to its end.
    const std::string updated = "IMG_iSCSI 1, IMG_UEFI " + std::to_string(m_revision);
    const std::string after = components();
    EXPECT_TRUE(after == updated || (row.jobState != 7 && after == before)) << after;

    const bool kept = row.keepsClaim && !releases;
    EXPECT_EQ(claim(), kept ? "eth4" : "");
    EXPECT_TRUE(!kept || installOnEth4(uri).returnValue == 6U);
    setClaim("");
    const CallResult next = installOnEth4(uri);
    ASSERT_TRUE(next.job) << next.returnValue << next.error;
    EXPECT_EQ(state(waitForEnd(*next.job)), 7U);
    EXPECT_EQ(components(), updated);
    m_requests.deleteInstance(*next.job);
    test::count("faults injected");
}

TEST_F(FaultTableTest, EveryFaultEndsAsDocumentedAndTheNextUpdateWorks) {
    for (const bool releases : {false, true}) {
        m_folder.write("quenx.conf", releases ? "ReleaseClaimAfterCheck=1\n" : "ReleaseClaimAfterCheck=0\n");
        for (const Row& row : table()) {
            SCOPED_TRACE(row.name + (releases ? ", claim given back" : ", claim kept"));
            run(row, releases);
        }
    }
}

TEST_F(FaultTableTest, WithoutAnyThreadNobodyWaits) {
    if (testing::UnitTest::GetInstance()->test_to_run_count() > 1)
        GTEST_SKIP() << "another test may have left the thread that frees jobs";
    test::refusesThreads = true;
    EXPECT_EQ(install(goodImage(), "eth0").returnValue, kFailed);
    EXPECT_TRUE(m_requests.enumerateInstanceNames("Quenx_ConcreteJob").empty());
    // The destructor, which waits, is left to whoever has to wait anyway.
    EXPECT_FALSE(test::SyslogCapture::contains("Destroying JobThread"));
    core::drainReaper([] {});
    EXPECT_TRUE(test::SyslogCapture::contains("Destroying JobThread"));
    disarm();
}

}  // namespace
