#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <fstream>

#include "MidAPI/Simulator/Simulator.h"
#include "MidAPI/ma.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TestRoms.h"

namespace {

using Action = ma::Fault::Action;
using utils::FirmwareType;

const std::vector<uint8_t> NEW_IMAGE = test::madeRom({{FirmwareType::PXE, 9}});

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

TEST(Processes, aKilledWriterLeavesTheOldImage) {
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

TEST(Processes, oneWriterAtATimeAndItIsNamed) {
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

TEST(Processes, adaptersAnswerUntilTheProcessHasEnded) {
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
