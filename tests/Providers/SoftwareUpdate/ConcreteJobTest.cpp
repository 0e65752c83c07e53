// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"

#include <gtest/gtest.h>

#include "Framework/Classes/InstanceList.h"
#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Support/TestRoms.h"
#include "Support/Together.h"

namespace {

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
    std::vector<std::uint16_t> m_options = {5};
    std::vector<std::string> m_values;
};

TEST_F(ConcreteJobTest, StartsNewAndIsStartedOnce) {
    // The adapter is asked for the progress only while it is written to. Its boot type stays unless an update
    // removes iSCSI, which is in the fault table.
    m_backend->hook = [](const std::string& operation) {
        EXPECT_TRUE(operation != "getFlashImageUpdateProgress" && operation != "setBootType") << operation;
    };
    const auto iscsi = test::madeRom({{FirmwareType::iSCSI, 2}, {FirmwareType::UEFI, 1}}, 0x15ad, 0x07b0);
    run(*makeJob("eth4", file("iscsi.rom", iscsi)));
    const auto job = makeJob();
    EXPECT_EQ(claim(), "eth0");
    EXPECT_NE(job->getFlashImage(), nullptr);
    job->refresh();
    EXPECT_EQ(job->JobState.get(), JobStateNew);
    EXPECT_EQ(job->PercentComplete.get(), 0);
    EXPECT_EQ(core::datetimeText(job->TimeOfLastStateChange.get()), "00000000000000.000000:000");
    EXPECT_TRUE(job->ElapsedTime.get().isPeriod());
    EXPECT_EQ(core::datetimeText(job->TimeBeforeRemoval.get()), "00000000000500.000000:000");
    EXPECT_EQ(core::datetimeText(job->StartTime.get()).substr(21), "+000");
    EXPECT_EQ(job->Name.get(), "Firmware Update Job 7");
    for (const int other : {3, 4, 5, 0}) {
        EXPECT_EQ(job->requestStateChange(static_cast<RequestedState>(other), utils::Time()), 5U);
        EXPECT_TRUE(test::SyslogCapture::says("Not supported new state " + std::to_string(other)));
    }
    run(*job);
    job->refresh();
    EXPECT_EQ(job->JobState.get(), JobStateCompleted);
    EXPECT_EQ(job->PercentComplete.get(), 100);
    EXPECT_EQ(claim(), "");
    EXPECT_EQ(job->getFlashImage(), nullptr) << "it has megabytes";
    EXPECT_EQ(job->requestStateChange(RequestedStateStart, utils::Time()), 4097U);
    EXPECT_TRUE(test::SyslogCapture::says("Cannot start job that is not in 'NEW' state"));
    // One that does not come to its end is waited for in steps of 50 ms.
    m_backend->hook = nullptr;
    const auto held = makeJob();
    m_backend->hold("writeFlashImage");
    EXPECT_EQ(held->requestStateChange(RequestedStateStart, utils::Time()), 0U);
    m_backend->waitUntilHeld();
    EXPECT_TRUE(held->threadControl(ThreadTerminate, 100));
    EXPECT_FALSE(held->threadControl(ThreadTerminate, 101));
    m_backend->letGo();
    while (!held->threadControl(ThreadDispose, 0))
        utils::Thread::msleep(2);
    job->setLastError(7, "afterwards");
    job->refresh();
    EXPECT_EQ(job->ErrorDescription.get(), "afterwards") << "an end that was served may change";
}

TEST_F(ConcreteJobTest, MayBeUsedByAnyThreadAtOnce) {
    for (int round = 0; round < 10; ++round) {
        const auto job = makeJob();
        std::atomic<int> started{0};
        const auto start = [&] {
            if (job->requestStateChange(RequestedStateStart, utils::Time()) == 0) ++started;
        };
        std::vector<std::function<void()>> operations = {
            [&] { job->refresh(); },
            [&] { job->getFlashImage(); },
            [&] { job->getFlashImageSize(); },
            [&] { job->getJobState(); },
            [&] { job->getPercentComplete(); },
            [&] { job->setLastError(7, "a text that is long enough to be allocated"); },
            [&] { job->threadControl(ThreadTerminate, 0); },
            start,
            start,
        };
        test::together(operations);
        EXPECT_EQ(started, 1);
        while (!job->threadControl(ThreadDispose, 0))
            utils::Thread::msleep(2);
        operations.resize(6);
        operations.emplace_back([&] { job->setJobState(JobStateException); });
        test::together(operations);
    }
}

TEST_F(ConcreteJobTest, IsReadWithoutTheOthers) {
    const core::CimPath first = *install(goodImage(), "eth0").job;
    waitForEnd(first);
    m_backend->hold("writeFlashImage");
    const core::CimPath second = *install(goodImage(), "eth0").job;
    m_backend->waitUntilHeld();
    test::SyslogCapture::clear();
    EXPECT_EQ(state(m_requests.getInstance(second)), JobStateRunning);
    EXPECT_TRUE(test::SyslogCapture::says("Refreshing job: FirmwareUpdate@Job#2"));
    EXPECT_FALSE(test::SyslogCapture::contains("Job#1"));
    m_backend->letGo();
    EXPECT_EQ(state(waitForEnd(second)), JobStateCompleted);
}

TEST_F(ConcreteJobTest, ReadsTargetTypesFromTheOptions) {
    using enum FirmwareType;
    const std::tuple<std::vector<std::uint16_t>, std::vector<std::string>, std::vector<FirmwareType>>
        table[] = {
            {{5}, {"IMG_PXE"}, {}},
            {{32768}, {" IMG_PXE\t+ IMG_UEFI "}, {PXE, UEFI}},
            {{32768}, {"IMG_UEFI+IMG_PXE+IMG_UEFI"}, {UEFI, PXE, UEFI}},
            {{32768}, {"IMG_PXE+"}, {PXE, None}},
            {{32768}, {""}, {None}},
            {{5, 32768}, {"IMG_PXE"}, {}},
            {{32768, 5, 32768}, {"IMG_CLP", "x", "IMG_FCoE+IMG_iSCSI"}, {CLP, FCoE, iSCSI}},
            {{32768, 32768}, {"IMG_CLP"}, {CLP}},  // the second has no value
        };
    for (auto [options, values, types] : table)
        EXPECT_EQ(Quenx_ConcreteJob::getTargetTypes(options, values), types);
    EXPECT_TRUE(test::SyslogCapture::says("Return result[3]=%d"));
}

TEST_F(ConcreteJobTest, IsAllThatCanBeDeletedAndFlashesOn) {
    auto& registry = static_cast<Quenx_ConcreteJobClass&>(
        *utils::Singleton<ConcreteJobFactory>::getInstance()->getCimClass());
    for (core::CimPath path : {port("eth0"), core::CimPath(std::string("!"))})
        EXPECT_EQ(registry.DeleteInstance(path), 90);
    EXPECT_THROW(m_requests.deleteInstance(service()), core::CimError);

    m_backend->hold("writeFlashImage");
    core::CimPath running = *install(goodImage(), "eth0").job;
    core::CimPath elsewhere = running;
    elsewhere.setNamespace("root/other");
    EXPECT_THROW(m_requests.deleteInstance(elsewhere), core::CimError);
    EXPECT_EQ(registry.DeleteInstance(running), 0);
    EXPECT_EQ(registry.DeleteInstance(running), 90);
    for (const core::CimPath& path : {elsewhere, running})
        EXPECT_TRUE(test::SyslogCapture::says(
            "Quenx_ConcreteJobe_Provider.DeleteInstance: instance not found '" + path.toString() + "' (%s)"));
    EXPECT_TRUE(m_requests.enumerateInstances("Quenx_ConcreteJob").empty());
    // The adapter stays claimed until the flash has ended.
    EXPECT_EQ(install(goodImage(), "eth1").returnValue, 2U);
    EXPECT_EQ(claim(), "eth0");
    m_backend->letGo();
    core::drainReaper([] {});
    EXPECT_EQ(claim(), "");
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 2, IMG_UEFI 1");
    EXPECT_TRUE(install(goodImage(), "eth0").job->toString().ends_with("#3\"")) << "refused requests count";
}

}  // namespace
