#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "Cli/Failure.h"
#include "Cli/FakeManagement.h"
#include "Cli/Verbs.h"
#include "Support/TempFolder.h"
#include "Support/TestRoms.h"

namespace {

using cli::ExitStatus;
using cli::InstallOrder;
using test::VerbRun;
using utils::FirmwareType;

class InstallVerb : public ::testing::Test {
  protected:
    /// An image with IMG_PXE 2 and IMG_UEFI 1 for 1af4:1041.
    InstallOrder order() const {
        InstallOrder result;
        result.target = "eth0";
        result.image = file_;
        return result;
    }

    test::TempFolder folder_;
    std::string file_ =
        folder_.write("new.rom", test::madeRom({{FirmwareType::PXE, 2}, {FirmwareType::UEFI, 1}}));
    VerbRun run_;
};

TEST_F(InstallVerb, CallsTheServiceAndFollowsTheJob) {
    fillModel(run_.model, 1, 0);
    run_.model.associatedAfterJob = test::installed(2, 1);
    EXPECT_EQ(cli::install(run_.context, order()), ExitStatus::Done);
    EXPECT_EQ(run_.model.calledMethod, "InstallFromURI");
    EXPECT_EQ(run_.model.argument("URI"), "\"file://" + file_ + "\"");
    EXPECT_EQ(run_.model.argument("Target"), "root/cimv2:Quenx_EthernetPort.DeviceID=\"eth0\"");
    EXPECT_EQ(run_.model.argument("InstallOptions"), "{5}");
    EXPECT_EQ(run_.model.argument("InstallOptionsValues"), "NULL");
    EXPECT_EQ(run_.observer.events, "start eth0, 0, 40, 100, end 7");
    EXPECT_EQ(run_.out.str(), "eth0 is updated.\n  IMG_PXE   1 -> 2\n  IMG_UEFI  0 -> 1\n");
    EXPECT_EQ(run_.error.str(), "");
}

TEST_F(InstallVerb, ValuesStandAtThePlacesOfTheirOptions) {
    fillModel(run_.model, 1, 0);
    run_.model.associatedAfterJob = test::installed(2, 1);
    InstallOrder wanted = order();
    wanted.types = {"IMG_PXE", "IMG_UEFI"};
    wanted.force = true;
    cli::install(run_.context, wanted);
    EXPECT_EQ(run_.model.argument("InstallOptions"), "{32768, 5, 3}");
    EXPECT_EQ(run_.model.argument("InstallOptionsValues"), "{\"IMG_PXE+IMG_UEFI\"}");
    fillModel(run_.model, 1, 0);
    wanted.types = {"IMG_PXE", ""};
    wanted.force = false;
    cli::install(run_.context, wanted);
    EXPECT_EQ(run_.model.argument("InstallOptions"), "{32768, 5}");
    EXPECT_EQ(run_.model.argument("InstallOptionsValues"), "{\"IMG_PXE+\"}");
}

TEST_F(InstallVerb, SaysAlreadyCurrentUnlessForced) {
    fillModel(run_.model, 2, 1);
    EXPECT_EQ(cli::install(run_.context, order()), ExitStatus::AlreadyCurrent);
    EXPECT_EQ(run_.model.calledMethod, "");
    EXPECT_EQ(run_.out.str(),
              "eth0 is already current: it has IMG_PXE 2, IMG_UEFI 1, as the image does.\n"
              "Use --force to write it again.\n");
    InstallOrder forced = order();
    forced.force = true;
    EXPECT_EQ(cli::install(run_.context, forced), ExitStatus::Done);
    EXPECT_EQ(run_.model.argument("InstallOptions"), "{5, 3}");
}

TEST_F(InstallVerb, OneTypeCanBeCurrentAndTheOtherNot) {
    fillModel(run_.model, 2, 0);
    InstallOrder wanted = order();
    wanted.types = {"IMG_PXE"};
    EXPECT_EQ(cli::install(run_.context, wanted), ExitStatus::AlreadyCurrent);
    wanted.types = {"IMG_UEFI"};
    run_.model.associatedAfterJob = test::installed(2, 1);
    EXPECT_EQ(cli::install(run_.context, wanted), ExitStatus::Done);
}

TEST_F(InstallVerb, SameVersionsForAnotherCardAreLeftToTheService) {
    fillModel(run_.model, 2, 1);
    run_.model.answer = {4097, {}};
    InstallOrder wanted = order();
    wanted.image = folder_.write(
        "other.rom", test::madeRom({{FirmwareType::PXE, 2}, {FirmwareType::UEFI, 1}}, 0x10ec, 0x8139));
    EXPECT_EQ(cli::install(run_.context, wanted), ExitStatus::Failed);
    EXPECT_EQ(run_.error.str(),
              "quenxctl: The image was not made for this adapter. The image is for 10ec:8139, and eth0 is "
              "1af4:1041.\nGet the image for this adapter's ids; \"quenxctl adapters\" shows them.\n");
}

TEST_F(InstallVerb, OneHundredPercentIsNoSuccess) {
    fillModel(run_.model, 1, 0);
    run_.model.jobStates = {test::jobState(4, 100), test::jobState(10, 100, 6, "erase failed\x1b[2J")};
    EXPECT_EQ(cli::install(run_.context, order()), ExitStatus::Failed);
    EXPECT_EQ(run_.observer.events, "start eth0, 99, 99, end 10");
    EXPECT_EQ(run_.error.str(),
              "quenxctl: The update of eth0 failed: erase failed\\x1b[2J (error code 6, job Exception).\n"
              "The adapter keeps the firmware that it had; mend the cause and install again.\n");
}

TEST_F(InstallVerb, CompletedWithTheOldVersionsIsNoSuccess) {
    fillModel(run_.model, 1, 0);
    EXPECT_EQ(cli::install(run_.context, order()), ExitStatus::Failed);
    EXPECT_NE(run_.error.str().find("completed, yet the adapter has IMG_PXE 1, IMG_UEFI 0"),
              std::string::npos);
}

TEST_F(InstallVerb, ABrokenConnectionIsBorneForAWhile) {
    fillModel(run_.model, 1, 0);
    run_.model.associatedAfterJob = test::installed(2, 1);
    run_.model.unanswered = 10;
    EXPECT_EQ(cli::install(run_.context, order()), ExitStatus::Done);
    fillModel(run_.model, 1, 0);
    run_.model.unanswered = 1000;
    try {
        cli::install(run_.context, order());
        ADD_FAILURE() << "waits for ever";
    } catch (const cli::Failure& failure) {
        EXPECT_EQ(failure.advice(), "The update goes on all the same; \"quenxctl jobs\" shows how it ends.");
    }
}

TEST_F(InstallVerb, InterruptedBeforeTheStartChangesNothing) {
    fillModel(run_.model, 1, 0);
    run_.interrupted = true;
    EXPECT_THROW(cli::install(run_.context, order()), cli::Failure);
    EXPECT_EQ(run_.model.calledMethod, "");
}

TEST_F(InstallVerb, WrongNamesAreSaid) {
    fillModel(run_.model, 1, 0);
    const struct {
        std::string target;
        std::vector<std::string> types;
        std::string message;
        std::string advice;
        ExitStatus status;
    } rows[] = {
        {"eth9", {}, "There is no adapter \"eth9\".", "Name one of these: eth0, eth3.", ExitStatus::Failed},
        {"Quenx_EthernetPort.DeviceID=\"a\\\"\\\\b\"",
         {},
         "There is no adapter \"Quenx_EthernetPort.DeviceID=\"a\\\"\\\\b\"\".",
         "Name one of these: eth0, eth3.",
         ExitStatus::Failed},
        {"Quenx_EthernetPort.DeviceID=",
         {},
         "There is no adapter \"Quenx_EthernetPort.DeviceID=\".",
         "Name one of these: eth0, eth3.",
         ExitStatus::Failed},
        {"eth0",
         {"img_pxe"},
         "\"img_pxe\" is no image type.",
         "The service knows IMG_CLP, IMG_iSCSI, IMG_PXE, IMG_UEFI, IMG_FCoE, written just so.",
         ExitStatus::WrongUse},
    };
    for (const auto& row : rows) {
        InstallOrder wanted = order();
        wanted.target = row.target;
        wanted.types = row.types;
        try {
            cli::install(run_.context, wanted);
            ADD_FAILURE() << row.message;
        } catch (const cli::Failure& failure) {
            EXPECT_EQ(failure.what(), row.message);
            EXPECT_EQ(failure.advice(), row.advice);
            EXPECT_EQ(failure.status(), row.status) << row.message;
        }
    }
    for (const char* name : {"03:00.0", "Quenx_EthernetPort.DeviceID=\"eth0\""}) {
        InstallOrder wanted = order();
        wanted.target = name;
        run_.model.associatedAfterJob = test::installed(2, 1);
        EXPECT_NE(cli::install(run_.context, wanted), ExitStatus::Failed) << name;
    }
}

TEST_F(InstallVerb, JsonHoldsTheWholeOutcome) {
    fillModel(run_.model, 1, 0);
    run_.model.associatedAfterJob = test::installed(2, 1);
    run_.context.json = true;
    cli::install(run_.context, order());
    const auto document = nlohmann::json::parse(run_.out.str());
    EXPECT_EQ(document["result"], "updated");
    EXPECT_EQ(document["returnValue"], 4096);
    EXPECT_EQ(document["job"]["state"], 7);
    EXPECT_EQ(document["before"][0], (nlohmann::json{{"type", "IMG_PXE"}, {"version", 1}}));
    EXPECT_EQ(document["after"][0]["version"], 2);
    EXPECT_EQ(document["exitStatus"], 0);
}

}  // namespace
