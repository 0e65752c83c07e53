#include "MidAPI/Simulator/Fault.h"

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <fstream>

#include "MidAPI/AdapterError.h"
#include "MidAPI/ma.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TestRoms.h"

namespace {

using Action = ma::Fault::Action;
using ma::Operation;
using utils::FirmwareType;

const std::vector<uint8_t> NEW_IMAGE = test::madeRom({{FirmwareType::PXE, 9}});

/// Does one operation on eth0 and says in a word how it went.
std::string outcome(Operation operation) try {
    uint32_t code = 0;
    std::string text;
    switch (operation) {
        case Operation::Enumerate:
            return std::to_string(ma::enumerateAdapters().size());
        case Operation::PciAddress:
            return ma::getPCIAddress("eth0").text;
        case Operation::FirmwareVersion:
            return test::componentsOf("eth0");
        case Operation::Prepare:
            return std::to_string(test::prepareImage("eth0", NEW_IMAGE).status);
        case Operation::Write: {
            const test::WriteResult result = test::writeImage("eth0", NEW_IMAGE);
            return result.done ? "done" : std::to_string(result.code) + " " + result.text;
        }
        case Operation::CapabilityWord:
            return ma::updateCapabilityWord("eth0", {FirmwareType::PXE}, code, text)
                       ? "done"
                       : std::to_string(code) + " " + text;
        case Operation::BootType:
            return ma::setBootType("eth0", ma::BootType::None) ? "done" : "not done";
        case Operation::Info:
            return std::to_string(ma::getAdapterInfo("eth0").speed);
    }
    return "";
} catch (const ma::PowerLoss& loss) {
    return std::string("power: ") + loss.what();
} catch (const ma::AdapterError& error) {
    return std::string("thrown: ") + error.what();
}

struct Case {
    Operation at;
    const char* sound;   // without a fault
    const char* failed;  // with Action::Fail, code 77, text "worn"
};

const Case CASES[] = {
    {Operation::Enumerate, "5", "0"},
    {Operation::PciAddress, "0000:03:00.0", "thrown: adapter eth0: worn"},
    {Operation::FirmwareVersion, "IMG_PXE 1, IMG_UEFI 0", "unreadable"},
    {Operation::Prepare, "0", "77"},
    {Operation::CapabilityWord, "done", "77 worn"},
    {Operation::BootType, "done", "not done"},
    {Operation::Info, "10000000000", "thrown: adapter eth0: worn"},
    {Operation::Write, "done", "77 worn"},
};

TEST(Faults, strikeAtTheirOperationAlone) {
    for (const Case& one : CASES) {
        SCOPED_TRACE(one.sound);
        const test::SimulatedAdapters adapters;
        adapters->injectFault("eth0", {.at = one.at, .action = Action::Fail, .code = 77, .text = "worn"});
        for (const Case& other : CASES) {
            if (other.at == one.at || other.at == Operation::Write) continue;
            EXPECT_EQ(other.sound, outcome(other.at));
        }
        EXPECT_EQ(one.failed, outcome(one.at));
        EXPECT_EQ(one.failed, outcome(one.at)) << "until it is cancelled";
        adapters->clearFaults("eth0");
        adapters->injectFault("eth0", {.at = one.at, .action = Action::Throw, .text = "gone", .once = true});
        EXPECT_EQ("thrown: gone", outcome(one.at));
        EXPECT_EQ(one.sound, outcome(one.at));
    }
}

TEST(Faults, aFailedWriteLeavesTheOldImageAndFreesTheAdapter) {
    for (const uint16_t percent : std::initializer_list<uint16_t>{0, 50, 100}) {
        for (const Action action : {Action::Fail, Action::Throw, Action::PowerLoss}) {
            test::SimulatedAdapters adapters;
            adapters->injectFault("eth0", {.action = action, .percent = percent, .text = "", .once = true});
            EXPECT_NE("done", outcome(Operation::Write));
            if (action == Action::PowerLoss) adapters.restart();
            EXPECT_EQ("IMG_PXE 1, IMG_UEFI 0", test::componentsOf("eth0"));
            EXPECT_EQ("done", outcome(Operation::Write));
            EXPECT_EQ("IMG_PXE 9, IMG_UEFI 0", test::componentsOf("eth0"));
        }
    }
}

TEST(Faults, areTakenFromTheDescription) {
    std::string description = test::TEST_ADAPTERS;
    description.insert(
        description.find("[[adapter]]", 5),
        "[[adapter.fault]]\nat = \"write\"\naction = \"fail\"\npercent = 30\ncode = 12\nonce = true\n");
    const test::SimulatedAdapters adapters(description);
    EXPECT_EQ("12 ordered fault: fail at write", outcome(Operation::Write));
}

/// Another process that writes to eth0 with a fault.
pid_t startWriter(const test::SimulatedAdapters& adapters, const ma::Fault& fault) {
    const pid_t child = ::fork();
    if (child != 0) return child;
    adapters->injectFault("eth0", fault);
    ::_exit(test::writeImage("eth0", NEW_IMAGE).done ? 0 : 1);
}

int endOf(pid_t child) {
    int status = 0;
    EXPECT_EQ(child, ::waitpid(child, &status, 0));
    return status;
}

/// Waits until the other process has the adapter: its id is in the lock file then.
void waitForHolder(const test::SimulatedAdapters& adapters, pid_t holder) {
    pid_t found = 0;
    while (found != holder) {
        ASSERT_EQ(0, ::waitpid(holder, nullptr, WNOHANG)) << "the writer never got the adapter";
        std::ifstream(adapters.stateDirectory() + "/eth0/flash.lock") >> found;
    }
}

TEST(Faults, aKilledWriterLeavesTheOldImage) {
    for (const uint16_t percent : std::initializer_list<uint16_t>{0, 30, 100}) {
        test::SimulatedAdapters adapters;
        const int status = endOf(startWriter(adapters, {.action = Action::Kill, .percent = percent}));
        ASSERT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGKILL) << status;
        adapters.restart();
        EXPECT_EQ("IMG_PXE 1, IMG_UEFI 0", test::componentsOf("eth0"));
        EXPECT_TRUE(test::writeImage("eth0", NEW_IMAGE).done) << "the lock died with its holder";
        EXPECT_EQ("IMG_PXE 9, IMG_UEFI 0", test::componentsOf("eth0"));
    }
}

TEST(Faults, oneWriterAtATimeAndItIsNamed) {
    const test::SimulatedAdapters adapters;
    const pid_t writer = startWriter(adapters, {.action = Action::Stall, .milliseconds = 60'000});
    waitForHolder(adapters, writer);
    if (HasFatalFailure()) return;
    const test::WriteResult result = test::writeImage("eth0", NEW_IMAGE);
    EXPECT_EQ(ma::ERROR_BUSY, result.code);
    EXPECT_EQ(
        "adapter eth0 is being written to by process " + std::to_string(writer) + "; wait until it is done",
        result.text);
    // Nobody else waits for it: readers, settings, the card's other function.
    EXPECT_EQ("IMG_PXE 1, IMG_UEFI 0", test::componentsOf("eth0"));
    EXPECT_EQ(0, test::prepareImage("eth0", NEW_IMAGE).status);
    EXPECT_TRUE(ma::setBootType("eth0", ma::BootType::None));
    EXPECT_TRUE(test::writeImage("eth1", NEW_IMAGE).done);
    ::kill(writer, SIGKILL);
    endOf(writer);
}

TEST(Faults, adaptersAnswerUntilTheProcessHasEnded) {
    // As a provider that is still loaded then: its destructor waits for the flash that runs.
    const auto provider = [] {
        if (ma::enumerateAdapters().size() != 5 || !test::writeImage("eth0", NEW_IMAGE).done) ::_exit(1);
    };
    const test::TempFolder folder;
    const std::string description = folder.write("adapters.toml", test::TEST_ADAPTERS);
    EXPECT_EXIT(
        {
            std::atexit(provider);
            ma::configureSimulator(description, folder / "state");
            std::exit(0);
        },
        testing::ExitedWithCode(0), "");
}

}  // namespace
