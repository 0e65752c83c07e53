// SPDX-License-Identifier: Apache-2.0
// What is said of each refusal, by what can be seen of image, adapter and service.
#include <gtest/gtest.h>

#include "Cli/Connection/Connection.h"
#include "Cli/Update/Candidate.h"
#include "Cli/Update/Service.h"
#include "Framework/Requests/CimRequests.h"
#include "History/Log/LogProperties.h"
#include "MidAPI/ma.h"
#include "Support/TempFolder.h"
#include "Support/TestRoms.h"

namespace {

using core::CimPath;
using core::CimType;
using core::CimValue;
using enum utils::FirmwareType;
using Instances = std::vector<core::InstanceValue>;

core::PropertyValue textProperty(const std::string& name, const std::string& value) {
    return {name, CimValue::of(CimType::String, value), false, {}};
}
core::PropertyValue numberProperty(const std::string& name, std::uint64_t value) {
    return {name, CimValue::of(CimType::Uint64, value), false, {}};
}

/// A service with these instances, and the port eth0.
class Service : public core::CimRequests {
  public:
    Service() : CimRequests("") {}
    Instances enumerateInstances(const std::string& className, const core::PropertyFilter&) override {
        if (className == "Quenx_ConcreteJob") return jobs;
        if (className == history::kLogEntryClass) return log;
        if (className != "Quenx_EthernetPort") return {};
        const auto texts = [](const char* name, const std::vector<std::string>& values) {
            return core::PropertyValue{
                name, CimValue::arrayOf(CimType::String, {values.begin(), values.end()}), false, {}};
        };
        return {{CimPath("Quenx_EthernetPort.DeviceID=\"eth0\""),
                 {textProperty("Name", "eth0"), texts("OtherIdentifyingInfo", {updateState, writer}),
                  texts("IdentifyingDescriptions", {"Update State", "Updating Process"})}}};
    }
    std::vector<CimPath> enumerateInstanceNames(const std::string&) override { return {}; }
    Instances associators(const CimPath&, const core::AssociationFilter&,
                          const core::PropertyFilter&) override {
        return {};
    }

    Instances jobs;
    Instances log;
    std::string updateState;
    std::string writer;
};

class RefusalTest : public ::testing::Test {
  protected:
    cli::Candidate candidate(const std::string& image, std::vector<std::string> types = {}) const {
        cli::UpdateOptions options;
        options.image = image;
        options.types = std::move(types);
        return cli::makeCandidate(m_here, m_adapter, options);
    }
    std::string file(const std::string& name, const std::vector<std::uint8_t>& bytes) const {
        return m_folder.write(name, bytes);
    }
    void add(const std::string& title, const cli::Connection& connection, std::uint32_t returnValue,
             const cli::Candidate& candidate, core::ReasonId id = core::ReasonId::None) {
        const cli::Explanation why = cli::explainRefusal(connection, returnValue, candidate, id);
        m_said += title + " " + std::to_string(returnValue) + ": " + why.message + " | " + why.advice + "\n";
    }
    /// In process, and from a server.
    void addBoth(const std::string& title, std::uint32_t returnValue, const cli::Candidate& candidate) {
        add(title, m_here, returnValue, candidate);
        add(title + ", there,", m_there, returnValue, candidate);
    }
    void addFailure(const cli::Connection& connection, const std::string& reason, std::uint16_t code,
                    const cli::Candidate& candidate, const std::vector<cli::Component>& after) {
        cli::JobView job;
        job.errorDescription = reason;
        job.errorCode = code;
        const cli::Explanation why = cli::explainFailedJob(connection, job, candidate, after);
        m_said += why.message + " | " + why.advice + "\n";
    }

    /// All of it, letter for letter.
    void expectSaid(const std::string& sample) {
        for (std::size_t at = 0; (at = m_said.find(m_folder.path())) != std::string::npos;)
            m_said.replace(at, m_folder.path().size(), "<folder>");
        const auto expected = test::readTestFile(QUENX_CLI_TEST_DIR "/samples/" + sample);
        EXPECT_EQ(m_said, std::string(expected.begin(), expected.end()));
    }

    const test::TempFolder m_folder;
    const std::shared_ptr<Service> m_service = std::make_shared<Service>();
    const cli::Connection m_here{.operations = m_service};
    const cli::Connection m_there{.operations = m_service, .isInProcess = false};
    cli::Adapter m_adapter = [] {
        cli::Adapter adapter;
        adapter.name = "eth0";
        adapter.ids = "1af4:1041";
        adapter.components = {{"IMG_PXE", 2}, {"IMG_UEFI", 2}};
        return adapter;
    }();
    const std::string m_good = file("good.rom", test::madeRom({{PXE, 3}, {UEFI, 3}}));
    std::string m_said;
};

constexpr std::uint32_t kUnspecified = 2;
constexpr std::uint32_t kInvalid = 5;
constexpr std::uint32_t kInUse = 6;
constexpr std::uint32_t kUnsupported = 4097;
constexpr std::uint32_t kDowngrade = 4099;
constexpr std::uint32_t kNotApplicable = 4106;

TEST_F(RefusalTest, IsExplainedByWhatCanBeSeen) {
    const cli::Candidate good = candidate(m_good);
    for (const std::uint32_t value : {0U, 1U, 2U, 3U, 4U, 5U, 6U, 7U, 4095U})
        addBoth("good", value, good);
    for (std::uint32_t value = 4096; value <= 4110; ++value)
        addBoth("good", value, good);

    for (const auto& image : {file("empty.rom", {}), m_folder / "none.rom", std::string("http://host/x"),
                              std::string("file:x"), "file://" + m_folder.path()})
        for (const std::uint32_t value : {kUnspecified, kInvalid})
            addBoth(image, value, candidate(image));
    addBoth("other card", kUnsupported,
            candidate(file("card.rom", test::madeRom({{PXE, 3}}, 0x10ec, 0x8139))));
    addBoth("older", kDowngrade, candidate(file("older.rom", test::madeRom({{PXE, 1}, {UEFI, 0}}))));
    addBoth("one older", kDowngrade, candidate(file("one.rom", test::madeRom({{PXE, 2}, {UEFI, 1}}))));
    cli::Candidate other = candidate(file("fcoe.rom", test::madeRom({{PXE, 3}, {FCoE, 1}})));
    addBoth("other types", kDowngrade, other);
    other.force = true;
    addBoth("other types, forced", kDowngrade, other);
    addBoth("no such type", kNotApplicable, candidate(m_good, {"IMG_PXE", "IMG_FCoE"}));

    m_adapter.components = {{"IMG_CLP", 2}, {"IMG_PXE", 2}, {"IMG_UEFI", 2}};
    addBoth("CLP", kDowngrade, candidate(m_good));
    m_adapter.components.clear();
    addBoth("nothing installed", kDowngrade, candidate(m_good));
    m_adapter.answers = false;
    add("silent", m_there, kUnspecified, candidate(m_good));
    m_adapter.updatable = false;
    addBoth("not updatable", kUnsupported, candidate(m_good));
    m_adapter.ids.clear();
    addBoth("no ids", kNotApplicable, candidate(m_good));
    expectSaid("refusals-seen");
}

TEST_F(RefusalTest, NamesWhoHoldsTheAdapterFirst) {
    const cli::Candidate good = candidate(m_good);
    const auto addAll = [&](const std::string& title) {
        for (const std::uint32_t value : {kUnspecified, kInUse, kInvalid})
            addBoth(title, value, good);
    };
    m_service->jobs = {{CimPath("Quenx_ConcreteJob.InstanceID=\"J#1\""),
                        {textProperty("InstanceID", "J#1"), numberProperty("JobState", 7)}}};
    m_service->updateState = "Busy";
    addAll("writer");
    m_service->writer = "process 7";
    addAll("named writer");
    m_service->jobs.push_back({CimPath("Quenx_ConcreteJob.InstanceID=\"J#2\""),
                               {textProperty("InstanceID", "J#2"), numberProperty("JobState", 4),
                                numberProperty("PercentComplete", 40)}});
    addAll("job");
    expectSaid("refusals-held");
}

TEST_F(RefusalTest, IsToldInTheWordsOfServiceAndBackend) {
    cli::Candidate good = candidate(m_good);
    const auto entry = [&](const std::string& id, const std::string& outcome, std::uint64_t returnValue) {
        return core::InstanceValue{
            CimPath("Quenx_LogEntry.InstanceID=\"" + id + "\""),
            {textProperty("RecordID", id), textProperty("AdapterName", "eth0"), textProperty("URI", good.uri),
             textProperty("Outcome", outcome), textProperty("Reason", "the reason of " + id),
             textProperty("ReasonID", "QX-0202"), numberProperty("ReturnValue", returnValue)}};
    };
    m_service->log = {entry("1", "refused", kInvalid), entry("2", "written", kInvalid)};
    using core::ReasonId;
    for (const ReasonId id : {ReasonId::None, ReasonId::FileMissing, ReasonId::FileNotOpened})
        add("told", m_there, kInvalid, good, id);
    add("told", m_there, kUnspecified, good);
    m_service->log.push_back(entry("3", "refused", kUnspecified));
    add("told", m_there, kInvalid, good);
    add("told", m_there, kUnspecified, good);
    for (const ReasonId id : {ReasonId::HistoryRequired, ReasonId::FlashBusy})
        add("policy", m_here, kUnspecified, good, id);
    for (int status = 0; status <= 7; ++status) {
        good.verdict = ma::ImageVerdict{static_cast<ma::PrepareStatus>(status), "so"};
        add("verdict " + std::to_string(status), m_here, kUnsupported, good);
    }
    good.verdict->reason = "so it is.";
    add("verdict", m_here, kUnsupported, good);
    expectSaid("refusals-told");
}

TEST_F(RefusalTest, TellsWhatAFailureHasLeft) {
    const cli::Candidate good = candidate(m_good);
    const std::vector<cli::Component> before = m_adapter.components;
    const std::uint16_t busy = ma::WriteError::Busy;
    addFailure(m_here, "", 0, good, before);
    addFailure(m_here, "lost", 3, good, {});
    addFailure(m_here, "lost", 3, good, {{"IMG_PXE", 3}});
    addFailure(m_there, "lost", busy, good, before);
    addFailure(m_here, "Read-only file system", 3, good, before);
    addFailure(m_there, "Read-only file system", 3, good, before);
    m_adapter.components = {{"IMG_PXE", 3}, {"IMG_UEFI", 3}};
    addFailure(m_here, "lost", 3, candidate(m_good), m_adapter.components);
    expectSaid("failures");
}

}  // namespace
