// SPDX-License-Identifier: Apache-2.0
#include <signal.h>

#include <chrono>
#include <thread>

#include "System/HeldFlash.h"
#include "System/Quenxctl.h"

namespace {

using test::contains;
using test::HeldFlash;
using test::Program;
using test::ProgramResult;
using ::testing::EndsWith;
using ::testing::HasSubstr;

constexpr const char* kOld = "IMG_PXE 1, IMG_UEFI 0";
constexpr const char* kNew = "IMG_PXE 2, IMG_UEFI 2";
const std::string kInstall = "install --target eth0 IMAGE";

class InstallTest : public test::Quenxctl {
  protected:
    std::string m_flash = m_folder / "adapters.state/eth0";
};

TEST_F(InstallTest, WritesTheImageAndSaysWhatChanged) {
    EXPECT_EQ(firmwareOf("eth0"), kOld);
    const ProgramResult result = quenxctl(kInstall);
    EXPECT_EQ(result.status, 0) << result.error;
    EXPECT_THAT(result.out,
                EndsWith("eth0 (simulated) was updated.\n  IMG_PXE   1 -> 2\n  IMG_UEFI  0 -> 2\n"));
    EXPECT_EQ(result.error, "");
    EXPECT_THAT(quenxctl("adapters").out,
                ::testing::StartsWith(
                    "NAME  BACKEND    PCI      IDS        UPDATABLE  FIRMWARE                 DESCRIPTION\n"
                    "eth0  simulator  03:00.0  1af4:1041  yes        IMG_PXE 2, IMG_UEFI 2    \n"
                    "eth1  simulator  03:00.1  1af4:1041  yes        IMG_PXE 1, IMG_UEFI 0    \n"));
    for (const std::string address : {"03:00.0", "0000:03:00.0"}) {
        const ProgramResult again = quenxctl("install --target " + address + " IMAGE");
        EXPECT_EQ(again.status, 3);
        EXPECT_EQ(again.out,
                  "eth0 (simulated) is already current: it has IMG_PXE 2, IMG_UEFI 2.\nUse --force to write "
                  "it again.\n");
    }
    EXPECT_THAT(quenxctl("update --target eth0 IMAGE --force").out,
                EndsWith("eth0 (simulated) was rewritten with the same version.\n"
                         "  IMG_PXE   2 (unchanged)\n  IMG_UEFI  2 (unchanged)\n"));
}

TEST_F(InstallTest, LeavesAnAuditLine) {
    const std::tuple<std::string, std::string, std::string> table[] = {
        {"check", "CheckImage", "0"}, {"install", "InstallFromURI", "4096, Job="}};
    for (const auto& [verb, operation, returned] : table)
        EXPECT_THAT(quenxctl(verb + " --target eth0 IMAGE --force", {"QUENX_LOG=stderr"}).error,
                    ::testing::AllOf(HasSubstr("[audit] user=\""),
                                     HasSubstr("\" address=\"local\" operation=\"" + operation),
                                     HasSubstr("arguments=\"URI='file://" + m_image + "'"),
                                     HasSubstr("outcome=\"returned " + returned)));
}

TEST_F(InstallTest, ShowsABarOnATerminalOnly) {
    const std::tuple<Program::Output, std::vector<std::string>, bool> table[] = {
        {Program::Output::Terminal, {"TERM=xterm", "NO_COLOR"}, true},
        {Program::Output::Terminal, {"TERM=dumb", "NO_COLOR"}, false},
        {Program::Output::Terminal, {"TERM=xterm", "NO_COLOR=1"}, false},
        {Program::Output::Pipes, {"TERM=xterm", "NO_COLOR"}, false},
    };
    for (const auto& [output, environment, hasBar] : table) {
        const std::string out = Program(command(kInstall + " --force"), output, environment).finish().out;
        EXPECT_EQ(contains(out, "eth0  ["), hasBar) << out;
        EXPECT_EQ(contains(out, "eth0: 0 %"), !hasBar) << out;
        EXPECT_TRUE(contains(out, "100 %")) << out;
    }
}

TEST_F(InstallTest, WaitsForTheEndAfterCtrlC) {
    HeldFlash flash(m_flash);
    Program program(command(kInstall), Program::Output::Terminal, {"TERM=xterm", "NO_COLOR"});
    ASSERT_TRUE(program.waitFor("eth0  ["));
    // More than once, as people do. The thread sanitizer of Clang 14 also loses a signal now and then.
    for (int round = 0; round < 6; ++round) {
        program.type("\x03");
        std::this_thread::sleep_for(std::chrono::milliseconds(100));
    }
    EXPECT_TRUE(program.waitFor("it runs to its end, and this program waits for it."));
    flash.release();
    EXPECT_EQ(program.finish().status, 0);
    EXPECT_EQ(firmwareOf("eth0"), kNew);
}

TEST_F(InstallTest, LeavesTheOldFirmwareWhenKilledHalfway) {
    std::string description = test::kTestAdapters;
    description.insert(description.find("components"),
                       "fault = [ { at = \"write\", action = \"kill\", percent = 50 } ], ");
    m_folder.write("adapters.toml", description);
    EXPECT_EQ(quenxctl(kInstall).status, -SIGKILL);
    m_folder.write("adapters.toml", test::kTestAdapters);
    EXPECT_EQ(firmwareOf("eth0"), kOld);
    EXPECT_EQ(quenxctl(kInstall).status, 0);
    EXPECT_EQ(firmwareOf("eth0"), kNew);
}

TEST_F(InstallTest, HoldsTheAdapterToTheEndThoughNobodyListens) {
    HeldFlash flash(m_flash);
    Program first(command(kInstall));
    ASSERT_TRUE(flash.isWaitedFor());
    first.closeOutput();
    expectError(kInstall, 1,
                "The update of eth0 failed: adapter eth0 is being written to by process " +
                    std::to_string(first.id()));
    EXPECT_EQ(firmwareOf("eth0"), kOld) << "readers do not wait";
    EXPECT_EQ(quenxctl("install --target eth1 IMAGE").status, 0) << "another port is free";
    flash.release();
    EXPECT_EQ(first.finish().status, 0);
    EXPECT_EQ(firmwareOf("eth0"), kNew);
}

}  // namespace
