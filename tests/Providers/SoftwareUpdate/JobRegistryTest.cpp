#include <gtest/gtest.h>

#include <thread>

#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Providers/SoftwareUpdate/VerifyJobResult.h"

namespace {

using test::CallResult;

class JobRegistryTest : public test::UpdateTest {
  protected:
    static Quenx_ConcreteJobClass& registry() {
        return *static_cast<Quenx_ConcreteJobClass*>(
            utils::Singleton<ConcreteJobFactory>::getInstance()->getCimClass());
    }

    int verify(const std::string& adapter, const std::string& uri) {
        std::vector<unsigned short> options = {5};
        std::vector<std::string> values;
        Quenx_ConcreteJob* job = nullptr;
        const int result = registry().verifyOrCreateNewJob(adapter, uri, options, values, job, false);
        EXPECT_EQ(job, nullptr);
        return result;
    }
    int verify(const std::string& adapter) { return verify(adapter, goodImage()); }
};

TEST_F(JobRegistryTest, ACheckLeavesTheAdapterClaimed) {
    EXPECT_EQ(verify("eth0"), VerifyJobResult::Success);
    EXPECT_EQ(claim(), "eth0");
    EXPECT_EQ(verify("eth0"), VerifyJobResult::TargetInUse);
    EXPECT_EQ(verify("eth1"), VerifyJobResult::JobIsRunning);
    EXPECT_EQ(install(goodImage(), "eth0").returnValue, 6U);
    EXPECT_EQ(claim(), "eth0");
}

TEST_F(JobRegistryTest, TheConfigurationCanGiveTheClaimBack) {
    m_folder.write("quenx.conf", "ReleaseClaimAfterCheck = 1\n");
    EXPECT_EQ(verify("eth0"), VerifyJobResult::Success);
    EXPECT_EQ(claim(), "");
    // Neither a success nor a failure gives back what another request has taken.
    Quenx_ConcreteJob::m_servicedAdapter = std::string("eth0");
    EXPECT_EQ(verify("eth0"), VerifyJobResult::TargetInUse);
    EXPECT_EQ(verify("eth1"), VerifyJobResult::JobIsRunning);
    EXPECT_EQ(claim(), "eth0");
}

TEST_F(JobRegistryTest, AFailureThatIsNoRefusalKeepsTheClaim) {
    m_backend->hook = [](const std::string& operation, const std::string&) {
        if (operation == "prepareFlashImage") throw std::runtime_error("broken");
    };
    EXPECT_EQ(verify("eth0"), VerifyJobResult::UnspecifiedError);
    EXPECT_FALSE(test::SyslogCapture::contains("Exception: '"));
    EXPECT_EQ(claim(), "eth0");
    Quenx_ConcreteJob::m_servicedAdapter = std::string();
    EXPECT_EQ(install(goodImage(), "eth0").returnValue, 2U);
    EXPECT_EQ(claim(), "eth0");

    m_folder.write("quenx.conf", "ReleaseClaimAfterCheck=1\n");
    Quenx_ConcreteJob::m_servicedAdapter = std::string();
    EXPECT_EQ(install(goodImage(), "eth0").returnValue, 2U);
    EXPECT_EQ(claim(), "");
}

TEST_F(JobRegistryTest, RefusedRequestsConsumeIds) {
    EXPECT_EQ(install("nonsense", "eth0").returnValue, 5U);
    EXPECT_EQ(install("file:///missing", "eth0").returnValue, 5U);
    const CallResult third = install(goodImage(), "eth0");
    waitForEnd(*third.job);
    EXPECT_EQ(third.job->toString(),
              "root/cimv2:Quenx_ConcreteJob.InstanceID=\"Quenx:FirmwareUpdate@Job#3\"");
    EXPECT_TRUE(test::SyslogCapture::contains("Exception: 'SMASHv2:EInvalidUri:URI: nonsense is invalid'"));
}

TEST_F(JobRegistryTest, DeletesJobsAndNothingElse) {
    core::CimPath port0 = port("eth0");
    core::CimPath nothing(std::string("!"));
    EXPECT_EQ(registry().DeleteInstance(port0), 90);
    EXPECT_EQ(registry().DeleteInstance(nothing), 90);
    EXPECT_THROW(m_requests.deleteInstance(service()), core::CimError);

    m_backend->hook = [](const std::string& operation, const std::string&) {
        if (operation == "writeFlashImage") utils::Thread::msleep(150);
    };
    CallResult running = install(goodImage(), "eth0");
    EXPECT_EQ(registry().DeleteInstance(*running.job), 0);
    EXPECT_EQ(registry().DeleteInstance(*running.job), 90);
    EXPECT_TRUE(m_requests.enumerateInstances("Quenx_ConcreteJob").empty());
    // The flash goes on: the adapter stays claimed until it has ended.
    EXPECT_EQ(claim(), "eth0");
    while (!claim().empty())
        utils::Thread::msleep(2);
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 2, IMG_UEFI 1");
}

TEST_F(JobRegistryTest, TwoRequestsAtOnceGetOneClaim) {
    const std::string uri = goodImage();
    for (int round = 0; round < 20; ++round) {
        int results[2] = {};
        std::thread other([&] { results[0] = verify("eth0", uri); });
        results[1] = verify("eth0", uri);
        other.join();
        EXPECT_EQ(results[0] + results[1], VerifyJobResult::TargetInUse) << round;
        Quenx_ConcreteJob::m_servicedAdapter = std::string();
    }
}

/// Stands in for the registry and answers with a given code.
class AnsweringRegistry : public Quenx_ConcreteJobClass {
  public:
    int verifyOrCreateNewJob(std::string, std::string, std::vector<unsigned short>& options,
                             std::vector<std::string>& values, Quenx_ConcreteJob*&, bool) override {
        if (code == kThrow) throw std::bad_alloc();
        seenOptions = options;
        seenValues = values;
        return code;
    }
    static constexpr int kThrow = -1000;
    int code = 0;
    std::vector<unsigned short> seenOptions;
    std::vector<std::string> seenValues;
};

TEST_F(JobRegistryTest, EveryCodeHasItsReturnValueAndLine) {
    AnsweringRegistry registry;
    const std::string target = port("eth0").toString();
    struct Row {
        int code;
        unsigned returnValue;
        std::string line;
    };
    for (const Row& row : std::vector<Row>{
             {0, 4096, ""},
             {1, 5, "Job creation returned Invalid Parameter for '" + target + "'"},
             {2, 4097, "Target is not supported by service for '" + target + "'"},
             {3, 4099,
              "Downgrade is not supported by service for '" + target + "'. Execute with FORCE INSTALL flag."},
             {4, 2, "Unspecified Error for '" + target + "'"},
             {5, 4106, "Not applicable for target for '" + target + "' "},
             {6, 4096, ""},
             {99, 4096, ""},
             {100, 5, "Invalid URI for '" + target + "'"},
             {101, 5, "URI does not exists for '" + target + "'"},
             {102, 4096, ""},
             {103, 2, "Job cannot read the URI for '" + target + "'"},
             {104, 2, "Other job is in progress '" + target + "'"},
             {105, 6, "Target '" + target + "' is in update state at this moment"},
             {106, 4, "Failed to start job for '" + target + "' "},
             {107, 4096, ""},
             {-5, 4096, ""},
             {AnsweringRegistry::kThrow, 4100, "Allocation error occured for '" + target + "'"},
         }) {
        registry.code = row.code;
        test::SyslogCapture::clear();
        const CallResult result = install("file:///x", "eth0", {5, 3}, {"a", "b"});
        EXPECT_EQ(result.returnValue, row.returnValue) << row.code;
        EXPECT_FALSE(result.job);
        EXPECT_TRUE(row.line.empty() || logged(row.line)) << row.code;
        EXPECT_EQ(logged("Creation of new job returns: " + std::to_string(row.code)),
                  row.code != AnsweringRegistry::kThrow);
    }
    EXPECT_EQ(registry.seenOptions, (std::vector<unsigned short>{5, 3}));
    EXPECT_EQ(registry.seenValues, (std::vector<std::string>{"a", "b"}));
}

TEST_F(JobRegistryTest, AMissingRegistryIsAnError) {
    {
        const ConcreteJobFactory nothing(nullptr);
        const std::string error = install("file:///x", "eth0").error;
        EXPECT_EQ(error.find("SMASHv2:src/Providers/SoftwareUpdate/Quenx_SoftwareInstallationService.cpp:"),
                  0U)
            << error;
        EXPECT_NE(error.find("Assertion failed: 'cimclass != __null'"), std::string::npos) << error;
    }
    const core::CimPath port0 = port("eth0");
    m_agent.reset();
    EXPECT_THROW(utils::Singleton<ConcreteJobFactory>::getInstance(), utils::Exception);
    EXPECT_TRUE(test::SyslogCapture::contains("No singleton instance found for ConcreteJobFactory"));
}

}  // namespace
