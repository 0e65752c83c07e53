// SPDX-License-Identifier: Apache-2.0
#include <gtest/gtest.h>

#include <thread>

#include "Framework/Classes/InstanceLifetime.h"
#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"

namespace {

using test::CallResult;

class JobRegistryTest : public test::UpdateTest {
  protected:
    static Quenx_ConcreteJobClass& registry() {
        return *static_cast<Quenx_ConcreteJobClass*>(
            utils::Singleton<ConcreteJobFactory>::getInstance()->getCimClass());
    }

    int verify(const std::string& adapter) const {
        std::vector<std::uint16_t> options = {5};
        std::vector<std::string> values;
        Quenx_ConcreteJob* job = nullptr;
        const int result = registry().verifyOrCreateNewJob(adapter, m_uri, options, values, job, false);
        EXPECT_EQ(job, nullptr);
        return result;
    }

    const std::string m_uri = goodImage();
};

TEST_F(JobRegistryTest, TheConfigurationDecidesWhetherACheckGivesTheClaimBack) {
    for (const bool releases : {false, true}) {
        SCOPED_TRACE(releases);
        m_folder.write("quenx.conf", releases ? "ReleaseClaimAfterCheck = 1\n" : "\n");
        setClaim("");
        EXPECT_EQ(verify("eth0"), VerifyJobResult::Success);
        EXPECT_EQ(claim(), releases ? "" : "eth0");
        // A refusal never gives back what another request has taken.
        setClaim("eth0");
        EXPECT_EQ(verify("eth0"), VerifyJobResult::TargetInUse);
        EXPECT_EQ(verify("eth1"), VerifyJobResult::JobIsRunning);
        EXPECT_EQ(claim(), "eth0");
    }
}

TEST_F(JobRegistryTest, AnAdapterApiThatThrowsKeepsTheClaimWhateverTheType) {
    struct Row {
        std::function<void()> raise;
        int code;
        const char* line;
    };
    for (const Row& row : std::vector<Row>{
             {[] { throw std::runtime_error("broken"); }, VerifyJobResult::UnspecifiedError, ""},
             {[] { throw utils::Exception(std::string("of its own")); }, VerifyJobResult::UnspecifiedError,
              ""},
             {[] { throw utils::EUnspecifiedError("odd"); }, VerifyJobResult::UnspecifiedError, "Error:odd'"},
             {[] { throw utils::EInvalidParameter("odd"); }, VerifyJobResult::InvalidParameter, "ter:odd'"},
             {[] { throw EDowngradeDetected("odd"); }, VerifyJobResult::DowngradeDetected, "ed:odd'"},
         }) {
        m_backend->hook = [&](const std::string& operation, const std::string&) {
            if (operation == "prepareFlashImage") row.raise();
        };
        for (const bool releases : {false, true}) {
            SCOPED_TRACE(std::to_string(row.code) + row.line + (releases ? ", released" : ", kept"));
            m_folder.write("quenx.conf",
                           releases ? "ReleaseClaimAfterCheck=1\n" : "ReleaseClaimAfterCheck=0\n");
            setClaim("");
            test::SyslogCapture::clear();
            EXPECT_EQ(verify("eth0"), row.code);
            EXPECT_EQ(claim(), releases ? "" : "eth0");
            EXPECT_EQ(test::SyslogCapture::contains("Exception: '"), *row.line != '\0');
            EXPECT_TRUE(test::SyslogCapture::contains(row.line));
        }
    }
}

TEST_F(JobRegistryTest, RefusedRequestsConsumeIds) {
    EXPECT_EQ(install("nonsense", "eth0").returnValue, 5U);
    const CallResult second = install(m_uri, "eth0");
    EXPECT_EQ(waitForEnd(*second.job).path.toString(),
              "root/cimv2:Quenx_ConcreteJob.InstanceID=\"Quenx:FirmwareUpdate@Job#2\"");
    EXPECT_TRUE(test::SyslogCapture::contains("Exception: 'SMASHv2:EInvalidUri:URI: nonsense is invalid'"));
}

TEST_F(JobRegistryTest, DeletesJobsAndNothingElse) {
    for (core::CimPath path : {port("eth0"), core::CimPath(std::string("!"))})
        EXPECT_EQ(registry().DeleteInstance(path), 90);
    EXPECT_THROW(m_requests.deleteInstance(service()), core::CimError);

    m_backend->hold("writeFlashImage");
    CallResult running = install(m_uri, "eth0");
    EXPECT_EQ(install(m_uri, "eth0").returnValue, 6U);
    EXPECT_EQ(registry().DeleteInstance(*running.job), 0);
    EXPECT_EQ(registry().DeleteInstance(*running.job), 90);
    EXPECT_TRUE(
        test::SyslogCapture::contains("Quenx_ConcreteJobe_Provider.DeleteInstance: instance not found '" +
                                      running.job->toString() + "' (%s)"));
    EXPECT_TRUE(m_requests.enumerateInstances("Quenx_ConcreteJob").empty());
    // The flash goes on: the adapter stays claimed until it has ended.
    EXPECT_EQ(install(m_uri, "eth1").returnValue, 2U);
    EXPECT_EQ(claim(), "eth0");
    m_backend->letGo();
    core::drainReaper();
    EXPECT_EQ(claim(), "");
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 2, IMG_UEFI 1");
}

TEST_F(JobRegistryTest, TwoRequestsAtOnceGetOneClaim) {
    for (int round = 0; round < 20; ++round) {
        int results[2] = {};
        std::thread other([&] { results[0] = verify("eth0"); });
        results[1] = verify("eth0");
        other.join();
        EXPECT_EQ(results[0] + results[1], VerifyJobResult::TargetInUse) << round;
        setClaim("");
    }
}

/// Stands in for the registry and answers with a given code.
class AnsweringRegistry : public Quenx_ConcreteJobClass {
  public:
    int verifyOrCreateNewJob(std::string, std::string, std::vector<std::uint16_t>&, std::vector<std::string>&,
                             Quenx_ConcreteJob*&, bool) override {
        if (code == kThrow) throw std::bad_alloc();
        return code;
    }
    static constexpr int kThrow = -1000;
    int code = 0;
};

TEST_F(JobRegistryTest, RareCodesHaveTheirReturnValueAndLine) {
    AnsweringRegistry registry;
    const std::string target = port("eth0").toString();
    struct Row {
        int code;
        std::uint32_t returnValue;
        std::string line;
    };
    std::vector<Row> rows = {
        {4, 2, "Unspecified Error for '" + target + "'"},
        {103, 2, "Job cannot read the URI for '" + target + "'"},
        {106, 4, "Failed to start job for '" + target + "' "},
        {AnsweringRegistry::kThrow, 4100, "Allocation error occured for '" + target + "'"}};
    for (const int success : {6, 99, 102, 107, -5})
        rows.push_back({success, 4096, "Creation of new job returns: " + std::to_string(success)});
    for (const Row& row : rows) {
        registry.code = row.code;
        const CallResult result = install("file:///x", "eth0");
        EXPECT_EQ(result.returnValue, row.returnValue) << row.code;
        EXPECT_FALSE(result.job);
        EXPECT_TRUE(logged(row.line)) << row.code;
    }
}

TEST_F(JobRegistryTest, AMissingRegistryIsAnError) {
    {
        const ConcreteJobFactory nothing(nullptr);
        const std::string error = install("file:///x", "eth0").error;
        EXPECT_TRUE(
            error.starts_with("SMASHv2:src/Providers/SoftwareUpdate/Quenx_SoftwareInstallationService.cpp:"))
            << error;
        EXPECT_NE(error.find("Assertion failed: 'cimclass != __null'"), std::string::npos) << error;
    }
    m_agent.reset();
    EXPECT_THROW(utils::Singleton<ConcreteJobFactory>::getInstance(), utils::Exception);
    EXPECT_TRUE(test::SyslogCapture::contains("No singleton instance found for ConcreteJobFactory"));
}

}  // namespace
