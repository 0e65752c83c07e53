// SPDX-License-Identifier: Apache-2.0
// Every cause for which an update is refused or fails is met, and told by its id.
#include <filesystem>
#include <map>
#include <set>
#include <thread>

#include "Framework/Requests/UpdateSink.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Reliability/Interposed.h"
#include "Support/TestRoms.h"
#include "Utils/Os/Linux/PatientReading.h"
#include "Utils/Os/Linux/PolicyFile.h"

namespace {

using core::ReasonId;

/// A history that has no memory.
class ExhaustedSink : public core::UpdateSink {
  public:
    std::future<core::ImageFacts> examine(std::span<const std::uint8_t>) noexcept override { return {}; }
    void refused(const core::UpdateAttempt& attempt, unsigned int, core::ReasonId id,
                 const std::string& text) noexcept override {
        EXPECT_FALSE(attempt.uri.empty());
        told[id] = text;
        EXPECT_TRUE(id != ReasonId::PolicyUnreadable || attempt.mostRecords > 10'000'000)
            << "it removes none";
        denials += id == ReasonId::PolicyUnreadable ? 1 : 0;
    }
    std::string problem() override { throw std::bad_alloc(); }
    std::shared_ptr<core::UpdateRecord> begin(const core::UpdateAttempt&) noexcept override { return {}; }

    std::map<ReasonId, std::string> told;
    int denials = 0;
};

class RefusalsTest : public test::UpdateTest {
  protected:
    ~RefusalsTest() override { os::beforeFileAccess = nullptr; }

    /// The method returns what the table says.
    void expect(ReasonId id, const test::CallResult& result) {
        EXPECT_EQ(core::reasonCode(result.reason), core::reasonCode(id));
        const core::Reason* row = core::findReason(id);
        ASSERT_NE(row, nullptr);
        EXPECT_EQ(row->returnValue.has_value(), result.error.empty()) << result.error;
        EXPECT_EQ(row->returnValue.value_or(0), result.returnValue) << row->text;
        m_met.insert(id);
        m_backend->hook = nullptr;
        os::beforeFileAccess = nullptr;
        setClaim("");
    }
    void expectRefused(ReasonId id) { expect(id, install(m_uri, m_port)); }
    /// Whoever reads the image finds this file system.
    void expectOfFile(ReasonId id, void (*beforeAccess)(const std::string& path)) {
        m_accesses = 0;
        os::beforeFileAccess = beforeAccess;
        expectRefused(id);
        // Nobody reads a file that another reader still waits for.
        test::CallResult next = install(m_uri, m_port);
        for (; next.returnValue == MethodReturn::UnspecifiedError; next = install(m_uri, m_port))
            std::this_thread::sleep_for(std::chrono::milliseconds(50));
        EXPECT_EQ(core::reasonCode(next.reason), "");
        deleteJobs();
    }
    void expectOfJob(ReasonId id, ma::Fault::Action action, std::uint32_t code) {
        m_adapters->injectFault("eth0", ma::Fault{ma::Operation::Write, action, 0, code, "on order", 0});
        const core::InstanceValue job = waitForEnd(*install(m_uri, m_port).job);
        const auto shown = static_cast<std::uint32_t>(job.number("ErrorCode"));
        EXPECT_EQ(core::reasonOfErrorCode(shown), id) << code;
        EXPECT_EQ(core::findReason(id)->errorCode.value(), std::min(shown, 6U));
        m_met.insert(id);
        m_adapters->clearFaults("eth0");
    }
    void expectOfTheFile();
    void expectOfTheAdapter();
    void expectOfMemory();
    void expectOfThePolicy();
    void expectOfTheFlash();

    const std::string m_uri = goodImage();
    const core::CimPath m_port = port("eth0");
    std::set<ReasonId> m_met;
    static inline int m_accesses = 0;
};

void RefusalsTest::expectOfTheFile() {
    m_folder.write("quenx.conf", "LargestImage=512\n");
    expectRefused(ReasonId::FileTooLarge);
    m_folder.write("quenx.conf", "LargestImage=0\nImageReadTimeout=2\n");
    static const std::string path = m_uri.substr(std::string("file://").size());
    expectOfFile(ReasonId::FileSystemSilent, [](const std::string&) {
        if (++m_accesses == 1) std::this_thread::sleep_for(std::chrono::milliseconds(2500));
    });
    expectOfFile(ReasonId::FileSystemSlow, [](const std::string&) {
        if (++m_accesses <= 3) std::this_thread::sleep_for(std::chrono::milliseconds(1200));
    });
    os::beforeFileAccess = [](const std::string&) {
        if (++m_accesses == 3) std::filesystem::resize_file(path, 100);
    };
    m_accesses = 0;
    expectRefused(ReasonId::FileNotRead);
    goodImage();
}

void RefusalsTest::expectOfTheAdapter() {
    m_backend->hook = [](const std::string& called) {
        if (called == "prepareFlashImage") throw std::runtime_error("odd");
    };
    expectRefused(ReasonId::PreparationFailed);
    int enumerations = 0;
    const core::CimPath controller = m_requests.enumerateInstanceNames("Quenx_PortController").at(0);
    m_backend->hook = [&](const std::string& called) {
        if (called == "enumerateAdapters" && ++enumerations == 2) throw std::runtime_error("gone");
    };
    expect(ReasonId::TargetWithoutAdapter, install(m_uri, controller));

    m_folder.write("quenx.conf", "FWFilePath=" + m_folder.path() + "\n");
    m_config.initialize();
    const std::string id =
        text(m_requests.enumerateInstances("Quenx_SoftwareIdentityResource").at(0), "InstanceID");
    const std::string identity =
        "Source=Quenx_SoftwareIdentity.InstanceID=\"" + id.substr(0, id.find('@')) + "\"; Target=";
    const std::string check = identity + m_port.toString();
    EXPECT_EQ(call("CheckSoftwareIdentity", check).reason, ReasonId::None);
    EXPECT_EQ(claim(), "eth0");
    const test::CallResult other = install(m_uri, "eth1");
    expect(ReasonId::AdapterHeldByCheck, install(m_uri, m_port));
    expect(ReasonId::OtherAdapterHeldByCheck, other);
    test::SyslogCapture::observe([this](const std::string& line) {
        if (line.find("@Quenx_SoftwareIdentityResource.cpp") != std::string::npos)
            std::filesystem::remove(m_folder / "good.rom");
    });
    expect(ReasonId::SourceWithoutFile, call("CheckSoftwareIdentity", check));
    test::SyslogCapture::observe(nullptr);
    goodImage();
}

void RefusalsTest::expectOfMemory() {
    test::refusesThreads = true;
    expectRefused(ReasonId::WorkerNotStarted);
    test::refusesThreads = false;
    for (std::uint64_t n = 1; m_met.count(ReasonId::NoMemoryToPrepare) == 0; ++n) {
        ASSERT_LT(n, 10'000U);
        test::CallResult result;
        try {
            const test::AllocationFailure failure(test::AllocationFailure::On::ThisThread, n);
            result = install(m_uri, m_port);
        } catch (const std::exception&) {
            // Of what is no refusal nobody tells.
        }
        if (result.reason == ReasonId::NoMemoryToPrepare) expect(ReasonId::NoMemoryToPrepare, result);
        deleteJobs();
        setClaim("");
    }
}

void RefusalsTest::expectOfThePolicy() {
    const std::string file = m_folder.write("policy.toml", "history = \"required\"\n");
    const utils::PolicyFile policy(file);
    expectRefused(ReasonId::HistoryRequired);
    const auto told = std::make_shared<ExhaustedSink>();
    const core::InstalledSink sink(told);
    expectRefused(ReasonId::NoMemory);
    m_folder.write("policy.toml", "administrators = [\"alice\"]\n");
    expectRefused(ReasonId::NotAdministrator);
    m_folder.write("policy.toml", "administrator = 1\n");
    expectRefused(ReasonId::PolicyUnreadable);
    EXPECT_EQ(told->told[ReasonId::NoMemory], "There was not enough memory");
    EXPECT_NE(told->told[ReasonId::NotAdministrator].find("may only read"), std::string::npos);
    EXPECT_NE(told->told[ReasonId::PolicyUnreadable].find("unknown key"), std::string::npos);
    // Who may only read cannot fill a history.
    for (int i = 0; i < 20; ++i)
        static_cast<void>(install(m_uri, m_port));
    EXPECT_LE(told->denials, 10);
}

void RefusalsTest::expectOfTheFlash() {
    using Action = ma::Fault::Action;
    expectOfJob(ReasonId::FlashAdapterGone, Action::Fail, ma::WriteError::UnknownAdapter);
    expectOfJob(ReasonId::FlashImageBad, Action::Fail, ma::WriteError::BadImage);
    expectOfJob(ReasonId::FlashNotUpdatable, Action::Fail, ma::WriteError::NotUpdatable);
    expectOfJob(ReasonId::FlashBrokeOff, Action::Throw, 0);
    expectOfJob(ReasonId::FlashBusy, Action::Fail, ma::WriteError::Busy);
    expectOfJob(ReasonId::FlashFailed, Action::Fail, ENOSPC);
}

TEST_F(RefusalsTest, EachIsMetByATest) {
    expectOfTheFile();
    expectOfTheAdapter();
    expectOfMemory();
    expectOfThePolicy();
    expectOfTheFlash();
    // By the calls of MethodsTest, and on the command line and after a kill by tests of their own.
    std::string elsewhere = core::reasonCode(ReasonId::LookUpFailed) +
                            core::reasonCode(ReasonId::FlashWithoutEffect) +
                            core::reasonCode(ReasonId::Interrupted);
    for (const char* sample : {QUENX_UPDATE_SAMPLES "/calls", QUENX_UPDATE_SAMPLES "/statuses"}) {
        const std::vector<std::uint8_t> content = test::readTestFile(sample);
        elsewhere.append(content.begin(), content.end());
    }
    for (const core::Reason& reason : core::allReasons()) {
        const bool isOfTrust =
            reason.id >= ReasonId::OutsideImageDirectories && reason.id < ReasonId::FlashAdapterGone;
        if (isOfTrust || m_met.count(reason.id) != 0) continue;
        EXPECT_NE(elsewhere.find(core::reasonCode(reason.id)), std::string::npos)
            << "no test meets: " << reason.text;
    }
}

}  // namespace
