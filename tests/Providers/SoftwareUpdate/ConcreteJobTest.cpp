#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <mutex>

#include "Providers/SoftwareUpdate/JobThread.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Support/TestRoms.h"

namespace {

using test::madeRom;
using utils::FirmwareType;

class ConcreteJobTest : public test::UpdateTest {
  protected:
    std::unique_ptr<Quenx_ConcreteJob> makeJob(const std::string& adapter = "eth0",
                                               const std::string& uri = {}) {
        m_uri = uri.empty() ? goodImage() : uri;
        return std::make_unique<Quenx_ConcreteJob>(adapter, 7, m_uri, m_options, m_values);
    }

    /// Runs a job to its end, without the registry.
    static void run(Quenx_ConcreteJob& job) {
        EXPECT_EQ(job.requestStateChange(RequestedStateStart, utils::Time()), 0U);
        while (!job.threadControl(ThreadDispose, 0))
            utils::Thread::msleep(2);
    }

    std::string m_uri;
    std::vector<unsigned short> m_options = {5};
    std::vector<std::string> m_values;
};

TEST_F(ConcreteJobTest, StartsNewAndIsStartedOnce) {
    const auto job = makeJob();
    EXPECT_EQ(claim(), "eth0");
    job->refresh();
    EXPECT_EQ(job->JobState.get(), JobStateNew);
    EXPECT_EQ(job->PercentComplete.get(), 0);
    EXPECT_EQ(core::datetimeText(job->TimeOfLastStateChange.get()), "00000000000000.000000:000");
    EXPECT_TRUE(job->ElapsedTime.get().isPeriod());
    for (core::CimProperty* never : {static_cast<core::CimProperty*>(&job->JobInParameters),
                                     static_cast<core::CimProperty*>(&job->JobOutParameters),
                                     static_cast<core::CimProperty*>(&job->MethodName)}) {
        EXPECT_TRUE(never->IsNull());
    }
    for (const int other : {3, 4, 5, 0}) {
        EXPECT_EQ(job->requestStateChange(static_cast<RequestedState>(other), utils::Time()), 5U);
    }
    run(*job);
    EXPECT_EQ(job->getJobState(), JobStateCompleted);
    EXPECT_EQ(job->requestStateChange(RequestedStateStart, utils::Time()), 4097U);
    EXPECT_TRUE(test::SyslogCapture::contains("Cannot start job that is not in 'NEW' state"));
    EXPECT_THROW(job->threadControl(ThreadStart, 0), utils::Exception);
    EXPECT_THROW(job->threadControl(ThreadTerminate, 0), utils::Exception);
    EXPECT_FALSE(job->threadControl(static_cast<ThreadOperationCommand>(9), 0));
    EXPECT_EQ(job->getFlashImage(), nullptr);
    EXPECT_EQ(job->getFlashImageSize(), 0U);
}

TEST_F(ConcreteJobTest, StatesDecideOverTheClaim) {
    struct Row {
        int state;
        bool releases;
    };
    for (const Row& row : {Row{0, false}, Row{1, false}, Row{2, false}, Row{3, false}, Row{4, false},
                           Row{5, false}, Row{6, true}, Row{7, true}, Row{8, false}, Row{9, false},
                           Row{10, true}, Row{11, false}, Row{12, false}, Row{13, false}}) {
        Quenx_ConcreteJob::m_servicedAdapter = std::string();
        const auto job = makeJob();
        job->setJobState(static_cast<JobStateVal>(row.state));
        EXPECT_EQ(claim().empty(), row.releases) << row.state;
        EXPECT_EQ(job->getFlashImage() == nullptr, row.releases) << row.state;
        EXPECT_TRUE(logged("2 -> " + std::to_string(row.state)));
    }
}

TEST_F(ConcreteJobTest, ReportsWhatTheAdapterReported) {
    struct Row {
        std::optional<test::HookedBackend::Refusal> write;
        std::optional<test::HookedBackend::Refusal> capability;
        JobStateVal state;
        unsigned code;
        std::string text;
    };
    using Refusal = test::HookedBackend::Refusal;
    for (const Row& row : std::vector<Row>{
             {Refusal{3, "bank"}, Refusal{9, "never asked"}, JobStateException, 3, "bank"},
             {Refusal{0x10005, "wide"}, std::nullopt, JobStateException, 5, "wide"},
             {Refusal{8, "odd", true}, Refusal{9, "done", true}, JobStateCompleted, 9, "done"},
             {std::nullopt, Refusal{6, "word"}, JobStateException, 6, "word"},
             {std::nullopt, std::nullopt, JobStateCompleted, 0, ""},
         }) {
        m_backend->writeAnswer = row.write;
        m_backend->capabilityAnswer = row.capability;
        const auto job = makeJob();
        const std::string elapsed = core::datetimeText(job->ElapsedTime.get());
        run(*job);
        job->refresh();
        EXPECT_EQ(job->JobState.get(), row.state);
        EXPECT_EQ(job->ErrorCode.get(), row.code);
        EXPECT_EQ(job->ErrorDescription.get(), row.text);
        EXPECT_EQ(job->PercentComplete.get(), 100);
        EXPECT_EQ(claim(), "");
    }
}

TEST_F(ConcreteJobTest, AnyExceptionInTheWorkerIsATimeout) {
    for (const char* operation : {"getAdapterFirmwareVersion", "writeFlashImage", "updateCapabilityWord"}) {
        m_backend->hook = [operation](const std::string& called, const std::string&) {
            if (called == operation) throw 42;
        };
        const auto job = makeJob();
        run(*job);
        job->refresh();
        EXPECT_EQ(job->JobState.get(), JobStateException) << operation;
        EXPECT_EQ(job->ErrorCode.get(), 4);
        EXPECT_EQ(job->ErrorDescription.get(), "Timeout Error");
        EXPECT_TRUE(logged("Access to the KD is disabled at this moment."));
        EXPECT_EQ(claim(), "");
    }
}

TEST_F(ConcreteJobTest, OnlyAMissingLockerFailsTheWorker) {
    os::OSLocker* locker = utils::Singleton<os::OSLocker>::getInstance();
    EXPECT_EQ(locker->Lock(), 0);
    const auto busy = makeJob();
    run(*busy);
    EXPECT_EQ(busy->getJobState(), JobStateCompleted);

    m_locker.reset();
    const auto missing = makeJob();
    run(*missing);
    missing->refresh();
    EXPECT_EQ(missing->JobState.get(), JobStateException);
    EXPECT_EQ(missing->ErrorDescription.get(), "Timeout Error");
    EXPECT_EQ(claim(), "");
}

TEST_F(ConcreteJobTest, RemovingIscsiResetsTheBootTypeOfTheWholeCard) {
    struct Row {
        const char* adapter;
        std::vector<utils::FirmwareVersionInfo> image;
        std::string types;
        std::string reset;
    };
    const std::vector<utils::FirmwareVersionInfo> iscsi = {{FirmwareType::iSCSI, 2}, {FirmwareType::UEFI, 1}};
    std::mutex mutex;
    std::string reset;
    m_backend->hook = [&](const std::string& operation, const std::string& adapter) {
        const std::lock_guard lock(mutex);
        if (operation == "setBootType") reset += adapter + " ";
    };
    for (const Row& row : std::vector<Row>{
             {"eth4", iscsi, "IMG_UEFI", "eth4 "},       // the adapter has iSCSI, the list has not
             {"eth4", iscsi, "IMG_iSCSI+IMG_UEFI", ""},  // found in a sorted list
             {"eth0", {{FirmwareType::PXE, 2}, {FirmwareType::UEFI, 1}}, "", ""},
         }) {
        reset.clear();
        const bool isEth4 = std::string(row.adapter) == "eth4";
        m_options = {32768, 5};
        m_values = {row.types.empty() ? "IMG_PXE+IMG_UEFI" : row.types};
        const auto job = makeJob(
            row.adapter, file("iscsi.rom", isEth4 ? madeRom(row.image, 0x15ad, 0x07b0) : madeRom(row.image)));
        run(*job);
        const std::lock_guard lock(mutex);
        EXPECT_EQ(reset, row.reset) << row.types;
    }
}

TEST_F(ConcreteJobTest, ProgressIsAskedForOnlyWhileRunning) {
    std::atomic<int> asked{0};
    std::atomic<bool> go{false};
    m_backend->hook = [&](const std::string& operation, const std::string&) {
        if (operation == "getFlashImageUpdateProgress") {
            ++asked;
            if (go) throw std::runtime_error("no progress");
        }
        while (operation == "writeFlashImage" && !go)
            utils::Thread::msleep(1);
    };
    const auto job = makeJob();
    EXPECT_EQ(job->getPercentComplete(), 0);
    EXPECT_EQ(asked, 0);
    job->requestStateChange(RequestedStateStart, utils::Time());
    while (job->getJobState() != JobStateRunning)
        utils::Thread::msleep(1);
    job->refresh();
    EXPECT_EQ(asked, 1);
    go = true;
    while (!job->threadControl(ThreadDispose, 0))
        job->refresh();  // a progress that throws spoils no refresh
    job->refresh();
    EXPECT_EQ(job->PercentComplete.get(), 100);
}

TEST_F(ConcreteJobTest, AWorkerThatFlashesIsWaitedForAndNotStopped) {
    std::atomic<bool> wrote{false};
    m_backend->hook = [&](const std::string& operation, const std::string&) {
        if (operation != "writeFlashImage") return;
        utils::Thread::msleep(200);
        wrote = true;
    };
    auto job = makeJob();
    job->requestStateChange(RequestedStateStart, utils::Time());
    while (job->getJobState() != JobStateRunning)
        utils::Thread::msleep(1);
    EXPECT_TRUE(job->threadControl(ThreadTerminate, 50));  // always true for a multiple of 50
    EXPECT_FALSE(job->threadControl(ThreadTerminate, 30));
    job.reset();
    EXPECT_TRUE(wrote);
    EXPECT_EQ(claim(), "");
    const auto lines = test::SyslogCapture::messages();
    const auto lineOf = [&](const char* part) {
        return std::find_if(lines.begin(), lines.end(),
                            [&](const std::string& line) { return line.find(part) != std::string::npos; });
    };
    EXPECT_LT(lineOf("waiting for terminate"), lineOf(", terminated"));
    EXPECT_LT(lineOf(", terminated"), lineOf("Thread::~Thread("));
    EXPECT_NE(lineOf("Thread::~Thread("), lines.end());
}

TEST_F(ConcreteJobTest, ReadsTargetTypesFromTheOptions) {
    struct Row {
        std::vector<unsigned short> options;
        std::vector<std::string> values;
        std::vector<int> types;
    };
    for (const Row& row : std::vector<Row>{
             {{5}, {"IMG_PXE"}, {}},
             {{32768}, {" IMG_PXE\t+ IMG_UEFI "}, {3, 4}},
             {{32768}, {"IMG_UEFI+IMG_PXE+IMG_UEFI"}, {4, 3, 4}},
             {{32768}, {"IMG_PXE+"}, {3, 0}},
             {{32768}, {""}, {0}},
             {{5, 32768}, {"IMG_PXE"}, {}},
             {{32768, 5, 32768}, {"IMG_CLP", "x", "IMG_FCoE+IMG_iSCSI"}, {1, 5, 2}},
             {{32768, 32768}, {"IMG_CLP"}, {1}},
         }) {
        auto options = row.options;
        auto values = row.values;
        std::vector<int> types;
        for (const FirmwareType type : Quenx_ConcreteJob::getTargetTypes(options, values)) {
            types.push_back(static_cast<int>(type));
        }
        EXPECT_EQ(types, row.types);
    }
    EXPECT_TRUE(logged("Return result[3]=%d"));
    Quenx_ConcreteJob::m_servicedAdapter = std::string("eth0");
    std::vector<unsigned short> options = {32768};
    std::vector<std::string> values = {"IMG_PXE+ img_uefi"};
    try {
        Quenx_ConcreteJob::getTargetTypes(options, values);
        FAIL();
    } catch (const utils::Exception& refusal) {
        EXPECT_STREQ(refusal.what(),
                     "SMASHv2:EInvalidParameter:Invalid parameter detected for TargetTypes. img_uefi "
                     "is not recognized");
    }
    EXPECT_EQ(claim(), "");
}

TEST_F(ConcreteJobTest, TheStatusOfThePreparationDecides) {
    struct Row {
        int status;
        bool force;
        bool downgradesBlocked;
        const char* error;
    };
    constexpr const char* kAccepted = "";
    constexpr const char* kDowngrade = "EDowngradeDetected:Downgrade was detected for ";
    constexpr const char* kTypes = "EDowngradeDetected:The selected flash image cannot be used";
    for (const Row& row : {
             Row{0, false, false, kAccepted},
             Row{1, true, false, "EInvalidParameter:Invalid parameter detected for "},
             Row{2, true, false, "EAdapterNotSupported:Image "},
             Row{3, false, false, kDowngrade},
             Row{3, true, false, kAccepted},
             Row{3, true, true, kAccepted},
             Row{4, false, false, kDowngrade},
             Row{4, true, false, kAccepted},
             Row{4, true, true, kTypes},
             Row{4, false, true, kTypes},
             Row{5, true, false, "ENotApplicableForTarget:Not applicable for "},
             Row{6, true, false, "EUnspecifiedError:Unspecified error occurred for "},
             Row{7, false, false, kAccepted},
             Row{-1, false, false, kAccepted},
             Row{255, false, false, kAccepted},
         }) {
        Quenx_ConcreteJob::m_servicedAdapter = std::string();
        const utils::SMASHv2Config config(
            m_folder.write("policy.conf", row.downgradesBlocked ? "OEMCustomizeable=5\n" : "\n"));
        m_backend->prepareStatus = row.status;
        m_options = row.force ? std::vector<unsigned short>{5, 3} : std::vector<unsigned short>{5};
        std::string error;
        try {
            makeJob();
        } catch (const utils::Exception& refusal) {
            error = refusal.what();
        }
        const std::string expected = row.error == kAccepted ? "" : "SMASHv2:" + std::string(row.error);
        EXPECT_EQ(error.substr(0, expected.size()), expected) << row.status;
        EXPECT_EQ(error.empty(), expected.empty()) << error;
        EXPECT_EQ(claim(), expected.empty() ? "eth0" : "") << row.status;
    }
}

TEST_F(ConcreteJobTest, AWorkerNeedsAJob) {
    EXPECT_THROW(JobThread(nullptr), utils::Exception);
    EXPECT_TRUE(test::SyslogCapture::contains("Assertion failed: '__null != myJob'"));
}

}  // namespace
