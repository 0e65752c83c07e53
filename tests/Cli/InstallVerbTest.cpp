// SPDX-License-Identifier: Apache-2.0
// What a service does to quenxctl that the simulated adapters do not.
#include <gtest/gtest.h>

#include <deque>
#include <map>
#include <sstream>

#include "Cli/Update/Card.h"
#include "Cli/Update/Targets.h"
#include "Cli/Verbs/Verbs.h"
#include "Framework/Requests/CimRequests.h"
#include "History/History.h"
#include "MidAPI/Simulator/Simulator.h"
#include "MidAPI/ma.h"
#include "Support/TempFolder.h"
#include "Support/TestRoms.h"

namespace {

using cli::ExitStatus;
using core::CimPath;
using core::CimType;
using core::CimValue;
using core::InstanceValue;
using core::PropertyFilter;
using Instances = std::vector<InstanceValue>;

core::PropertyValue texts(const std::string& name, const std::vector<std::string>& values) {
    return {name, CimValue::arrayOf(CimType::String, {values.begin(), values.end()}), false, {}};
}

core::PropertyValue number(const std::string& name, std::uint64_t value) {
    return {name, CimValue::of(CimType::Uint32, value), false, {}};
}

InstanceValue component(const std::string& type, std::uint64_t version) {
    return {CimPath("Quenx_SoftwareIdentity.InstanceID=\"" + type + "\""),
            {texts("TargetTypes", {type}), number("MajorVersion", version)}};
}

InstanceValue job(std::uint64_t state, std::uint64_t percent) {
    return {CimPath("Quenx_ConcreteJob.InstanceID=\"1\""),
            {number("JobState", state), number("PercentComplete", percent)}};
}

const Instances kOld = {component("IMG_PXE", 1), component("IMG_UEFI", 0)};
const Instances kNew = {component("IMG_PXE", 2), component("IMG_UEFI", 1)};
constexpr const char* kUpdated = "eth0 was updated.\n  IMG_PXE   1 -> 2\n  IMG_UEFI  0 -> 1\n";

/// One adapter, 1af4:1041, and a service that answers as it is told.
class FakeService : public core::CimRequests {
  public:
    Instances installed = kOld;
    Instances installedAfterJob = kNew;
    std::deque<InstanceValue> jobs = {job(3, 0), job(4, 40), job(7, 100)};  ///< one a look
    unsigned unanswered = 0;                                                ///< so many looks get no answer
    bool isCalled = false;
    bool needsJob = true;
    bool answersTheCall = true;
    bool hasMemory = true;
    std::string jobNamespace;
    bool isSilent = false;   ///< the adapter does not answer
    bool isReadable = true;  ///< what is installed, after the job
    std::string resetNeeded = "None";
    std::string updateState;
    Instances images;           ///< of the inventory, with where they are
    std::uint32_t refusal = 0;  ///< what the service answers in place of a job

    FakeService() : CimRequests("") {}
    Instances enumerateInstances(const std::string& className, const PropertyFilter&) override {
        if (className == "Quenx_ConcreteJob") return {jobs.begin(), jobs.end()};
        if (className.starts_with("Quenx_SoftwareIdentity")) return images;
        if (className != "Quenx_EthernetPort") return {};
        return {{CimPath("Quenx_EthernetPort.DeviceID=\"eth0\""),
                 {{"Name", CimValue::of(CimType::String, std::string("eth0")), false, {}},
                  number("EnabledState", isSilent ? 0 : 2),
                  texts("OtherIdentifyingInfo", {"1af4:1041", resetNeeded, updateState}),
                  texts("IdentifyingDescriptions",
                        {"PCI Vendor and Device ID", "Reset Needed", "Update State"})}}};
    }
    std::vector<CimPath> enumerateInstanceNames(const std::string& className) override {
        return {CimPath(className + ".Name=\"1\"")};
    }
    InstanceValue getInstance(const CimPath&, const PropertyFilter&) override {
        if (unanswered > 0) {
            --unanswered;
            throw cli::CommandError(ExitStatus::Failed, "No answer.", "Wait.");
        }
        InstanceValue view = jobs.front();
        jobs.pop_front();
        if (jobs.empty()) installed = installedAfterJob;
        return view;
    }
    Instances associators(const CimPath&, const core::AssociationFilter&, const PropertyFilter&) override {
        if (jobs.empty() && !isReadable) throw core::CimError(core::CimStatus::Failed, "gone");
        return installed;
    }
    core::MethodResult invokeMethod(const CimPath&, const std::string&,
                                    const std::vector<core::Argument>&) override {
        isCalled = true;
        if (refusal != 0) return {refusal, {}};
        if (!answersTheCall) throw cli::NoAnswer(ExitStatus::Failed, "No answer.", "Wait.");
        if (!hasMemory) throw std::bad_alloc();
        if (!needsJob) installed = installedAfterJob;
        if (!needsJob) return {0, {}};
        CimPath path = job(2, 0).path;
        path.setNamespace(jobNamespace);
        return {4096, {{"Job", CimValue::of(CimType::Reference, path)}}};
    }
};

/// A card whose backend alone knows the format of its images, and that takes a reset to run them.
class CardStub : public ma::Simulator {
  public:
    CardStub() : Simulator(std::vector<ma::AdapterDescription>{}, "") {}

    ma::ImageVerdict verdict;
    ma::ResetNeeded needed = ma::ResetNeeded::Reload;
    ma::Activation activation;
    bool mayDisrupt = false;      ///< as it was asked for
    std::uint32_t installed = 1;  ///< version of IMG_PXE

    std::optional<ma::ImageVerdict> judgeImage(const std::string&, std::span<const std::uint8_t>,
                                               const std::vector<utils::FirmwareType>&) override {
        return verdict;
    }
    utils::PCIAddr getPCIAddress(const std::string&) override { return {}; }
    ma::AdapterInfo getAdapterInfo(const std::string&) override {
        return {.components = {{utils::FirmwareType::PXE, installed}}, .resetNeeded = needed};
    }
    ma::CardUse getCardUse(const std::string&, const std::string&) override {
        return {.functions = {"eth0", "eth1"}, .interfaces = {"enp1s0"}, .bridges = {"br0"}};
    }
    ma::Activation activate(const std::string&, const ma::ActivationRequest& request) override {
        mayDisrupt = request.mayDisrupt;
        return activation;
    }
};
constexpr const char* kCard =
    "On this card:\n  functions   eth0, eth1\n  interfaces  enp1s0\n  bridges     br0\n";

class InstallVerbTest : public ::testing::Test {
  protected:
    /// Forgets what the last run printed, and runs it.
    ExitStatus run(cli::Verb verb, bool isInProcess = true) {
        for (std::ostringstream* stream : {&m_out, &m_error, &m_lines})
            stream->str("");
        m_ends = 0;
        const cli::Connection connection{
            .operations = m_service, .history = m_history, .isInProcess = isInProcess, .sharesFiles = true};
        cli::LinePrinter printer(m_lines, {});
        cli::ProgressDisplay progress(printer, [] { return std::chrono::steady_clock::time_point(); });
        cli::Context context{.connection = connection,
                             .out = m_out,
                             .error = m_error,
                             .json = m_isJson,
                             .progress = progress,
                             .following = {.pause = [] {},
                                           .interrupted = [this] { return m_isInterrupted; },
                                           .over = [this] { ++m_ends; }},
                             .ask = [this](const std::string& question, const std::function<bool()>&) {
                                 m_question = question;
                                 return m_answer;
                             }};
        cli::VerbOptions options;
        options.mayDisrupt = m_mayDisrupt;
        options.update.target = "eth0";
        options.update.image = m_file;
        options.update.force = m_isForced;
        options.many = m_many;
        return verb(context, options);
    }
    ExitStatus install() { return run(cli::install, true); }

    test::TempFolder m_folder;
    std::string m_file = m_folder.write(
        "new.rom", test::madeRom({{utils::FirmwareType::PXE, 2}, {utils::FirmwareType::UEFI, 1}}));
    const std::shared_ptr<FakeService> m_service = std::make_shared<FakeService>();
    std::ostringstream m_out;
    std::ostringstream m_error;
    std::ostringstream m_lines;
    bool m_isInterrupted = false;
    bool m_mayDisrupt = false;
    cli::ManyOptions m_many;
    std::shared_ptr<history::History> m_history;
    bool m_isForced = false;
    bool m_isJson = false;
    std::optional<std::string> m_answer;  ///< of the user
    std::string m_question;
    int m_ends = 0;  ///< how often the program was told that it may be interrupted
};

ExitStatus showPending(cli::Context& context, const cli::VerbOptions&) {
    cli::VerbOptions pending;
    pending.pendingOnly = true;
    return cli::showAdapters(context, pending);
}

class CardVerbTest : public InstallVerbTest {
  protected:
    CardVerbTest() : m_previous(ma::setBackend(m_card)) {}
    ~CardVerbTest() override { ma::setBackend(m_previous); }

    const std::shared_ptr<CardStub> m_card = std::make_shared<CardStub>();
    const std::shared_ptr<ma::Backend> m_previous;
};

TEST_F(InstallVerbTest, FollowsTheJobOverABrokenConnection) {
    m_service->unanswered = 10;
    EXPECT_EQ(install(), ExitStatus::Done);
    EXPECT_EQ(m_lines.str(),
              "eth0: 0 %, 0 B of 2.0 KiB\neth0: 40 %, 819 B of 2.0 KiB\neth0: 100 %, 2.0 KiB of 2.0 KiB\n");
    EXPECT_EQ(m_out.str(), kUpdated);
    EXPECT_EQ(m_error.str(), "");
    EXPECT_EQ(m_ends, 1);
    EXPECT_EQ(install(), ExitStatus::AlreadyCurrent);
    EXPECT_EQ(m_ends, 1);
}

TEST_F(InstallVerbTest, SaysBeforeACheckThatAServerMayHoldTheAdapter) {
    const auto text = [](const std::string& name, const std::string& value) {
        return core::PropertyValue{name, CimValue::of(CimType::String, value), false, {}};
    };
    m_service->images = {{CimPath("Quenx_SoftwareIdentity.InstanceID=\"i\""), {text("InstanceID", "i")}},
                         {CimPath("Quenx_SoftwareIdentityResource.InstanceID=\"i@\""),
                          {text("InstanceID", "i@"), text("AccessInfo", "file://" + m_file)}}};
    m_service->needsJob = false;
    EXPECT_EQ(run(cli::check, false), ExitStatus::Done);
    EXPECT_TRUE(
        m_error.str().starts_with("quenxctl: Warning: This server can check an image only by holding eth0: "))
        << m_error.str();
    EXPECT_EQ(m_out.str(), "The image can be installed on eth0.\n");
}

TEST_F(InstallVerbTest, CallsNothingAFailureWhoseOutcomeItDoesNotKnow) {
    m_service->unanswered = 1000;
    EXPECT_EQ(install(), ExitStatus::Unknown);
    EXPECT_EQ(m_ends, 0) << "it may still run in this program";
    EXPECT_TRUE(m_error.str().starts_with(
        "quenxctl: No answer.\nThe update may still be running: \"quenxctl jobs\" shows"))
        << m_error.str();
    m_service->answersTheCall = false;
    EXPECT_EQ(install(), ExitStatus::Unknown);
    EXPECT_EQ(m_error.str(),
              "quenxctl: No answer. The update of eth0 may have begun.\n"
              "\"quenxctl jobs\" shows whether it runs, \"quenxctl adapters\" which firmware is there. Look "
              "before you install again.\n");
    m_service->answersTheCall = true;
    m_service->hasMemory = false;
    EXPECT_EQ(install(), ExitStatus::Unknown);
    EXPECT_EQ(m_ends, 0);
}

TEST_F(InstallVerbTest, TakesNoOtherJobForItsOwn) {
    const auto startedAt = [](InstanceValue view, int second) {
        view.properties.push_back(
            {"StartTime", CimValue::of(CimType::Datetime, utils::Time(2026, 1, 2, 3, 4, second)), false, {}});
        return view;
    };
    const auto statusAfter = [&](std::deque<InstanceValue> looks) {
        m_service->installed = kOld;
        m_service->jobs = std::move(looks);
        // What is missing is told by an exception, what is left over by the outcome.
        try {
            return install();
        } catch (const cli::CommandError& error) {
            return error.status();
        }
    };
    EXPECT_EQ(statusAfter({startedAt(job(4, 40), 5), startedAt(job(7, 100), 5)}), ExitStatus::Done);
    EXPECT_EQ(statusAfter({startedAt(job(4, 40), 5), startedAt(job(7, 100), 6)}), ExitStatus::Unknown);
    // A state that 16 bits would cut to 7.
    EXPECT_EQ(statusAfter(std::deque<InstanceValue>(20, job(65543, 100))), ExitStatus::Unknown);
    m_service->jobNamespace = "root/other";
    EXPECT_EQ(statusAfter({job(7, 100)}), ExitStatus::Unknown);
}

TEST_F(InstallVerbTest, AsksTheServiceWhetherAClpEntryMayBeLost) {
    m_service->installed = {component("IMG_CLP", 2), component("IMG_PXE", 2), component("IMG_UEFI", 1)};
    install();
    EXPECT_TRUE(m_service->isCalled);
}

TEST_F(InstallVerbTest, BelievesNoSuccessThatCannotBeSeen) {
    m_service->installedAfterJob = kOld;
    EXPECT_EQ(install(), ExitStatus::Failed);
    EXPECT_NE(m_error.str().find("eth0 ended without an error, but eth0 has IMG_PXE 1, IMG_UEFI 0"),
              std::string::npos);
    m_isJson = true;
    m_service->jobs = {job(7, 100)};
    EXPECT_EQ(install(), ExitStatus::Failed);
    EXPECT_NE(m_out.str().find("\"reasonId\": \"QX-0707\""), std::string::npos);
    m_isJson = false;
    m_service->jobs = {job(4, 100), job(10, 100)};
    EXPECT_EQ(install(), ExitStatus::Failed);
    EXPECT_EQ(m_lines.str(), "eth0: 0 %, 0 B of 2.0 KiB\neth0: 99 %, 2.0 KiB of 2.0 KiB\n");
    // Nor does it believe an update that was done at once.
    m_service->needsJob = false;
    EXPECT_EQ(install(), ExitStatus::Failed);
    m_service->installedAfterJob = kNew;
    EXPECT_EQ(install(), ExitStatus::Done);
    EXPECT_EQ(m_out.str(), kUpdated);
}

TEST_F(InstallVerbTest, ChangesNothingWhenInterruptedBeforeTheStart) {
    m_isInterrupted = true;
    EXPECT_THROW(install(), cli::CommandError);
    EXPECT_FALSE(m_service->isCalled);
}

TEST_F(InstallVerbTest, SaysAfterAFailureOnlyWhatWasReadBack) {
    const std::string reason = "cannot make the folder /x: Permission denied";
    const std::tuple<Instances, bool, std::string, std::string> table[] = {
        {kOld, true, reason,
         reason + " (error 0).\nIt keeps its old firmware. " +
             (::geteuid() == 0 ? "Name a folder that can be written"
                               : "Run quenxctl as root, or name a folder of your own") +
             " with --adapters FILE --state DIR.\n"},
        {{component("IMG_PXE", 2), kOld[1]},
         true,
         "gone",
         "gone (error 0).\nIt now has IMG_PXE 2, IMG_UEFI 0.\n"},
        {kOld, false, "gone\x1b[2J", "gone\\x1b[2J (error 0).\n"},
    };
    for (const auto& [installed, isReadable, why, said] : table) {
        m_service->jobs = {job(10, 100)};
        m_service->jobs.back().properties.push_back(
            {"ErrorDescription", CimValue::of(CimType::String, why), false, {}});
        m_service->installed = kOld;
        m_service->installedAfterJob = installed;
        m_service->isReadable = isReadable;
        EXPECT_EQ(install(), ExitStatus::Failed);
        EXPECT_EQ(m_error.str(), "quenxctl: The update of eth0 failed: " + said);
    }
    // Its folders are the server's.
    m_service->jobs = {job(10, 100)};
    m_service->jobs.back().properties.push_back(
        {"ErrorDescription", CimValue::of(CimType::String, reason), false, {}});
    EXPECT_EQ(run(cli::install, false), ExitStatus::Failed);
    EXPECT_EQ(m_error.str(), "quenxctl: The update of eth0 failed: " + reason + " (error 0).\n");
    // A success stays one.
    m_service->jobs = {job(7, 100)};
    EXPECT_EQ(install(), ExitStatus::Done);
    EXPECT_EQ(
        m_out.str(),
        "eth0 was updated.\nIts versions cannot be read now; \"quenxctl adapters\" shows them later.\n");
}

TEST_F(InstallVerbTest, ListsWhoseJobsTheyAreWhereTheServiceSays) {
    m_service->jobs.pop_back();
    m_service->jobs.back().properties.push_back(
        {"Owner", CimValue::of(CimType::String, std::string("ann")), false, {}});
    EXPECT_EQ(run(cli::showJobs, false), ExitStatus::Done);
    EXPECT_EQ(m_out.str(),
              "JOB  ADAPTER  STATE     PERCENT  START  USER  ERROR\n"
              "     -        Starting  0        -      -     \n"
              "     -        Running   40       -      ann   \n");
}

TEST_F(CardVerbTest, TellsOfTheCardBeforeAndOfTheResetAfterAnUpdate) {
    m_service->resetNeeded = "Reload";
    m_service->installedAfterJob = kOld;
    m_card->verdict.unchecked = {"which card the file is for"};
    EXPECT_EQ(install(), ExitStatus::Done);
    const std::string unchecked =
        "It could not be checked which card the file is for. The adapter judges that when the image is "
        "written.\n";
    EXPECT_TRUE(m_lines.str().starts_with("eth0: 0 %\n")) << "of how much is not known: " << m_lines.str();
    EXPECT_EQ(m_out.str(), unchecked + kCard +
                               "eth0 was updated.\n  IMG_PXE   1 (unchanged)\n  IMG_UEFI  0 (unchanged)\n"
                               "It takes effect after a reset: \"quenxctl activate --target eth0\" does that "
                               "while the machine runs.\n");
    EXPECT_EQ(run(showPending), ExitStatus::ResetPending);
    EXPECT_EQ(m_out.str(), "NAME  BACKEND  RESET   FIRMWARE\neth0           reload  IMG_PXE 1, IMG_UEFI 0\n");
    m_service->updateState = "Busy";
    run(cli::showAdapters);
    EXPECT_NE(m_out.str().find("1af4:1041  busy       IMG_PXE 1"), std::string::npos) << m_out.str();
    run(cli::showOverview);
    EXPECT_TRUE(
        m_out.str().ends_with("\n\nWhat you can do next:\n"
                              "quenxctl adapters --pending  new firmware that does not run yet\n"
                              "quenxctl status              who writes to which adapter\n"
                              "quenxctl history             what was done, by whom, and how it ended\n"
                              "quenxctl help                everything else\n"))
        << m_out.str();
}

TEST_F(CardVerbTest, NamesAdaptersThatDoNotAnswerAmongThePending) {
    m_service->isSilent = true;
    m_service->installed.clear();
    EXPECT_EQ(run(showPending), ExitStatus::Unknown);
    EXPECT_TRUE(m_error.str().starts_with("The firmware of eth0 cannot be read. ")) << m_error.str();
    EXPECT_EQ(m_out.str(), "No adapter that answers waits for a reset.\n");
    m_isJson = true;
    EXPECT_EQ(run(showPending), ExitStatus::Unknown);
    EXPECT_EQ(m_out.str(), "{\n  \"adapters\": [],\n  \"silent\": [\n    \"eth0\"\n  ]\n}\n");
    m_isJson = false;
    m_service->isSilent = false;
    m_service->updateState = "Busy";
    EXPECT_EQ(run(showPending), ExitStatus::Unknown);
}

TEST(CallerTest, IsWhoLoggedInToAnAncestor) {
    std::map<std::string, std::string> files = {{"/proc/self/environ", "A=1"},
                                                {"/proc/self/status", "Name:\tx\nPPid:\t7\nUid:\t0"},
                                                {"/proc/7/status", "PPid:\t1"},
                                                {"/proc/1/status", "PPid:\t0"}};
    const auto caller = [&] { return cli::findCaller([&](const std::string& path) { return files[path]; }); };
    EXPECT_EQ("", caller());
    files["/proc/7/environ"] = std::string("A=1\0SSH_CONNECTION=192.0.2.7 5000 192.0.2.1 22\0B=", 50);
    EXPECT_EQ("192.0.2.7", caller());
    files = {{"/proc/self/status", "PPid:\tself"}};  // a ring, as no system has it
    EXPECT_EQ("", caller());
}

TEST_F(CardVerbTest, RefusesAnImageInTheWordsOfItsBackend) {
    m_service->refusal = 4097;
    m_card->verdict = {ma::ImageNotSupported, "the package is for PCI device 8086:1592"};
    EXPECT_EQ(install(), ExitStatus::Failed);
    EXPECT_EQ(m_error.str(), "quenxctl: eth0 does not take " + m_file +
                                 ": the package is for PCI device 8086:1592.\nGet the image made for "
                                 "1af4:1041.\n");
}

TEST_F(CardVerbTest, WritesToManyOnlyWhatIsKnownToBeNew) {
    const ma::ImageVerdict other{.isForCard = true, .versions = {{"IMG_PXE", "1", "2"}}};
    const ma::ImageVerdict same{.isForCard = true, .versions = {{"IMG_PXE", "2", "2"}}};
    const ma::ImageVerdict opaque{.unchecked = {"which card the file is for"}};
    const ma::ImageVerdict older{
        .status = ma::ImageIsOlder, .reason = "older", .versions = {{"fw", "3", "2"}}};
    const ma::ImageVerdict foreign{.status = ma::ImageNotSupported, .reason = "the package is for 8086:1592"};
    struct Row {
        ma::ImageVerdict verdict;
        std::string resetNeeded;
        std::uint32_t refusal;
        bool isFit, isForced;
        std::string outcome;
        ExitStatus status;
        bool isCalled;
    };
    const Row table[] = {
        {other, "None", 0, true, false, "updated", ExitStatus::Done, true},
        {other, "Reboot", 0, false, false, "updated-reset-pending", ExitStatus::Done, true},
        {other, "None", 6, true, false, "refused", ExitStatus::Failed, true},
        // Before the reset and after it.
        {same, "Reboot", 0, true, false, "current", ExitStatus::AlreadyCurrent, false},
        {same, "None", 0, true, true, "updated", ExitStatus::Done, true},
        {opaque, "None", 0, true, false, "unknown", ExitStatus::Unknown, false},
        {opaque, "None", 0, false, true, "updated", ExitStatus::Done, true},
        {older, "None", 4099, false, false, "refused", ExitStatus::Failed, true},
        {foreign, "None", 4097, false, false, "refused", ExitStatus::Failed, true},
        {foreign, "None", 4097, true, false, "fits no adapter here", ExitStatus::NotFound, false},
    };
    m_answer = "y";
    for (const Row& row : table) {
        m_card->verdict = row.verdict;
        m_service->resetNeeded = row.resetNeeded;
        m_service->refusal = row.refusal;
        m_service->isCalled = false;
        m_service->jobs = {job(7, 100)};
        m_many = {.isAll = !row.isFit, .isFit = row.isFit, .images = {m_file}};
        m_isForced = row.isForced;
        EXPECT_EQ(install(), row.status) << row.outcome;
        EXPECT_NE(m_out.str().find(row.outcome), std::string::npos) << row.outcome << m_out.str();
        EXPECT_EQ(m_service->isCalled, row.isCalled) << row.outcome;
    }
}

TEST_F(CardVerbTest, TakesTheWordOfTheHistoryForAnImageThatTellsNoVersion) {
    m_card->verdict.unchecked = {"which card the file is for"};
    m_card->needed = ma::ResetNeeded::None;
    m_history = std::make_shared<history::History>(
        history::Settings{[folder = m_folder / "history"] { return folder; }});
    const auto bytes = test::readTestFile(m_file);
    core::UpdateAttempt attempt;
    attempt.adapter = "eth0";
    attempt.image = m_history->examine(bytes).get();
    m_history->begin(attempt)->end(true, 0, "");
    m_many = {.isFit = true, .images = {m_file}};
    EXPECT_EQ(install(), ExitStatus::AlreadyCurrent) << m_error.str();
    // Another file, other types, and something else in the flash than the update has left there.
    m_many.images = {m_folder.write("other.rom", std::vector<std::uint8_t>(bytes.size()))};
    EXPECT_EQ(install(), ExitStatus::Unknown);
    m_many.images = {m_file};
    m_card->installed = 2;
    EXPECT_EQ(install(), ExitStatus::Unknown);
    m_card->installed = 1;
    attempt.values = {"IMG_PXE"};
    m_history->begin(attempt)->end(true, 0, "");
    EXPECT_EQ(install(), ExitStatus::Unknown);
    EXPECT_FALSE(m_service->isCalled);
    // Nor is there a way back over what has failed on the way.
    const auto broken = m_history->begin(attempt);
    m_card->installed = 3;
    broken->end(false, 6, "worn out");
    try {
        run(cli::rollback);
        ADD_FAILURE() << m_out.str();
    } catch (const cli::CommandError& error) {
        EXPECT_EQ(error.status(), ExitStatus::Failed);
        EXPECT_STREQ(error.what(),
                     "A later update of eth0 (record 3 of the history: failed) may have left anything in its "
                     "flash.");
    }
    EXPECT_FALSE(m_service->isCalled);
}

TEST_F(CardVerbTest, WritesToManyHardwareAdaptersOnlyWhenTheyAreMeant) {
    m_card->verdict = {.isForCard = true, .versions = {{"fw", "1", "2"}}};
    m_many = {.isAll = true, .images = {m_file}};
    for (const auto& answer : {std::optional<std::string>(), {"n"}, {""}}) {
        m_answer = answer;
        try {
            install();
            ADD_FAILURE() << "nobody has said yes";
        } catch (const cli::CommandError& error) {
            EXPECT_EQ(error.status(), ExitStatus::WrongUse);
            EXPECT_STREQ(error.what(),
                         "Nothing was written: these adapters are hardware, and nobody has confirmed that "
                         "they are meant: eth0.");
        }
        EXPECT_EQ(m_question, "Write to eth0? [y/N] ");
        EXPECT_FALSE(m_service->isCalled);
    }
    m_many.isDryRun = true;
    EXPECT_EQ(run(cli::install, false), ExitStatus::Done);
    EXPECT_FALSE(m_service->isCalled);
    m_many.isDryRun = false;
    m_many.isConfirmed = true;
    m_isInterrupted = true;
    EXPECT_EQ(install(), ExitStatus::Interrupted);
    EXPECT_FALSE(m_service->isCalled);
    m_isInterrupted = false;
    EXPECT_EQ(install(), ExitStatus::Done);
    EXPECT_EQ(m_ends, 1);
    m_many.isConfirmed = false;
    m_answer = "yes";
    m_service->jobs = {job(7, 100)};
    EXPECT_EQ(install(), ExitStatus::Done);
}

TEST(CardOfTest, IsTheSameForTheFunctionsOfACard) {
    const auto card = [](const char* board, const char* serial, const char* address) {
        cli::Adapter adapter;
        adapter.name = "eth0";
        adapter.boardSerialNumber = board;
        adapter.serialNumber = serial;
        adapter.pciAddress = address;
        return cli::cardOf(adapter);
    };
    EXPECT_EQ(card("B", "1", "05:00.0"), card("B", "2", "06:00.0"));
    EXPECT_EQ(card("", "S", "05:00.0"), card("", "S", "05:01.0"));
    EXPECT_NE(card("", "S", "05:00.0"), card("", "T", "05:00.1"));
    EXPECT_EQ(card("", "", "05:00.0"), card("", "", "05:00.1"));
    EXPECT_NE(card("", "", "05:00.0"), card("", "", "0001:05:00.0"));
    EXPECT_EQ(card("", "", ""), "adapter eth0");
}

TEST_F(CardVerbTest, ActivatesWhatWaitsAndTellsHowThatEnded) {
    using enum ma::Activation::Status;
    m_mayDisrupt = true;
    const std::string restart =
        "Restart the machine; some adapters need it to be without power for a moment.\n";
    const std::tuple<ma::Activation, ExitStatus, std::string, std::string> table[] = {
        {{Done, ""}, ExitStatus::Done, "activated", "eth0 runs the firmware in its flash.\n"},
        {{NotOffered, ""},
         ExitStatus::Failed,
         "not offered",
         "eth0 cannot be activated while the machine runs.\n" + restart},
        {{WouldDisrupt, "the default route goes through br0"},
         ExitStatus::Failed,
         "refused",
         "Activating eth0 would cut the network: the default route goes through br0.\nDo it from another way "
         "in, or with --disrupt if you can do without for a moment.\n"},
        {{Failed, "Input/output error"},
         ExitStatus::Failed,
         "failed",
         "The activation of eth0 failed; the old firmware still runs: Input/output error.\nThe kernel's log "
         "may have more.\n"},
        {{StillPending, "fw 1 runs"},
         ExitStatus::ResetPending,
         "still pending",
         "eth0 was reset, but its new firmware does not run yet: fw 1 runs.\n" + restart},
        {{Unknown, "no answer"},
         ExitStatus::Unknown,
         "unknown",
         "Whether eth0 was reset, and which firmware it runs, is not known: no answer.\n\"quenxctl "
         "adapters\" and the kernel's log may tell; a restart of the machine brings it back.\n"},
        {{Done, "the driver does not tell"},
         ExitStatus::Done,
         "activated",
         "eth0 was reset: the driver does not tell.\n"},
        {{NotBack, "enp1s0 has no link"},
         ExitStatus::Unknown,
         "not back",
         "eth0 was reset, but is not all there again: enp1s0 has no link.\nLook at \"ip link\" and the "
         "kernel's log; a restart of the machine brings it back.\n"},
    };
    for (const auto& [activation, status, result, said] : table) {
        m_card->activation = activation;
        m_isJson = false;
        EXPECT_EQ(run(cli::activate), status);
        EXPECT_EQ(m_ends, 1);
        EXPECT_EQ(m_out.str() + m_error.str(),
                  kCard + (status == ExitStatus::Done ? "" : std::string("quenxctl: ")) + said);
        EXPECT_EQ(m_error.str().empty(), status == ExitStatus::Done);
        m_isJson = true;
        EXPECT_EQ(run(cli::activate), status);
        EXPECT_TRUE(m_out.str().starts_with("{\n  \"result\": \"" + result + "\"")) << m_out.str();
    }
    EXPECT_TRUE(m_card->mayDisrupt);
    m_card->needed = ma::ResetNeeded::None;
    m_card->activation = {Failed, "not to be asked for"};
    EXPECT_EQ(run(cli::activate), ExitStatus::AlreadyCurrent);
    EXPECT_EQ(m_out.str(), R"({
  "result": "already current",
  "exitStatus": 3,
  "message": "eth0 runs the firmware in its flash: nothing waits for a reset.",
  "advice": "",
  "adapter": "eth0",
  "backend": "",
  "card": {
    "functions": [
      "eth0",
      "eth1"
    ],
    "interfaces": [
      "enp1s0"
    ],
    "bonds": [],
    "bridges": [
      "br0"
    ],
    "losses": []
  }
}
)");
    m_isJson = false;
    EXPECT_EQ(run(cli::activate), ExitStatus::AlreadyCurrent);
    EXPECT_EQ(m_out.str(),
              kCard + std::string("eth0 runs the firmware in its flash: nothing waits for a reset.\n"));
}

}  // namespace
