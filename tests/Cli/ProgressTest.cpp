#include <gtest/gtest.h>

#include <chrono>
#include <sstream>

#include "Cli/ProgressDisplay.h"
#include "Cli/ProgressText.h"
#include "Cli/TextTable.h"

namespace {

using std::chrono::milliseconds;
using std::chrono::seconds;

TEST(ProgressText, FitsTheWidth) {
    const cli::Progress half{"eth0", 50, 256000, milliseconds(2000), 10};
    EXPECT_EQ(cli::barText(half, 80),
              "eth0  [=========>         ]  50 %  125.0 KiB of 250.0 KiB  50.0 KiB/s  0:03 left");
    EXPECT_EQ(cli::barText(half, 40), "eth0  [=============>            ]  50 %");
    EXPECT_EQ(cli::barText(half, 12), "eth0   50 %");
    for (std::size_t width = 20; width < 120; ++width) {
        EXPECT_LE(cli::barText(half, width).size(), width);
    }
    EXPECT_EQ(cli::lineText(half), "eth0: 50 %, 125.0 KiB of 250.0 KiB, 50.0 KiB/s, 0:03 left");
}

TEST(ProgressText, SaysNoMoreThanItKnows) {
    EXPECT_EQ(cli::lineText({"eth0", 0, 0, milliseconds(0), 0}), "eth0: 0 %");
    EXPECT_EQ(cli::lineText({"eth0", 10, 0, milliseconds(5000), 10}), "eth0: 10 %");
    EXPECT_EQ(cli::lineText({"eth0", 20, 0, milliseconds(5000), 10}), "eth0: 20 %, 0:40 left");
    EXPECT_EQ(cli::lineText({"eth0", 100, 2048, milliseconds(5000), 10}), "eth0: 100 %, 2.0 KiB of 2.0 KiB");
    EXPECT_EQ(cli::byteText(0), "0 B");
    EXPECT_EQ(cli::byteText(1023), "1023 B");
    EXPECT_EQ(cli::byteText(std::uint64_t{5} << 40), "5.0 TiB");
    EXPECT_EQ(cli::durationText(seconds(59)), "0:59");
    EXPECT_EQ(cli::durationText(seconds(3723)), "1:02:03");
}

TEST(Terminal, CutsLongTextInTheMiddle) {
    EXPECT_EQ(cli::elideMiddle("abcdefghij", 10), "abcdefghij");
    EXPECT_EQ(cli::elideMiddle("abcdefghij", 8), "abc...ij");
    EXPECT_EQ(cli::elideMiddle("abcdefghij", 2), "..");
    EXPECT_EQ(cli::printable("a\x1b[1m\n\x7f"), "a\\x1b[1m\\x0a\\x7f");
}

class Display : public ::testing::Test {
  protected:
    /// What a run of 20, 20, 55, 100 percent, a second apart, puts out.
    std::string show(bool canRewrite) {
        std::ostringstream out;
        cli::LinePrinter printer(out, {canRewrite, -1});
        std::chrono::steady_clock::time_point now{};
        cli::ProgressDisplay display(printer, [&] { return now; });
        display.started("eth0", 0);
        for (const unsigned percent : {20U, 20U, 55U, 100U}) {
            if (percent == 55) display.interrupted();
            display.progressed(percent);
            now += seconds(1);
        }
        display.ended({});
        return out.str();
    }
};

TEST_F(Display, WritesOverOneLineOnATerminal) {
    const std::string clear = "\r\x1B[K";
    const std::string bar20 = "eth0  [========>                               ]  20 %";
    EXPECT_EQ(show(true),
              clear + bar20 + clear + bar20 + clear +
                  "The update of eth0 cannot be stopped half-way: it goes on to its end, and this "
                  "program waits for it.\n" +
                  bar20 + clear + "eth0  [======================>                 ]  55 %  0:03 left" +
                  clear + "eth0  [========================================] 100 %\n");
}

TEST_F(Display, WritesPlainLinesElsewhere) {
    EXPECT_EQ(
        show(false),
        "eth0: 0 %\neth0: 20 %\n"
        "The update of eth0 cannot be stopped half-way: it goes on to its end, and this program waits for "
        "it.\n"
        "eth0: 55 %, 0:03 left\neth0: 100 %\n");
}

TEST_F(Display, IsNotSilentWhenNothingMoves) {
    std::ostringstream out;
    cli::LinePrinter printer(out, {});
    std::chrono::steady_clock::time_point now{};
    cli::ProgressDisplay display(printer, [&] { return now; });
    display.started("eth0", 0);
    for (int second = 0; second < 25; ++second) {
        display.progressed(3);
        now += seconds(1);
    }
    EXPECT_EQ(out.str(), "eth0: 0 %\neth0: 3 %\neth0: 3 %\n");
}

TEST(TextTable, AlignsAndDisarms) {
    std::ostringstream out;
    cli::printTable(out, {{"A", "B"}, {"long\n", "x"}, {"", ""}});
    EXPECT_EQ(out.str(), "A         B\nlong\\x0a  x\n          \n");
}

}  // namespace
