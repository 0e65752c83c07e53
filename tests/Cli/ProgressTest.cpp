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
    EXPECT_EQ(cli::lineText({"eth0", 10, 0, milliseconds(5000), 10}), "eth0: 10 %");
    EXPECT_EQ(cli::lineText({"eth0", 20, 0, milliseconds(5000), 10}), "eth0: 20 %, 0:40 left");
    EXPECT_EQ(cli::lineText({"eth0", 100, 1023, milliseconds(5000), 10}), "eth0: 100 %, 1023 B of 1023 B");
    EXPECT_EQ(cli::byteText(std::uint64_t{5} << 40), "5.0 TiB");
    EXPECT_EQ(cli::durationText(seconds(3723)), "1:02:03");
}

TEST(Terminal, CutsAndDisarmsText) {
    EXPECT_EQ(cli::elideMiddle("abcdefghij", 10), "abcdefghij");
    EXPECT_EQ(cli::elideMiddle("abcdefghij", 8), "abc...ij");
    EXPECT_EQ(cli::elideMiddle("abcdefghij", 2), "..");
    std::ostringstream out;
    cli::printTable(out, {{"A", "B"}, {"long\n\x1b", "x"}, {"", ""}});
    EXPECT_EQ(out.str(), "A             B\nlong\\x0a\\x1b  x\n              \n");
}

/// What a display puts out when told of these percentages, a second apart, and of Ctrl-C before 55.
std::string show(bool canRewrite, const std::vector<unsigned>& percentages) {
    std::ostringstream out;
    cli::LinePrinter printer(out, {canRewrite, -1});
    std::chrono::steady_clock::time_point now{};
    cli::ProgressDisplay display(printer, [&] { return now; });
    display.started("eth0", 0);
    for (const unsigned percent : percentages) {
        if (percent == 55) display.interrupted();
        display.progressed(percent);
        now += seconds(1);
    }
    display.ended({});
    return out.str();
}

const std::string kGoesOn =
    "The update of eth0 cannot be stopped half-way: it goes on to its end, and this program waits for it.\n";

TEST(Display, WritesOverOneLineOnATerminal) {
    const std::string clear = "\r\x1B[K";
    const std::string bar20 = "eth0  [========>                               ]  20 %";
    EXPECT_EQ(show(true, {20, 20, 55, 100}),
              clear + bar20 + clear + bar20 + clear + kGoesOn + bar20 + clear +
                  "eth0  [======================>                 ]  55 %  0:03 left" + clear +
                  "eth0  [========================================] 100 %\n");
}

TEST(Display, WritesPlainLinesElsewhere) {
    EXPECT_EQ(show(false, {20, 20, 55, 100}),
              "eth0: 0 %\neth0: 20 %\n" + kGoesOn + "eth0: 55 %, 0:03 left\neth0: 100 %\n");
    // It is not silent when nothing moves.
    EXPECT_EQ(show(false, std::vector<unsigned>(25, 3)), "eth0: 0 %\neth0: 3 %\neth0: 3 %\n");
}

}  // namespace
