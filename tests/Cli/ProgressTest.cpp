// SPDX-License-Identifier: Apache-2.0
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

/// What a display puts out that is no terminal, told of these percentages, a second apart.
std::string show(const std::vector<unsigned>& percentages) {
    std::ostringstream out;
    cli::LinePrinter printer(out, {false, -1});
    std::chrono::steady_clock::time_point now{};
    cli::ProgressDisplay display(printer, [&] { return now; });
    display.started("eth0", 0);
    for (const unsigned percent : percentages) {
        display.progressed(percent);
        now += seconds(1);
    }
    display.ended({});
    return out.str();
}

TEST(Display, WritesPlainLinesAndIsNotSilentWhenNothingMoves) {
    EXPECT_EQ(show({20, 20, 55, 100}), "eth0: 0 %\neth0: 20 %\neth0: 55 %, 0:03 left\neth0: 100 %\n");
    EXPECT_EQ(show(std::vector<unsigned>(25, 3)), "eth0: 0 %\neth0: 3 %\neth0: 3 %\n");
}

}  // namespace
