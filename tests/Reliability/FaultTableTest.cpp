// SPDX-License-Identifier: Apache-2.0
// Every call that an update makes fails, throws or stalls, one at a time.
#include <thread>

#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Effort.h"
#include "Reliability/Interposed.h"
#include "Support/TestRoms.h"

namespace {

using ma::Fault;
using test::CallResult;
using utils::FirmwareType;

constexpr unsigned kJobStarted = 4096;
const std::string kDone = "7; 0; ";

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
        std::string job{};        ///< its state, error code and error text, if there is one
        std::string line{};       ///< of the log, if there is one to see
        bool keepsClaim = false;  ///< without ReleaseClaimAfterCheck
    };

    std::vector<Row> table() {
        using Operation = ma::Operation;
        using Action = Fault::Action;
        const std::string timeout = "10; 4; Timeout Error";
        const std::string onOrder = "10; 17; on order";
        const std::string disabled = "Access to the KD is disabled at this moment.";
        std::vector<Row> rows = {
            // New: the image is being verified.
            {"no adapters", order(Operation::Enumerate, Action::Fail), 5},
            {"target look-up", strike("enumerateAdapters", On::Request, How::Throw), 5},
            {"preparation throws", strike("prepareFlashImage", On::Request, How::Throw), 2, "", "", true},
            // The type of a refusal, which alone does not say that nothing was done to the adapter.
            {"preparation refuses", strike("prepareFlashImage", On::Request, How::Refuse), 5, "",
             "Exception: 'SMASHv2:EInvalidParameter:odd'", true},
            {"preparation stalls", strike("prepareFlashImage", On::Request, How::Stall), kJobStarted, kDone},
            {"preparation fails", [this] { m_backend->prepareStatus = 6; }, 2, "", "Unspecified Error for '"},
            // Starting: the job leaves the list at once.
            {"no thread", [] { test::refusesThreads = true; }, 4, "", "Failed to start job for '"},
            // Running.
            {"no locker", [this] { m_locker.reset(); }, kJobStarted, timeout, disabled},
            {"locker is busy", [this] { m_busy.emplace(); }, kJobStarted, kDone},
            {"version fails", order(Operation::FirmwareVersion, Action::Fail), kJobStarted, kDone},
            {"boot type fails", order(Operation::BootType, Action::Fail), kJobStarted, kDone},
            {"write fails at once", order(Operation::Write, Action::Fail), kJobStarted, onOrder},
            {"write fails late", order(Operation::Write, Action::Fail, 100), kJobStarted, onOrder},
            {"write throws late", order(Operation::Write, Action::Throw, 50), kJobStarted, timeout},
            {"write stalls", order(Operation::Write, Action::Stall, 50), kJobStarted, kDone},
            {"write loses power", order(Operation::Write, Action::PowerLoss, 50), kJobStarted, timeout},
            {"word fails", order(Operation::CapabilityWord, Action::Fail), kJobStarted, onOrder},
            {"word fails widely", order(Operation::CapabilityWord, Action::Fail, 0, 0x10005), kJobStarted,
             "10; 5; on order"},
            {"word succeeds with a text", [this] { m_backend->capabilityText = "worn"; }, kJobStarted,
             kDone + "worn"},
            {"progress throws", strike("getFlashImageUpdateProgress", On::Request, How::Throw), kJobStarted,
             kDone},
            {"progress stalls", strike("getFlashImageUpdateProgress", On::Request, How::Stall), kJobStarted,
             kDone},
        };
        for (const std::string operation : {"getAdapterFirmwareVersion", "getPCIAddress", "enumerateAdapters",
                                            "setBootType", "writeFlashImage", "updateCapabilityWord"}) {
            rows.push_back({operation + " throws", strike(operation, On::Worker, How::Throw), kJobStarted,
                            timeout, disabled});
            rows.push_back(
                {operation + " stalls", strike(operation, On::Worker, How::Stall), kJobStarted, kDone});
        }
        return rows;
    }
    /// Throws at, or holds up, one operation of the adapter API.
    std::function<void()> strike(const std::string& operation, On on, How how) {
        return [=, this, request = std::this_thread::get_id()] {
            m_struck = 0;
            const bool isProgress = operation == "getFlashImageUpdateProgress";
            m_backend->hook = [=, this](const std::string& called) {
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
    /// Has the adapter itself fail.
    std::function<void()> order(ma::Operation at, Fault::Action action, uint16_t percent = 0,
                                uint32_t code = 17) {
        return [=, this] {
            m_adapters->injectFault("eth4", Fault{at, action, percent, code, "on order", 30});
        };
    }
    void run(const Row& row, bool releases) {
        test::SyslogCapture::clear();
        const std::string before = components();
        const std::string uri = file(
            "update.rom",
            test::madeRom({{FirmwareType::iSCSI, 1}, {FirmwareType::UEFI, ++m_revision}}, 0x15ad, 0x07b0));
        m_struck = -1;
        row.arm();
        const CallResult result = installOnEth4(uri);
        EXPECT_EQ(result.returnValue, row.returnValue) << result.error;
        ASSERT_EQ(result.job.has_value(), row.returnValue == kJobStarted);
        if (result.job) {
            const core::InstanceValue job = waitForEnd(*result.job);
            EXPECT_EQ(UpdateTest::row(job, {"JobState", "ErrorCode", "ErrorDescription"}), row.job);
            EXPECT_EQ(text(job, "PercentComplete"), "100");
            m_requests.deleteInstance(*result.job);
        }
        EXPECT_TRUE(m_requests.enumerateInstanceNames("Quenx_ConcreteJob").empty());
        EXPECT_TRUE(test::SyslogCapture::contains(row.line));
        EXPECT_NE(m_struck, 0) << "the fault was never reached";
        disarm();
        // Whole, and new where the flash was written to its end.
        const std::string updated = "IMG_iSCSI 1, IMG_UEFI " + std::to_string(m_revision);
        const std::string after = components();
        EXPECT_TRUE(after == updated || (!row.job.starts_with(kDone) && after == before)) << after;

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
    void disarm() {
        m_backend->hook = nullptr;
        m_backend->prepareStatus.reset();
        m_backend->capabilityText.reset();
        m_adapters->clearFaults("eth4");
        test::refusesThreads = false;
        m_busy.reset();
        if (!m_locker) m_locker.emplace();
    }

    std::string components() const { return test::describeRom(m_adapters->flashContent("eth4")); }
    CallResult installOnEth4(const std::string& uri) const {
        return install(uri, m_port, "32768,5", "IMG_UEFI");
    }

    const core::CimPath m_port = port("eth4");
    std::atomic<int> m_struck{0};
    std::optional<os::OSLocker::AutoOSLocker> m_busy;
    uint16_t m_revision = 1;
};

TEST_F(FaultTableTest, EveryFaultEndsAsDocumentedAndTheNextUpdateWorks) {
    for (const bool releases : {false, true}) {
        m_folder.write("quenx.conf", releases ? "ReleaseClaimAfterCheck=1\n" : "ReleaseClaimAfterCheck=0\n");
        for (const Row& row : table()) {
            SCOPED_TRACE(row.name + (releases ? ", claim given back" : ", claim kept"));
            run(row, releases);
        }
    }
}

}  // namespace
