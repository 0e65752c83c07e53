// SPDX-License-Identifier: Apache-2.0
// An upgrade exchanges the libraries of running programs: what runs goes on with those that it has.
#include <gtest/gtest.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <thread>

#include "Support/SimulatedAdapters.h"
#include "System/HeldFlash.h"
#include "System/RunningDaemon.h"

namespace {

namespace fs = std::filesystem;
using test::contains;
using test::Program;
using test::ProgramResult;

/// A folder with copies of the libraries, and adapters on which a flash waits for the test.
class ExchangedTest : public ::testing::Test {
  protected:
    ExchangedTest() {
        fs::copy(QUENX_LIBRARIES, m_libraries, fs::copy_options::recursive);
        m_folder.write("provider.conf", "");
        m_folder.write("policy.toml", "# As if there were none.\n");
        m_folder.write("adapters.toml", test::kTestAdapters);
    }

    /// As a package manager does it: each file gives its name to another one, here to one that nobody can
    /// load.
    void exchange(const Program& running) const {
        std::ifstream maps("/proc/" + std::to_string(running.id()) + "/maps");
        const std::string mapped{std::istreambuf_iterator<char>(maps), {}};
        EXPECT_TRUE(contains(mapped, m_libraries + "/libQuenx_SoftwareUpdate.so")) << mapped;
        int count = 0;
        for (const fs::directory_entry& entry : fs::recursive_directory_iterator(m_libraries)) {
            if (!entry.is_regular_file()) continue;
            fs::rename(m_folder.write("new", "no library"), entry.path());
            ++count;
        }
        EXPECT_GE(count, 8);
    }

    /// Runs the program with the copies, exchanges them while it writes to eth0, and lets it go on.
    ProgramResult runThrough(const std::vector<std::string>& command) {
        test::HeldFlash flash(m_folder / "state/eth0");
        Program program(command, Program::Output::Pipes,
                        {m_place, "QUENX_BACKEND=simulator", "QUENX_ADAPTERS=" + m_folder / "adapters.toml",
                         "QUENX_ADAPTER_STATE=" + m_folder / "state"});
        EXPECT_TRUE(flash.isWaitedFor());
        exchange(program);
        flash.release();
        return program.finish();
    }

    test::TempFolder m_folder;
    const std::string m_libraries = m_folder / "libraries";
    // Before the place that the programs carry in them.
    const std::string m_place = "LD_LIBRARY_PATH=" + m_libraries;
    const std::string m_image = m_folder.write("new.rom", test::withRevision(test::realRom("efi-virtio"), 2));
};

TEST_F(ExchangedTest, LibrariesLetTheCommandLineFinish) {
    const ProgramResult result =
        runThrough({QUENXCTL, "install", "--config", m_folder / "provider.conf", "--policy",
                    m_folder / "policy.toml", "--target", "eth0", m_image});
    EXPECT_EQ(result.status, 0) << result.out << result.error;
    EXPECT_TRUE(contains(result.out, "IMG_UEFI  0 -> 2")) << result.out;
}

TEST_F(ExchangedTest, LibrariesLetAnotherObjectManagerFinishAndServe) {
    const ProgramResult result = runThrough({QUENX_CMPI_HOST, m_libraries + "/cmpi/libQuenx_Cmpi.so",
                                             m_folder / "policy.toml", m_folder / "provider.conf", m_image});
    EXPECT_EQ(result.status, 0) << result.error;
    EXPECT_EQ(result.out, "returned 4096\nended with 7\nthen: 0 0 0\n") << result.error;
}

TEST_F(ExchangedTest, LibrariesLetTheDaemonFinishServeAndWriteAgain) {
    test::RunningDaemon daemon({}, {m_place});
    const auto install = [&](const std::string& more) {
        return test::run({"/usr/bin/env", "QUENXCTL_USER=admin", "QUENXCTL_PASSWORD=admin", QUENXCTL,
                          "--server", "https://127.0.0.1:" + std::to_string(daemon.httpsPort()), "--cacert",
                          daemon.folder() / "cert.pem", "install", "--target", "eth0", m_image, more});
    };
    test::HeldFlash flash(daemon.folder() / "state/eth0");
    const std::string port = daemon.lines("ein", "Quenx_EthernetPort").at(0);
    const std::string service = daemon.lines("ein", "Quenx_SoftwareInstallationService").at(0);
    const std::string arguments =
        "InstallFromURI.URI=\"file://" + daemon.image() + "\",InstallOptions=5,Target=";
    EXPECT_TRUE(contains(daemon.wbemcli("cm", service, {arguments + port}).out, "4096"));
    EXPECT_TRUE(flash.isWaitedFor());
    exchange(daemon.program());
    for (const std::string& className : daemon.lines("ecn", ""))
        EXPECT_EQ(daemon.wbemcli("ei", className, {}, true).status, 0) << className;
    flash.release();
    const std::string job = daemon.lines("ein", "Quenx_ConcreteJob").at(0);
    for (int round = 0; round < 300 && !contains(daemon.lines("gi", job).at(0), "JobState=7"); ++round)
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
    const ProgramResult again = install("--force");
    EXPECT_EQ(again.status, 0) << again.out << again.error;
    EXPECT_EQ(daemon.stop().status, 0);
}

}  // namespace
