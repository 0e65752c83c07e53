// SPDX-License-Identifier: Apache-2.0
// The three methods on one inventory: the files of the test's folder are the identities.
#include <gtest/gtest.h>

#include <map>
#include <numeric>
#include <set>

#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/RequestScope.h"
#include "Framework/Requests/PolicyDecision.h"
#include "Framework/Requests/UpdateSink.h"
#include "MidAPI/Image/RomFormat.h"
#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_PortController.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareUpdate/Quenx_ConcreteJobClass.h"
#include "Providers/SoftwareUpdate/UpdateTest.h"
#include "Support/TestRoms.h"
#include "Utils/Os/Linux/PolicyFile.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace {

using core::CimPath;
using test::CallResult;
using test::madeRom;
using enum utils::FirmwareType;
using Codes = std::vector<std::uint16_t>;
using Texts = std::vector<std::string>;

const std::string kInstall = "InstallFromURI; URI=<good>; Target=<eth0>; InstallOptions=";
const std::string kInstallIdentity =
    "InstallFromSoftwareIdentity; Source=<image>; Target=<eth0>; InstallOptionsValues=; InstallOptions=";
const std::string kCheck = "CheckSoftwareIdentity; Source=<image>; Target=";

/// A history that fails when it is asked, or later.
class FailingSink : public core::UpdateSink {
  public:
    std::future<core::ImageFacts> examine(std::span<const std::uint8_t>) noexcept override { return {}; }
    void refused(const core::UpdateAttempt& attempt, unsigned int returnValue, core::ReasonId reason,
                 const std::string& text) noexcept override {
        said += attempt.caller.principal + " " + attempt.adapter + " " + attempt.uri + " " +
                std::to_string(attempt.options.size()) + " " + std::to_string(returnValue) + " " +
                core::reasonCode(reason) + ": " + text + "\n";
    }
    std::string problem() override { return m_problem; }
    std::shared_ptr<core::UpdateRecord> begin(const core::UpdateAttempt&) noexcept override { return {}; }

    std::string m_problem = "the disk is full";
    std::string said;
};

class MethodsTest : public test::UpdateTest {
  protected:
    MethodsTest() {
        m_names["folder"] = m_folder.path();
        m_names["good"] = goodImage();
        file("older.rom", madeRom({{PXE, 0}, {UEFI, 0}}));
        file("other-card.rom", madeRom({{PXE, 1}, {UEFI, 1}}, 0x10ec, 0x8139));
        file("empty", {});
        auto foreign = madeRom({{PXE, 2}});
        foreign[foreign[ma::rom::kHeaderDataStructure] + ma::rom::kPcirCodeType] =
            ma::rom::CodeType::OpenFirmware;
        const std::string typeless = file("foreign.rom", foreign);
        const std::pair<const char*, CimPath> paths[] = {
            {"eth0", m_port},
            {"eth1", port("eth1")},
            {"controller", m_requests.enumerateInstanceNames("Quenx_PortController").at(0)},
            {"service", service()},
            {"image", identityOf(m_names["good"])},
            {"typeless", identityOf(typeless)},
            {"installed", CimPath("Quenx_SoftwareIdentity", {{"InstanceID", "Quenx:eth0:IMG_PXE"}})},
        };
        for (const auto& [name, path] : paths)
            m_names[name] = path.toString();
        CimPath elsewhere = m_port;
        elsewhere.setNamespace("root/other");
        m_names["elsewhere"] = elsewhere.toString();
    }

    CimPath identityOf(const std::string& uri) const {
        for (const core::InstanceValue& resource :
             m_requests.enumerateInstances("Quenx_SoftwareIdentityResource")) {
            if (text(resource, "AccessInfo") != uri) continue;
            const std::string id = text(resource, "InstanceID");  // with @ and more behind the identity's
            return CimPath("Quenx_SoftwareIdentity", {{"InstanceID", id.substr(0, id.find('@'))}});
        }
        ADD_FAILURE() << "no identity for " << uri;
        return {};
    }
    /// With what the names in angle brackets stand for.
    std::string expanded(std::string text) const {
        for (std::size_t begin = 0; (begin = text.find('<')) != std::string::npos;) {
            const std::size_t length = text.find('>', begin) - begin;
            text.replace(begin, length + 1, m_names.at(text.substr(begin + 1, length - 1)));
        }
        return text;
    }
    CallResult make(const std::string& line) const {
        const std::string text = expanded(line);
        return call(text.substr(0, text.find_first_of(" ;")), text.substr(text.find("; ") + 2));
    }
    /// The return value, with the job ended and the claim given back.
    std::uint32_t outcome(const std::string& line) const {
        const CallResult result = make(line);
        if (result.job) waitForEnd(*result.job);
        setClaim("");
        return result.returnValue;
    }
    /// A call, its outcome and its lines as in the sample.
    void expect(const Texts& row) {
        SCOPED_TRACE(row[0]);
        const std::size_t blank = std::min(row.at(1).find(' '), row[1].size());
        const std::string value = row[1].substr(0, blank);
        const bool throws = value == "throws";
        const bool starts = value == "4096";
        const std::string claimed = row[0].find(" beside eth0;") != std::string::npos ? "eth0" : "";
        test::SyslogCapture::clear();
        setClaim(claimed);
        const CallResult result = make(row[0]);
        for (const std::string& line : test::SyslogCapture::messages("error"))
            m_errors.insert(line + "\n");
        EXPECT_EQ(core::reasonCode(result.reason), utils::trim(row[1].substr(blank)));
        EXPECT_EQ(result.error, throws ? "SMASHv2:" + row.at(2) : "");
        EXPECT_TRUE(throws || std::to_string(result.returnValue) == value) << result.returnValue;
        for (std::size_t i = 2; i < row.size(); ++i)
            EXPECT_TRUE(m_log.contains("\"" + expanded(row[i]) + "\" (")) << row[i];
        EXPECT_FALSE(row.size() == 2 && !starts && m_log.contains("Firmware Update"));

        EXPECT_EQ(result.characteristics, value == "0" ? "7" : "");
        EXPECT_EQ(result.job.has_value(), starts);
        if (result.job) {
            EXPECT_EQ(state(waitForEnd(*result.job)), JobStateCompleted);
            m_requests.deleteInstance(*result.job);
        }
        EXPECT_EQ(claim(), value == "0" ? "eth0" : claimed);
        EXPECT_TRUE(m_requests.enumerateInstances("Quenx_ConcreteJob").empty());
    }
    /// The answer of the check in process, which leaves alone an update that runs.
    std::uint32_t checkImage(const CimPath& target, const Codes& options) const {
        const std::string served = "root/cimv2";
        const core::RequestScope scope(served);
        CimPath path = service();
        setClaim("eth1");
        auto* instance = core::GetCimBroker()->getInstanceByPath(path);
        const auto found =
            dynamic_cast<update::ImageCheck&>(*instance).checkImage(m_names.at("good"), target, options, {});
        EXPECT_EQ(claim(), "eth1");
        return found;
    }

    /// What was said of refusals, to the history and in the log, is that of the sample.
    void expectSaid(const std::string& said, const std::string& sample) const {
        std::string text = std::accumulate(m_errors.begin(), m_errors.end(), said);
        for (const auto& [own, shown] :
             {std::pair(m_folder.path(), "<folder>"), {"SystemName=\"" + os::getHostname() + '"', "<host>"}})
            for (std::size_t at = 0; (at = text.find(own)) != std::string::npos;)
                text.replace(at, own.size(), shown);
        const auto expected = test::readTestFile(QUENX_UPDATE_SAMPLES "/" + sample);
        EXPECT_EQ(text, std::string(expected.begin(), expected.end()));
    }

    const CimPath m_port = port("eth0");
    std::map<std::string, std::string> m_names;
    std::set<std::string> m_errors;  // lines of the log
};

TEST_F(MethodsTest, AnswerEachCallWithItsValueLineJobAndClaim) {
    const auto sink = std::make_shared<FailingSink>();
    const core::InstalledSink installed(sink);
    for (const Texts& row : test::readTestTable(QUENX_UPDATE_SAMPLES "/calls"))
        expect(row);
    expectSaid(sink->said, "calls-refused");
    // The controller stood for the first of its ports.
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 2, IMG_UEFI 1");
    EXPECT_EQ(test::componentsOf("eth1"), "IMG_PXE 1, IMG_UEFI 0");
    EXPECT_EQ(checkImage(m_port, {3}), 5U);
    EXPECT_EQ(checkImage(service(), {5}), 4106U);
}

TEST_F(MethodsTest, DecideByTheStatusOfThePreparation) {
    const auto sink = std::make_shared<FailingSink>();
    const core::InstalledSink installed(sink);
    for (Texts row : test::readTestTable(QUENX_UPDATE_SAMPLES "/statuses")) {
        const Texts words = utils::split(row[0], ' ');
        const Codes options = words.at(1) == "forced" ? Codes{5, 3} : Codes{5};
        const utils::SMASHv2Config config(
            m_folder.write("policy.conf", words.at(2) == "forbids" ? "OEMCustomizeable=5\n" : ""));
        m_backend->prepareStatus = std::stoi(words[0]);
        row[0] = kInstall + (options.size() == 2 ? "5,3" : "5");
        expect(row);
        EXPECT_EQ(checkImage(m_port, options), row[1] == "4096" ? 0 : std::stoul(row[1]));
    }
    expectSaid(sink->said, "statuses-refused");
}

TEST_F(MethodsTest, ACheckGivesTheClaimBackWhereTheConfigurationSaysSo) {
    m_folder.write("quenx.conf", "ReleaseClaimAfterCheck = 1\nFWFilePath=" + m_folder.path() + "\n");
    EXPECT_EQ(make(kCheck + "<eth0>").returnValue, 0U);
    EXPECT_EQ(claim(), "");
    // A refusal never gives back what another request has taken.
    setClaim("eth0");
    EXPECT_EQ(make(kCheck + "<eth0>").returnValue, 6U);
    EXPECT_EQ(make(kCheck + "<eth1>").returnValue, 2U);
    EXPECT_EQ(claim(), "eth0");
}

TEST_F(MethodsTest, WhatCannotBeLookedUpIsNotFound) {
    // The controller is found, and then its ports are not.
    int enumerations = 0;
    m_backend->hook = [&](const std::string& operation) {
        if (operation == "enumerateAdapters" && ++enumerations == 2) throw std::runtime_error("gone");
    };
    EXPECT_EQ(outcome("InstallFromURI; URI=<good>; Target=<controller>; InstallOptions=5"), 5U);
    EXPECT_TRUE(m_log.contains("Firmware Update does not support instance '"));
    // The identity is found, and then its file is gone.
    test::SyslogCapture::observe([this](const std::string& line) {
        if (line.find("@Quenx_SoftwareIdentityResource.cpp") != std::string::npos)
            std::filesystem::remove(m_folder / "good.rom");
    });
    EXPECT_EQ(outcome(kInstallIdentity + "5"), 5U);
    test::SyslogCapture::observe(nullptr);
    EXPECT_TRUE(m_log.contains("\"Could not obtain URI from the SoftwareIdentityResource ("));
}

TEST_F(MethodsTest, WhatIsAdvertisedWorksAndWhatIsNotIsRefused) {
    const auto capabilities =
        m_requests.enumerateInstances("Quenx_SoftwareInstallationServiceCapabilities").at(0);
    // Options, each together with 5.
    const std::string advertised = "," + text(capabilities, "SupportedInstallOptions") + ",";
    for (int step = 0; step <= 20; ++step) {
        const std::string option = std::to_string(step == 20 ? 32768 : step);
        const bool isAdvertised = advertised.find("," + option + ",") != std::string::npos;
        // Unknown codes pass unadvertised.
        const bool passes = isAdvertised || step < 2 || step >= 13;
        EXPECT_EQ(outcome(kInstall + "5," + option + "; InstallOptionsValues=IMG_PXE,IMG_PXE"),
                  passes ? 4096U : 5U)
            << option;
        // The identity method supplies 32768 itself and refuses it from the client.
        EXPECT_EQ(outcome(kInstallIdentity + "5," + option), passes && step != 20 ? 4096U : 5U) << option;
    }
}

/// Sits elsewhere than the ports that it holds: eth0 and eth1.
class OtherController : public CIM_PortController, public inventory::PortController {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_PortController", &CIM_PortController::classInfo};
    static inline bool isFailing = false;

    OtherController() {
        for (auto* key : {&SystemCreationClassName, &SystemName, &CreationClassName, &DeviceID, &Name})
            *key = "other";
    }
    std::string getClassName() const override { return classInfo.name; }
    void refresh() {}
    utils::PCIAddr getPCIAddress() const override { return {0x40, 0, 0, true, ""}; }
    bool holds(const utils::PCIAddr& address) const override {
        if (isFailing) throw std::runtime_error("out of order");
        return address.bus == 3;
    }
};

class OtherAgent : public core::CimAgent {
  public:
    OtherAgent() : CimAgent("Other") {
        core::GetCimBroker()->addAgent(this);
        m_classes.add(new SingletonClass<OtherController>("Other", __FILE__, __LINE__));
    }
    ~OtherAgent() override { leaveBroker(); }
};

/// Beside a controller that another provider serves.
class SiblingsTest : public test::UpdateTest {
  protected:
    ~SiblingsTest() override { OtherController::isFailing = false; }

    const OtherAgent m_other;
    const core::CimPath m_controller = pathNamed("Quenx_PortController", "other");
};

TEST_F(SiblingsTest, WhatTheyThrowIsAnUnspecifiedError) {
    OtherController::isFailing = true;
    const test::CallResult result = install(goodImage(), m_controller);
    EXPECT_EQ(result.returnValue, MethodReturn::UnspecifiedError);
    EXPECT_EQ(result.reason, core::ReasonId::LookUpFailed);
    EXPECT_EQ(result.error, "");
    EXPECT_TRUE(test::SyslogCapture::says("Unspecified Error for '" + m_controller.toString() + "'"));
    EXPECT_EQ(claim(), "");
}

TEST_F(SiblingsTest, AControllerIsAskedWhatItHoldsWhereverItSits) {
    waitForEnd(*install(goodImage(), m_controller).job);
    EXPECT_EQ(test::componentsOf("eth0"), "IMG_PXE 2, IMG_UEFI 1");
    const auto affected = [this](const char* association) {
        std::size_t count = 0;
        for (const core::InstanceValue& each : m_requests.enumerateInstances(association))
            count += text(each, "AffectedElement") == m_controller.toString() ? 1U : 0U;
        return count;
    };
    EXPECT_EQ(affected("Quenx_AffectedJobElement"), 1U);
    EXPECT_EQ(affected("Quenx_ServiceAffectsElement"), 1U);
}

TEST_F(MethodsTest, AsksThePolicyBeforeAnythingIsClaimed) {
    const std::string install = expanded(kInstall + "5");
    const auto errorFor = [&](core::Caller caller) {
        const core::CallerScope scope(std::move(caller));
        const CallResult result = call("InstallFromURI", install.substr(install.find(';') + 2));
        if (!result.error.empty()) {
            EXPECT_EQ(claim(), "");
            CimPath none("Quenx_ConcreteJob", {{"InstanceID", "none"}});
            EXPECT_THROW(Quenx_ConcreteJobClass().DeleteInstance(none), core::CimError);
        } else {
            waitForEnd(*result.job);
            deleteJobs();
        }
        return result.error;
    };
    const std::string file = m_folder.write("policy.toml", "administrators = [\"alice\"]\n");
    const char* const machines = utils::systemPolicyFile.exchange(file.c_str());
    // This process has no session, so it cannot tell whom to obey.
    EXPECT_EQ(errorFor({"alice"}), "nothing can be installed or deleted here: there is a policy, " + file +
                                       ", and the program that loaded this provider cannot obey it; use "
                                       "quenxctl, quenx-cimd or libQuenx_Cmpi.so");
    utils::systemPolicyFile = machines;
    utils::PolicyFile policy(file);
    EXPECT_EQ(errorFor({"alice"}), "");
    EXPECT_EQ(errorFor({.principal = "quenx-cimd", .isFront = true}), "");
    const std::string place = "\"administrators\" in " + file + ", line 1, ";
    EXPECT_EQ(errorFor({"bob"}), "user \"bob\" may only read: " + place + "has no such name");
    EXPECT_EQ(errorFor({}), "a caller without a name may only read: " + place + "is set");
    m_folder.write("policy.toml", "\n\nadministrators = [\"alice\", 5]\n");
    EXPECT_EQ(errorFor({"alice"}),
              "nothing can be installed or deleted until the policy is mended: " + file +
                  ", line 3: the policy: \"administrators\" must be a list of user names, such as "
                  "[\"root\", \"alice\"]");
    EXPECT_FALSE(m_requests.enumerateInstances("Quenx_EthernetPort").empty());
}

TEST_F(MethodsTest, InstallsNothingWithoutTheHistoryThatThePolicyRequires) {
    const utils::PolicyFile policy(m_folder.write("policy.toml", "history = \"required\"\n"));
    const core::CallerScope scope({.principal = "alice"});
    const auto expectRefused = [&] {
        EXPECT_EQ(install(goodImage(), "eth0").returnValue, MethodReturn::UnspecifiedError);
        EXPECT_EQ(claim(), "");
        EXPECT_TRUE(m_requests.enumerateInstances("Quenx_ConcreteJob").empty());
    };
    expectRefused();
    const std::string text = "The policy requires a history of updates, and none can be written: ";
    EXPECT_TRUE(test::SyslogCapture::says(text + "this program keeps none"));
    const auto sink = std::make_shared<FailingSink>();
    std::optional<core::InstalledSink> installed(sink);
    expectRefused();
    sink->m_problem.clear();
    expectRefused();
    const std::string each = "alice eth0 " + goodImage() + " 1 2 QX-0503: " + text;
    EXPECT_EQ(sink->said, each + "the disk is full\n" + each + "its record was not written in time\n");
    m_folder.write("policy.toml", "history = \"off\"\n");
    EXPECT_EQ(install("file:///none", "eth0").returnValue, MethodReturn::InvalidParameter);
    m_folder.write("policy.toml", "history = \"wanted\"\n");
    waitForEnd(*install(goodImage(), "eth0").job);
    EXPECT_EQ(std::ranges::count(sink->said, '\n'), 2);
}

}  // namespace
