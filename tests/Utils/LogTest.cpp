// SPDX-License-Identifier: Apache-2.0
#include "Utils/Log.h"

#include <dlfcn.h>
#include <execinfo.h>
#include <gtest/gtest.h>
#include <syslog.h>

#include <algorithm>
#include <cerrno>
#include <cinttypes>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <thread>

#include "Support/SyslogCapture.h"
#include "Utils/Debug.h"
#include "Utils/Exception.h"
#include "Utils/Os/Linux/Thread.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

using test::LogLevelGuard;
using test::SyslogCapture;
using utils::formatStr;
using Frames = std::vector<void*>;
using Texts = std::vector<std::string>;

namespace {

/// Logs an error so many calls deeper, and returns the callers of the function that logs, nearest first.
/// @param first  of the calls in the other place: from two, not every frame looks like the next one
[[gnu::noinline]] Frames logDeeper(int calls, bool byFormat, int first) {
    if (calls % 3 == first) return logDeeper(calls - 1, byFormat, first);
    if (calls > 0) return logDeeper(calls - 1, byFormat, first);
    if (byFormat)
        utils::formatErrorLog("dir/file.cpp", "function", 7, "text");
    else
        utils::writeErrorLog("dir/file.cpp", "function", 7, "text");
    Frames frames(100);
    frames.resize(static_cast<std::size_t>(backtrace(frames.data(), 100)));
    frames.erase(frames.begin());
    return frames;
}

}  // namespace

TEST(LogTest, OpensAsTheEnvironmentSays) {
    const LogLevelGuard guard(-1);
    const std::tuple<const char*, const char*, int, int> table[] = {
        {nullptr, nullptr, 1, LOG_CONS},  // as it is at first
        {"", "", 1, LOG_CONS},
        {"3", "stderr", 1, LOG_PERROR},
        {"00", "stderr2", 0, LOG_CONS},
        {"2x", "std", 2, LOG_CONS}};
    for (const auto& [level, copy, foundLevel, foundOptions] : table) {
        SyslogCapture::clear();
        utils::logLevel = -1;
        if (level != nullptr) setenv("TARVEL_SMASHv2_LOG_LEVEL", level, 1);
        if (copy != nullptr) setenv("QUENX_LOG", copy, 1);
        utils::writeDebugLog("f", "g", 1, "debug text");
        utils::writeErrorLog("f", "g", 1, "error text");

        SCOPED_TRACE(level == nullptr ? "(unset)" : level);
        EXPECT_EQ(utils::logLevel, foundLevel);
        EXPECT_EQ(SyslogCapture::opening().identity, "quenx");
        EXPECT_EQ(SyslogCapture::opening().options, foundOptions);
        EXPECT_EQ(SyslogCapture::opening().facility, LOG_USER);
        const auto lines = SyslogCapture::lines();
        EXPECT_EQ(lines.at(0).text, "Opening log, level=" + std::to_string(foundLevel));
        EXPECT_TRUE(lines.at(0).priority == LOG_NOTICE && lines.at(1).priority == LOG_NOTICE);
        EXPECT_EQ(SyslogCapture::count("[debug] \"debug text\" (g@f:1)"), foundLevel == 2 ? 1U : 0U);
        EXPECT_EQ(SyslogCapture::count("[error] \"error text\" (g@f:1)"), foundLevel >= 1 ? 1U : 0U);
    }
    unsetenv("TARVEL_SMASHv2_LOG_LEVEL");
    unsetenv("QUENX_LOG");
}

TEST(LogTest, OpensOnceForTheFirstLinesOfManyThreads) {
    const LogLevelGuard guard(-1);
    {
        std::vector<std::jthread> threads;
        for (int i = 0; i < 8; ++i)
            threads.emplace_back([] { utils::writeErrorLog("f", "g", 1, "text"); });
    }
    EXPECT_EQ(SyslogCapture::count("Opening log"), 1U);
    EXPECT_EQ(SyslogCapture::count("[error]"), 8U);
}

TEST(LogTest, InterpretsNothingInAMessageThatNeedsAnArgument) {
    const LogLevelGuard guard(2);
    // A line whose cut at 511 characters falls behind the first of two percent signs.
    const std::string cut(511 - std::strlen("[debug] \"") - 1, 'x');
    const std::pair<std::string, std::string> rows[] = {
        {"%n%s%1$s%*d %", "[debug] \"%n%s%1$s%*d %\" (g@f:1)"},
        {"%%m %%%m", std::string("[debug] \"%m %") + std::strerror(ENOENT) + "\" (g@f:1)"},
        {"a\n[error] \"forged\"\t\x7F", "[debug] \"a#012[error] \"forged\"#011#177\" (g@f:1)"},
        {cut + "%%", "[debug] \"" + cut + "%"},
    };
    for (const auto& [message, expected] : rows) {
        SyslogCapture::clear();
        errno = ENOENT;
        utils::writeDebugLog("f", "g", 1, message);
        EXPECT_EQ(errno, ENOENT);
        EXPECT_EQ(SyslogCapture::lines().at(0).text, expected);
        EXPECT_EQ(SyslogCapture::lines().at(0).priority, LOG_ERR);
    }
}

TEST(LogTest, ShowsTheCallersOfAnErrorWithSymbolsFromLevelTwo) {
#ifdef QUENX_SANITIZED
    GTEST_SKIP() << "a sanitizer's own frame is among them";
#endif
    for (const int level : {1, 2}) {
        // A stack that was seen before, and one of the same size with other callers.
        for (const auto& [byFormat, first] : {std::pair(false, 1), std::pair(false, 1), std::pair(false, 2),
                                              std::pair(true, 2), std::pair(true, 1), std::pair(true, 1)}) {
            const LogLevelGuard guard(level);
            SyslogCapture::clear();
            Frames callers = logDeeper(50, byFormat, first);
            // 40 frames but the innermost three. With a format these are the log's own, so that the function
            // that logs is shown; else it is one of them.
            callers.resize(byFormat ? 36 : 37);
            std::string addresses;
            for (void* const each : callers)
                addresses += formatStr("%08" PRIxPTR " ", reinterpret_cast<std::uintptr_t>(each));
            const auto lines = SyslogCapture::lines();
            ASSERT_EQ(lines.size(), level == 1 ? 2U : 2 + 37U);
            EXPECT_EQ(lines[0].text, "[error] \"text\" (function@file.cpp:7)");
            const std::string& shown = lines[1].text;
            EXPECT_TRUE(shown.starts_with("  Backtrace: ") && shown.ends_with(addresses)) << shown;
            EXPECT_EQ(std::ranges::count(shown, ' '), 3 + 37);
            EXPECT_TRUE(level == 1 || lines.back().text.ends_with(formatStr("[%p] ", callers.back())));
        }
    }
}

TEST(LogTest, EvaluatesOnlyWhatIsWrittenAndLetsNothingOut) {
    int evaluated = 0;
    const auto count = [&] { return ++evaluated; };
    const auto fail = []() -> int { throw std::runtime_error("argument"); };
    {
        const LogLevelGuard guard(1);
        QUENX_DEBUG("%d", count());
        QUENX_DEBUG_TEXT(std::to_string(count()));
        EXPECT_EQ(evaluated, 0);
    }
    SyslogCapture::clear();
    const LogLevelGuard guard(2);
    EXPECT_NO_THROW(QUENX_DEBUG("%d", fail()));
    EXPECT_NO_THROW(QUENX_ERROR_TEXT(std::to_string(fail())));
    EXPECT_TRUE(SyslogCapture::lines().empty());
    QUENX_DEBUG("%d%%", 50);
    QUENX_DEBUG_TEXT("%d");
    EXPECT_EQ(SyslogCapture::messages(), (Texts{"50%", "%d"}));
}

TEST(LogTest, OffersVpddbgByItsPlainNameWhichDropsNewlines) {
    const LogLevelGuard guard(2);
    const auto entry = reinterpret_cast<void (*)(const char*, ...)>(dlsym(RTLD_DEFAULT, "vpddbg"));
    ASSERT_NE(entry, nullptr);
    entry("a\n%s\n", "b\nc");
    EXPECT_EQ(SyslogCapture::messages(), Texts{"abc"});
    EXPECT_TRUE(SyslogCapture::contains("(vpddbg@Utils.cpp:"));
}

TEST(ExceptionTest, PrefixesOnlyATextAndLogsItBare) {
    const LogLevelGuard guard(1);
    EXPECT_STREQ(utils::Exception("wrong value %d", 7).what(), "wrong value 7");
    EXPECT_STREQ(utils::Exception(std::string("a%n%s")).what(), "SMASHv2:a%n%s");
    EXPECT_EQ(SyslogCapture::messages("error"), (Texts{"wrong value 7", "a%n%s"}));
    EXPECT_EQ(SyslogCapture::count("(Exception@Exception.cpp:"), 2U);
    EXPECT_EQ(SyslogCapture::count("  Backtrace: "), 2U);
    // A format is cut, a text is not.
    const std::string text(600, 'x');
    EXPECT_EQ(utils::Exception("%s", text.c_str()).what(), text.substr(0, 511));
    EXPECT_EQ(utils::Exception(text).what(), "SMASHv2:" + text);
}

TEST(TimeStampTest, LogsAStartOnRequestAndTheMillisecondsAtTheEnd) {
    const LogLevelGuard guard(2);
    const std::uint64_t begin = os::getMonotonicuSeconds();
    std::string address;
    {
        const utils::TimeStamp named("named");
        const utils::TimeStamp quiet("quiet", false);
        const utils::TimeStamp started("started", true);
        const utils::TimeStamp unnamed;
        address = formatStr("%p", static_cast<const void*>(&unnamed));
        utils::Thread::msleep(20);
    }
    const std::uint64_t most = (os::getMonotonicuSeconds() - begin) / 1000;
    Texts expected{"<started>", "<" + address + ">"};
    for (const std::string& name : Texts{address, "started", "quiet", "named"}) {
        const std::string head = "time(" + name + ") = ";
        const auto elapsed = std::stoul(SyslogCapture::messages().at(expected.size()).substr(head.size()));
        EXPECT_TRUE(elapsed >= 20 && elapsed <= most) << elapsed;
        expected.push_back(head + std::to_string(elapsed) + "ms ");
    }
    EXPECT_EQ(SyslogCapture::messages(), expected);
    EXPECT_EQ(SyslogCapture::count("(Init@Debug.cpp:"), 2U);
    EXPECT_EQ(SyslogCapture::count("(~TimeStamp@Debug.cpp:"), 4U);
}
