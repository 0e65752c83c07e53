// SPDX-License-Identifier: Apache-2.0
// What a service does to quenxctl that the simulated adapters do not.
#include <gtest/gtest.h>

#include <deque>
#include <sstream>

#include "Cli/Failure.h"
#include "Cli/Verbs.h"
#include "Framework/Model/CimError.h"
#include "Support/TempFolder.h"
#include "Support/TestRoms.h"

namespace {

using cli::ExitStatus;
using core::CimPath;
using core::CimType;
using core::CimValue;
using core::InstanceValue;
using utils::FirmwareType;

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

/// One adapter, 1af4:1041, and a service that answers as it is told.
class FakeManagement : public cli::Management {
  public:
    std::vector<InstanceValue> installed = {component("IMG_PXE", 1), component("IMG_UEFI", 0)};
    std::vector<InstanceValue> installedAfterJob = {component("IMG_PXE", 2), component("IMG_UEFI", 1)};
    std::deque<InstanceValue> jobs = {job(3, 0), job(4, 40), job(7, 100)};  ///< one a look
    unsigned unanswered = 0;                                                ///< so many looks get no answer
    bool isCalled = false;
    bool isReadable = true;  ///< what is installed, after the job

    std::vector<InstanceValue> enumerateInstances(const std::string& className) override {
        if (className != "Quenx_EthernetPort") return {};
        return {{CimPath("Quenx_EthernetPort.DeviceID=\"eth0\""),
                 {{"Name", CimValue::of(CimType::String, std::string("eth0")), false, {}},
                  texts("OtherIdentifyingInfo", {"1af4:1041"}),
                  texts("IdentifyingDescriptions", {"PCI Vendor and Device ID"})}}};
    }
    std::vector<CimPath> enumerateInstanceNames(const std::string& className) override {
        return {CimPath(className + ".Name=\"1\"")};
    }
    InstanceValue getInstance(const CimPath&) override {
        if (unanswered > 0) {
            --unanswered;
            throw cli::Failure(ExitStatus::Failed, "No answer.", "Wait.");
        }
        InstanceValue view = jobs.front();
        jobs.pop_front();
        if (jobs.empty()) installed = installedAfterJob;
        return view;
    }
    std::vector<InstanceValue> associators(const CimPath&, const core::AssociationFilter&) override {
        if (jobs.empty() && !isReadable) throw core::CimError(core::CimStatus::Failed, "gone");
        return installed;
    }
    std::vector<CimPath> associatorNames(const CimPath&, const core::AssociationFilter&) override {
        return {};
    }
    core::MethodResult invokeMethod(const CimPath&, const std::string&,
                                    const std::vector<core::Argument>&) override {
        isCalled = true;
        return {4096, {{"Job", CimValue::of(CimType::Reference, job(2, 0).path)}}};
    }
    void deleteInstance(const CimPath&) override {}
    std::vector<core::ClassDeclaration> classes() override { return {}; }
    bool runsJobs() const override { return true; }
    bool sharesFiles() const override { return true; }
};

/// Remembers what it is told.
class RecordingObserver : public cli::UpdateObserver {
  public:
    std::string events;

    void started(const std::string& adapter, std::uint64_t) override { events = adapter; }
    void progressed(unsigned percent) override { events += ", " + std::to_string(percent); }
    void interrupted() override { events += ", interrupted"; }
    void ended(const cli::JobView& view) override { events += ", end " + std::to_string(view.state); }
};

class InstallVerb : public ::testing::Test {
  protected:
    ExitStatus install() { return cli::install(context_, {"eth0", file_, "", {}, false}); }

    test::TempFolder folder_;
    std::string file_ =
        folder_.write("new.rom", test::madeRom({{FirmwareType::PXE, 2}, {FirmwareType::UEFI, 1}}));
    FakeManagement model_;
    RecordingObserver observer_;
    std::ostringstream out_;
    std::ostringstream error_;
    bool interrupted_ = false;
    cli::Context context_{model_, out_, error_, false, observer_, {[] {}, [this] { return interrupted_; }}};
};

TEST_F(InstallVerb, FollowsTheJobOverABrokenConnection) {
    model_.unanswered = 10;
    EXPECT_EQ(install(), ExitStatus::Done);
    EXPECT_EQ(observer_.events, "eth0, 0, 40, 100, end 7");
    EXPECT_EQ(out_.str(), "eth0 was updated.\n  IMG_PXE   1 -> 2\n  IMG_UEFI  0 -> 1\n");
    EXPECT_EQ(error_.str(), "");
}

TEST_F(InstallVerb, DoesNotWaitForEverForAnAnswer) {
    model_.unanswered = 1000;
    try {
        install();
        ADD_FAILURE() << "waits for ever";
    } catch (const cli::Failure& failure) {
        EXPECT_TRUE(failure.advice().starts_with("The update may still be running: \"quenxctl jobs\" shows"));
    }
}

TEST_F(InstallVerb, CompletedWithTheOldVersionsIsNoSuccess) {
    model_.installedAfterJob = model_.installed;
    EXPECT_EQ(install(), ExitStatus::Failed);
    EXPECT_NE(error_.str().find("eth0 ended without an error, but eth0 has IMG_PXE 1, IMG_UEFI 0"),
              std::string::npos);
}

TEST_F(InstallVerb, InterruptedBeforeTheStartChangesNothing) {
    interrupted_ = true;
    EXPECT_THROW(install(), cli::Failure);
    EXPECT_FALSE(model_.isCalled);
}

TEST_F(InstallVerb, OneHundredPercentIsNoSuccess) {
    model_.jobs = {job(4, 100), job(10, 100)};
    EXPECT_EQ(install(), ExitStatus::Failed);
    EXPECT_EQ(observer_.events, "eth0, 99, end 10");
}

TEST_F(InstallVerb, AfterAFailureOnlySaysWhatWasReadBack) {
    const struct {
        std::vector<InstanceValue> installed;
        bool isReadable;
        std::string reason;
        std::string advice;
    } rows[] = {
        {{component("IMG_PXE", 1), component("IMG_UEFI", 0)},
         true,
         "cannot make the folder /x: Permission denied",
         "It keeps its old firmware. Run quenxctl as root, or name a folder of yours with --adapters FILE "
         "--state DIR.\n"},
        {{component("IMG_PXE", 1), component("IMG_UEFI", 0)},
         true,
         "flash gone",
         "It keeps its old firmware.\n"},
        {{component("IMG_PXE", 2), component("IMG_UEFI", 0)},
         true,
         "flash gone",
         "It now has IMG_PXE 2, IMG_UEFI 0.\n"},
        {{component("IMG_PXE", 1), component("IMG_UEFI", 0)}, false, "flash gone", ""},
    };
    for (const auto& row : rows) {
        model_.jobs = {job(10, 100)};
        model_.jobs.back().properties.push_back(
            {"ErrorDescription", CimValue::of(CimType::String, row.reason), false, {}});
        model_.installed = {component("IMG_PXE", 1), component("IMG_UEFI", 0)};
        model_.installedAfterJob = row.installed;
        model_.isReadable = row.isReadable;
        error_.str("");
        EXPECT_EQ(install(), ExitStatus::Failed);
        EXPECT_EQ(error_.str(),
                  "quenxctl: The update of eth0 failed: " + row.reason + " (error 0).\n" + row.advice);
    }
    // A success stays one.
    model_.jobs = {job(7, 100)};
    EXPECT_EQ(install(), ExitStatus::Done);
    EXPECT_EQ(
        out_.str(),
        "eth0 was updated.\nIts versions cannot be read now; \"quenxctl adapters\" shows them later.\n");
}

}  // namespace
