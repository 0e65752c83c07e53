// SPDX-License-Identifier: Apache-2.0
#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <sstream>

#include "Cli/Display/Output.h"
#include "Cli/Display/Progress.h"
#include "Cli/Update/Jobs.h"

namespace {

using core::CimType;
using core::CimValue;
using std::chrono::milliseconds;
using std::chrono::seconds;

TEST(OutputTest, WritesValuesAsTextAndAsJson) {
    const std::tuple<CimValue, const char*, const char*> table[] = {
        {CimValue::null(CimType::String), "NULL", "null"},
        {CimValue::of(CimType::Boolean, true), "TRUE", "true"},
        {CimValue::of(CimType::Uint64, std::uint64_t{18446744073709551615U}), "18446744073709551615",
         "18446744073709551615"},
        {CimValue::of(CimType::Sint8, std::int64_t{-5}), "-5", "-5"},
        {CimValue::of(CimType::String, std::string("a\"\\\n")), "\"a\\\"\\\\\\x0a\"", "\"a\\\"\\\\\\n\""},
        {CimValue::arrayOf(CimType::Uint16, {std::uint64_t{5}, std::uint64_t{3}}), "{5, 3}", "[5,3]"},
        {CimValue::arrayOf(CimType::String, {}), "{}", "[]"},
    };
    for (const auto& [value, text, json] : table) {
        EXPECT_EQ(cli::displayText(value), text);
        EXPECT_EQ(cli::Json(value).dump(), json);
    }
    std::ostringstream out;
    cli::printJson(out, {{"name", "no text \xff"}});
    EXPECT_NE(out.str().find("\\ufffd"), std::string::npos);
    EXPECT_EQ(cli::Json::parse(out.str())["name"], "no text \xEF\xBF\xBD");
}

TEST(OutputTest, CutsAlignsAndDisarmsText) {
    EXPECT_EQ(cli::elideMiddle("abcdefghij", 10), "abcdefghij");
    EXPECT_EQ(cli::elideMiddle("abcdefghij", 8), "abc...ij");
    EXPECT_EQ(cli::elideMiddle("abcdefghij", 4), "a...");
    EXPECT_EQ(cli::elideMiddle("abcdefghij", 3), "...");
    EXPECT_EQ(cli::elideMiddle("abcdefghij", 2), "..");
    EXPECT_EQ(cli::elideMiddle("äöüäöüäöüä", 8), "äöü...üä");
    EXPECT_EQ(cli::printable("\x7F\xC2\x9B\x80 \xC2\xA0\xE2\x82\xAC"),
              "\\x7f\\xc2\\x9b\\x80 \xC2\xA0\xE2\x82\xAC");
    EXPECT_EQ(cli::printable("\xE2\x80\xB0\xE2\x80\xAE\xE2\x81\xA6\xE2\x81"),
              "\xE2\x80\xB0\\xe2\\x80\\xae\\xe2\\x81\\xa6\\xe2\\x81");
    for (const std::string hidden :
         {"\x1F", "\xC2\x80", "\xC2\x9F", "\xC2\xAD", "\xD8\x9C", "\xE2\x80\x8B", "\xE2\x80\x8F",
          "\xE2\x80\xA8", "\xE2\x80\xAE", "\xE2\x81\xA0", "\xE2\x81\xAF", "\xEF\xBB\xBF"})
        EXPECT_TRUE(cli::printable(hidden).starts_with("\\x")) << hidden;
    for (const std::string shown : {" ", "\xC2\xA0", "\xE2\x80\x8A", "\xE2\x80\x90", "\xE2\x80\xA7",
                                    "\xE2\x80\xAF", "\xE2\x81\x9F", "\xE2\x81\xB0", "\xE1\x80\x8B"})
        EXPECT_EQ(cli::printable(shown), shown);
    std::ostringstream out;
    cli::printTable(out, {{"A", "B"}, {"long\n\x1b", "x"}, {"größe", "y"}, {"", ""}});
    std::ostringstream wide;
    cli::printTable(wide, {{std::string(100000, 'x'), "a"}, {"y", "b"}});
    EXPECT_EQ(wide.str(), std::string(100000, 'x') + "  a\ny" + std::string(201, ' ') + "b\n");
    EXPECT_EQ(out.str(), "A             B\nlong\\x0a\\x1b  x\ngröße         y\n              \n");
}

TEST(OutputTest, WrapsTextBetweenWords) {
    using Lines = std::vector<std::string>;
    EXPECT_EQ(cli::wrapped("fits as it is", 13), (Lines{"fits as it is"}));
    EXPECT_EQ(cli::wrapped("  --name    says who it is", 20, 12),
              (Lines{"  --name    says who", "            it is"}));
    EXPECT_EQ(cli::wrapped("/a/path/without/end", 8), (Lines{"/a/path/", "without/", "end"}));
    EXPECT_EQ(cli::wrapped("12345 789", 5), (Lines{"12345", "789"}));
    EXPECT_EQ(cli::wrapped("123456 89", 5), (Lines{"12345", "6 89"}));
    EXPECT_EQ(cli::wrapped(" 23456", 5), (Lines{" 2345", "6"})) << "no empty line";
}

TEST(OutputTest, FitsATableToTheTerminal) {
    const cli::Rows rows = {{"NAME", "WHERE", "WHY"},
                            {"eth0", "/a/long/path/without/a/space", "größer than what is there"}};
    const auto printed = [&](std::size_t width) {
        std::ostringstream out;
        cli::printTable(out, rows, width);
        return out.str();
    };
    const std::string whole =
        "NAME  WHERE                         WHY\n"
        "eth0  /a/long/path/without/a/space  größer than what is there\n";
    EXPECT_EQ(printed(61), whole);
    EXPECT_EQ(printed(60),
              "NAME  WHERE                        WHY\n"
              "eth0  /a/long/path/without/a/spac  größer than what is there\n"
              "      e\n");
    EXPECT_EQ(printed(36),
              "NAME  WHERE           WHY\n"
              "eth0  /a/long/path/w  größer than\n"
              "      ithout/a/space  what is there\n");
    EXPECT_EQ(printed(35),
              "NAME   eth0\n"
              "WHERE  /a/long/path/without/a/space\n"
              "WHY    größer than what is there\n")
        << "columns too narrow to read";
}

/// What the stream shows of this, without its escape sequences, and how many of them there were.
std::pair<std::string, std::size_t> withoutColours(std::string shown) {
    std::size_t count = 0;
    for (std::size_t at = 0; (at = shown.find("\x1B[", at)) != std::string::npos; ++count)
        shown.erase(at, shown.find('m', at) + 1 - at);
    return {shown, count};
}

TEST(ColourTest, LeavesTablesAsTheyAre) {
    const cli::Rows rows = {{"NAME", "OUTCOME", "WHY"},
                            {"eth0", {"größer\x1B", cli::Look::Failure}, "too long for the line, as it is"}};
    for (const std::size_t width : {200U, 40U, 20U}) {
        std::ostringstream plain;
        cli::printTable(plain, rows, width);
        std::ostringstream coloured;
        cli::allowColours(coloured, {.canRewrite = true});
        cli::printTable(coloured, rows, width);
        const auto [text, count] = withoutColours(coloured.str());
        EXPECT_EQ(text, plain.str());
        // A device's own sequence does not become one.
        EXPECT_EQ(count, 2 * 4U);
        EXPECT_NE(coloured.str().find("\x1B[31mgrößer\\x1b\x1B[0m"), std::string::npos);
    }
}

TEST(ProgressTest, FitsTheWidthAndSaysNoMoreThanItKnows) {
    const cli::UpdateProgress half{"eth0", 50, 256000, milliseconds(2000), 10};
    EXPECT_EQ(cli::barText(half, 80),
              "eth0  [=========>         ]  50 %  125.0 KiB of 250.0 KiB  50.0 KiB/s  0:03 left");
    EXPECT_EQ(cli::barText(half, 40), "eth0  [=============>            ]  50 %");
    // Each width that makes room for more, and the widest bar.
    std::string steps;
    std::ptrdiff_t blanks = 0;
    for (std::size_t width = 1; width <= 120; ++width) {
        const std::string text = cli::barText(half, width);
        EXPECT_LE(text.size(), std::max<std::size_t>(width, 11));
        const std::string details = text.substr(text.rfind(']') + 1);
        const auto now = std::ranges::count(details, ' ');
        if (now != blanks || width == 120) steps += std::to_string(width) + " " + text + "\n";
        blanks = now;
    }
    EXPECT_EQ(steps,
              "1 eth0   50 %\n"
              "22 eth0  [====>   ]  50 %\n"
              "46 eth0  [====>   ]  50 %  125.0 KiB of 250.0 KiB\n"
              "58 eth0  [====>   ]  50 %  125.0 KiB of 250.0 KiB  50.0 KiB/s\n"
              "69 eth0  [====>   ]  50 %  125.0 KiB of 250.0 KiB  50.0 KiB/s  0:03 left\n"
              "120 eth0  [====================>                   ]  50 %  125.0 KiB of 250.0 KiB  50.0 "
              "KiB/s  0:03 left\n");
    EXPECT_EQ(cli::lineText(half), "eth0: 50 %, 125.0 KiB of 250.0 KiB, 50.0 KiB/s, 0:03 left");
    EXPECT_EQ(cli::lineText({"eth0", 10, 0, milliseconds(5000), 10}), "eth0: 10 %");
    EXPECT_EQ(cli::lineText({"eth0", 20, 0, milliseconds(5000), 10}), "eth0: 20 %, 0:40 left");
    EXPECT_EQ(cli::lineText({"eth0", 20, 0, milliseconds(299), 10}), "eth0: 20 %");
    EXPECT_EQ(cli::lineText({"eth0", 20, 0, milliseconds(300), 10}), "eth0: 20 %, 0:03 left");
    EXPECT_EQ(cli::lineText({"eth0", 100, 1023, milliseconds(5000), 10}), "eth0: 100 %, 1023 B of 1023 B");
    EXPECT_EQ(cli::lineText({"a\x1B", 99, 1024, milliseconds(99000), 0}),
              "a\\x1b: 99 %, 1013 B of 1.0 KiB, 10 B/s, 0:01 left");
    const std::pair<std::uint64_t, const char*> sizes[] = {{1023, "1023 B"},
                                                           {1024, "1.0 KiB"},
                                                           {1024 * 1024 - 52, "1023.9 KiB"},
                                                           {1024 * 1024, "1.0 MiB"},
                                                           {std::uint64_t{5} << 40, "5.0 TiB"},
                                                           {std::uint64_t{5} << 50, "5120.0 TiB"}};
    for (const auto& [bytes, text] : sizes)
        EXPECT_EQ(cli::byteText(bytes), text);
    const std::pair<int, const char*> durations[] = {
        {59, "0:59"}, {60, "1:00"}, {3599, "59:59"}, {3600, "1:00:00"}, {3723, "1:02:03"}};
    for (const auto& [duration, text] : durations)
        EXPECT_EQ(cli::durationText(seconds(duration)), text);
}

TEST(JobViewTest, NamesItsState) {
    std::string names;
    cli::JobView job;
    for (job.state = 1; job.state < 14; ++job.state)
        names += job.stateName() + ", ";
    EXPECT_EQ(names,
              "State 1, New, Starting, Running, Suspended, Shutting Down, Completed, Terminated, Killed, "
              "Exception, Service, Query Pending, State 13, ");
}

/// What a display writes into a file when it sees these percentages, a second apart.
std::string show(const std::vector<unsigned>& percentages) {
    std::ostringstream out;
    cli::LinePrinter printer(out, {});
    std::chrono::steady_clock::time_point now{};
    cli::ProgressDisplay display(printer, [&] { return now; });
    display.started("eth0", 0);
    for (const unsigned percent : percentages) {
        display.progressed(percent);
        now += seconds(1);
    }
    display.ended();
    return out.str();
}

TEST(ProgressTest, WaitsForNobodyWhoDoesNotRead) {
    int pipe[2] = {};
    ASSERT_EQ(::pipe2(pipe, O_NONBLOCK), 0);
    const std::string piece(4096, 'x');
    while (::write(pipe[1], piece.data(), piece.size()) > 0) {
    }
    std::ostringstream out;
    cli::LinePrinter(out, {false, pipe[1]}).print("lost");
    cli::LinePrinter(out, {true, pipe[1]}).rewrite("lost");
    EXPECT_EQ(out.str(), "");
    ::close(pipe[0]);
    ::close(pipe[1]);
}

TEST(ProgressTest, WritesPlainLinesAndIsNotSilentWhenNothingMoves) {
    EXPECT_EQ(show({20, 20, 55, 100}), "eth0: 0 %\neth0: 20 %\neth0: 55 %, 0:03 left\neth0: 100 %\n");
    EXPECT_EQ(show(std::vector<unsigned>(21, 3)), "eth0: 0 %\neth0: 3 %\neth0: 3 %\n");
    EXPECT_EQ(show(std::vector<unsigned>(20, 3)), "eth0: 0 %\neth0: 3 %\n");
    EXPECT_EQ(
        show({9, 10, 19, 20, 99, 100, 100}),
        "eth0: 0 %\neth0: 10 %, 1:30 left\neth0: 20 %, 0:22 left\neth0: 99 %, 0:01 left\neth0: 100 %\n");
}

}  // namespace
