#include <signal.h>

#include <algorithm>

#include "System/Quenxctl.h"

namespace {

using test::Program;
using test::ProgramResult;

constexpr const char* OLD = "IMG_PXE 0, IMG_UEFI 0";
constexpr const char* NEW = "IMG_PXE 1, IMG_UEFI 0";
/// An update at this speed takes a second and a half.
constexpr unsigned SLOW = 170'000;

bool contains(const std::string& text, const std::string& part) {
    return text.find(part) != std::string::npos;
}

class Update : public test::Quenxctl {
  protected:
    std::vector<std::string> install(const std::string& adapter = "eth0") const {
        return command({"install", "--target", adapter, image_});
    }
};

TEST_F(Update, WritesTheImageAndSaysWhatChanged) {
    EXPECT_EQ(firmwareOf("eth0"), OLD);
    const ProgramResult result = test::run(install());
    EXPECT_EQ(result.status, 0) << result.error;
    EXPECT_TRUE(result.out.ends_with("eth0 is updated.\n  IMG_PXE   0 -> 1\n  IMG_UEFI  0 -> 0\n"))
        << result.out;
    EXPECT_EQ(result.error, "");
    EXPECT_EQ(firmwareOf("eth0"), NEW);
    EXPECT_EQ(firmwareOf("eth1"), OLD);

    const ProgramResult again = test::run(install());
    EXPECT_EQ(again.status, 3);
    EXPECT_TRUE(again.out.starts_with("eth0 is already current: ")) << again.out;
    EXPECT_EQ(quenxctl({"install", "--target", "eth0", image_, "--force"}).status, 0);
}

TEST_F(Update, ShowsABarOnATerminalOnly) {
    describeAdapters(SLOW);
    const struct {
        Program::Output output;
        std::vector<std::string> environment;
        bool hasBar;
    } rows[] = {
        {Program::Output::Terminal, {"TERM=xterm", "NO_COLOR"}, true},
        {Program::Output::Terminal, {"TERM=dumb", "NO_COLOR"}, false},
        {Program::Output::Terminal, {"TERM=xterm", "NO_COLOR=1"}, false},
        {Program::Output::Pipes, {"TERM=xterm", "NO_COLOR"}, false},
    };
    for (const auto& row : rows) {
        std::vector<std::string> forced = install();
        forced.emplace_back("--force");
        const ProgramResult result = Program(forced, row.output, row.environment).finish();
        EXPECT_EQ(result.status, 0) << result.out;
        EXPECT_EQ(contains(result.out, "\x1B["), row.hasBar) << result.out;
        EXPECT_EQ(contains(result.out, "eth0  ["), row.hasBar) << result.out;
        EXPECT_EQ(contains(result.out, "eth0: 0 %"), !row.hasBar) << result.out;
        EXPECT_TRUE(contains(result.out, "100 %")) << result.out;
    }
}

TEST_F(Update, CtrlCWaitsForTheEnd) {
    describeAdapters(SLOW);
    Program program(install(), Program::Output::Terminal, {"TERM=xterm", "NO_COLOR"});
    ASSERT_TRUE(program.waitFor("KiB/s"));
    program.type("\x03");
    const ProgramResult result = program.finish();
    EXPECT_EQ(result.status, 0) << result.out;
    EXPECT_TRUE(contains(result.out, "it goes on to its end, and this program waits for it.")) << result.out;
    EXPECT_EQ(firmwareOf("eth0"), NEW);
}

TEST_F(Update, GoesOnWhenNobodyListensAnyMore) {
    describeAdapters(SLOW);
    Program program(install());
    ASSERT_TRUE(program.waitFor("eth0: 0 %"));
    program.closeOutput();
    EXPECT_EQ(program.finish().status, 0);
    EXPECT_EQ(firmwareOf("eth0"), NEW);
}

TEST_F(Update, KilledHalfWayLeavesTheOldFirmwareAndANewStartWorks) {
    describeAdapters(SLOW);
    {
        Program program(install());
        ASSERT_TRUE(program.waitFor("KiB/s"));
        program.send(SIGKILL);
        EXPECT_EQ(program.finish().status, -SIGKILL);
    }
    describeAdapters(0);
    EXPECT_EQ(firmwareOf("eth0"), OLD);
    EXPECT_EQ(test::run(install()).status, 0);
    EXPECT_EQ(firmwareOf("eth0"), NEW);
}

TEST_F(Update, ASecondProcessIsToldWhoHoldsTheAdapter) {
    describeAdapters(SLOW);
    Program first(install());
    ASSERT_TRUE(first.waitFor("KiB/s"));
    const ProgramResult second = test::run(install());
    EXPECT_EQ(second.status, 1) << second.out;
    EXPECT_TRUE(contains(second.error, std::to_string(first.id()))) << second.error;
    EXPECT_TRUE(contains(second.error, "The update of eth0 failed: ")) << second.error;
    EXPECT_EQ(test::run(install("eth1")).status, 0) << "another port is free";
    EXPECT_EQ(first.finish().status, 0);
    EXPECT_EQ(firmwareOf("eth0"), NEW);
}

}  // namespace
