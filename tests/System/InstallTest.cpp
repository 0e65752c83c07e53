// SPDX-License-Identifier: Apache-2.0
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <thread>

#include "System/HeldFlash.h"
#include "System/Quenxctl.h"

namespace {

using test::contains;
using test::HeldFlash;
using test::Program;
using test::ProgramResult;
using ::testing::ContainsRegex;
using ::testing::HasSubstr;
using ::testing::Not;

constexpr const char* kNew = "IMG_PXE 2, IMG_UEFI 2";
const std::string kInstall = "install --target eth0 IMAGE";

class InstallTest : public test::Quenxctl {
  protected:
    std::string m_flash = m_folder / "adapters.state/eth0";
};

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

TEST_F(InstallTest, HasColoursOnATerminalOnly) {
    // As they come: a table, a success, a failure with a hint.
    const std::pair<std::string, std::string> table[] = {
        {"adapters", "\x1B[1mNAME\x1B[0m  "},
        {"install --force --target eth0 IMAGE", "\x1B[32meth0"},
        {"install --target eth0 missing.rom", "\x1B[31mquenxctl:\x1B[0m "},
        {"install --target eth0 missing.rom", "\r\n\x1B[2m"},
        {"instal", "\x1B[31mquenxctl:\x1B[0m "},
    };
    const auto shown = [this](const std::string& line, Program::Output output,
                              const std::vector<std::string>& environment) {
        const ProgramResult result = Program(command(line), output, environment).finish();
        return result.out + result.error;
    };
    const std::vector<std::string> usual = {"TERM=xterm", "NO_COLOR="};
    for (const auto& [line, look] : table) {
        EXPECT_THAT(shown(line, Program::Output::Terminal, usual), HasSubstr(look)) << line;
        const std::string others[] = {
            shown(line, Program::Output::Pipes, usual),
            shown(line, Program::Output::Terminal, {"TERM=dumb", "NO_COLOR="}),
            shown(line, Program::Output::Terminal, {"TERM=xterm", "NO_COLOR=1"}),
            shown("--json " + line, Program::Output::Terminal, usual),
            shown("--quiet " + line, Program::Output::Terminal, usual),
        };
        // The bar, which --json keeps on standard error, is written over with another sequence.
        for (const std::string& other : others)
            EXPECT_THAT(other, Not(ContainsRegex("\x1B\\[[0-9]+m"))) << line;
    }
}

TEST_F(InstallTest, FoldsTheHelpWhereThereIsRoomBesideTheNames) {
    const std::string head = "Usage: quenxctl jobs [OPTIONS]\r\n\r\nOptions:\r\n";
    const std::string option = "  -h,--help                   Print this help message";
    for (const auto& [width, rest] :
         {std::pair{"60", " and\r\n                              exit\r\n"}, {"59", " and\r\nexit\r\n"}}) {
        Program program({"/bin/sh", "-c", "stty cols $0; exec \"$@\"", width, QUENXCTL, "help", "jobs"},
                        Program::Output::Terminal);
        EXPECT_THAT(program.finish().out, HasSubstr(head + option + rest)) << width;
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

TEST_F(InstallTest, FollowsAnotherProcess) {
    HeldFlash flash(m_flash);
    Program first(command(kInstall));
    ASSERT_TRUE(flash.isWaitedFor());
    Program second(command("install --match eth0 --follow IMAGE"), Program::Output::Terminal);
    EXPECT_TRUE(second.waitFor("; waiting for the end of that."));
    flash.release();
    const ProgramResult followed = second.finish();
    EXPECT_EQ(followed.status, 0);
    EXPECT_TRUE(contains(followed.out, "was updated by an update that ran already.")) << followed.out;
    EXPECT_EQ(first.finish().status, 0);
}

TEST_F(InstallTest, TellsAnOrdinaryUserWhatOnlyRootMaySee) {
    if (const std::string why = test::whyNotNobody(); !why.empty()) GTEST_SKIP() << why;
    EXPECT_EQ(quenxctl("install --target eth0 IMAGE").status, 0);
    std::filesystem::permissions(m_folder.path(), std::filesystem::perms(0755));
    const ProgramResult listed = test::run(test::asNobody(command("adapters")));
    EXPECT_EQ(listed.status, 0);
    EXPECT_THAT(listed.error, HasSubstr("The firmware of eth0 cannot be read. Run quenxctl as root, "));
    EXPECT_THAT(listed.out, ::testing::AllOf(HasSubstr("eth1"), HasSubstr("IMG_PXE 1")));
    const ProgramResult checked = test::run(test::asNobody(command("check --target eth0 IMAGE")));
    EXPECT_EQ(checked.status, 1);
    EXPECT_THAT(checked.error, HasSubstr("The firmware of eth0 cannot be read.\nRun quenxctl as root, "));
}

}  // namespace
