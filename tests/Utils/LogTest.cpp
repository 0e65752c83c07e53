// SPDX-License-Identifier: Apache-2.0
#include "Utils/Log.h"

#include <dlfcn.h>
#include <gtest/gtest.h>
#include <syslog.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <thread>
#include <vector>

#include "Support/SyslogCapture.h"
#include "Utils/Exception.h"

using test::LogLevelGuard;
using test::SyslogCapture;

namespace {

constexpr const char* kLevelVariable = "TARVEL_SMASHv2_LOG_LEVEL";

std::string firstLine() {
    const auto lines = SyslogCapture::lines();
    return lines.empty() ? std::string() : lines.front().text;
}

}  // namespace

TEST(LogTest, TakesItsLevelFromTheFirstCharacterOfTheVariable) {
    const LogLevelGuard guard(-1);
    const struct {
        const char* value;
        int level;
    } rows[] = {{nullptr, 1}, {"", 1}, {"3", 1}, {"00", 0}, {"2x", 2}};
    for (const auto& row : rows) {
        SyslogCapture::clear();
        utils::logLevel = -1;
        row.value == nullptr ? unsetenv(kLevelVariable) : setenv(kLevelVariable, row.value, 1);
        utils::writeDebugLog("f", "g", 1, "debug text");
        utils::writeErrorLog("f", "g", 1, "error text");

        SCOPED_TRACE(row.value == nullptr ? "(unset)" : row.value);
        EXPECT_EQ(utils::logLevel, row.level);
        EXPECT_EQ(SyslogCapture::identity(), "quenx");
        EXPECT_EQ(firstLine(), "Opening log, level=" + std::to_string(row.level));
        EXPECT_EQ(SyslogCapture::count("[debug] \"debug text\" (g@f:1)"), row.level == 2 ? 1U : 0U);
        EXPECT_EQ(SyslogCapture::count("[error] \"error text\" (g@f:1)"), row.level >= 1 ? 1U : 0U);
    }
    unsetenv(kLevelVariable);
}

TEST(LogTest, OpensOnceForTheFirstLinesOfManyThreads) {
    const LogLevelGuard guard(-1);
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i)
        threads.emplace_back([] { utils::writeErrorLog("f", "g", 1, "text"); });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(SyslogCapture::count("Opening log"), 1U);
    EXPECT_EQ(SyslogCapture::count("[error]"), 8U);
}

TEST(LogTest, InterpretsNothingInAMessageThatNeedsAnArgument) {
    const LogLevelGuard guard(2);
    // A line whose cut at 511 characters falls behind the first of two percent signs.
    const std::string cut(511 - std::strlen("[debug] \"") - 1, 'x');
    const struct {
        std::string message;
        std::string expected;
    } rows[] = {
        {"%n%s%1$s%*d %", "[debug] \"%n%s%1$s%*d %\" (g@f:1)"},
        {"%%m %%%m", std::string("[debug] \"%m %") + std::strerror(ENOENT) + "\" (g@f:1)"},
        {"a\n[error] \"forged\"\t\x7F", "[debug] \"a#012[error] \"forged\"#011#177\" (g@f:1)"},
        {cut + "%%", "[debug] \"" + cut + "%"},
    };
    for (const auto& row : rows) {
        SyslogCapture::clear();
        errno = ENOENT;
        utils::writeDebugLog("f", "g", 1, row.message);
        EXPECT_EQ(errno, ENOENT);
        EXPECT_EQ(firstLine(), row.expected);
        EXPECT_EQ(SyslogCapture::lines().front().priority, LOG_ERR);
    }
}

TEST(LogTest, AddsABacktraceToErrorsWithSymbolsFromLevelTwo) {
    for (const int level : {1, 2}) {
        const LogLevelGuard guard(level);
        SyslogCapture::clear();
        utils::writeErrorLog("dir/file.cpp", "function", 7, "text");
        const auto lines = SyslogCapture::lines();
        ASSERT_GE(lines.size(), 2U);
        EXPECT_EQ(lines[0].text, "[error] \"text\" (function@file.cpp:7)");
        EXPECT_TRUE(lines[1].text.starts_with("  Backtrace: ")) << lines[1].text;
        EXPECT_EQ(lines.size() > 2, level == 2);
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
    EXPECT_EQ(SyslogCapture::messages(), (std::vector<std::string>{"50%", "%d"}));
}

TEST(LogTest, OffersVpddbgByItsPlainNameWhichDropsNewlines) {
    const LogLevelGuard guard(2);
    const auto entry = reinterpret_cast<void (*)(const char*, ...)>(dlsym(RTLD_DEFAULT, "vpddbg"));
    ASSERT_NE(entry, nullptr);
    entry("a\n%s\n", "b\nc");
    EXPECT_EQ(SyslogCapture::messages(), std::vector<std::string>{"abc"});
    EXPECT_TRUE(SyslogCapture::contains("(vpddbg@Utils.cpp:"));
}

TEST(ExceptionTest, PrefixesOnlyATextAndLogsItBare) {
    const LogLevelGuard guard(1);
    EXPECT_STREQ(utils::Exception("wrong value %d", 7).what(), "wrong value 7");
    EXPECT_STREQ(utils::Exception(std::string("a%n%s")).what(), "SMASHv2:a%n%s");
    EXPECT_EQ(SyslogCapture::messages("error"), (std::vector<std::string>{"wrong value 7", "a%n%s"}));
    EXPECT_EQ(SyslogCapture::count("(Exception@Exception.cpp:"), 2U);
    EXPECT_EQ(SyslogCapture::count("  Backtrace: "), 2U);
    // A format is cut, a text is not.
    const std::string text(600, 'x');
    EXPECT_EQ(utils::Exception("%s", text.c_str()).what(), text.substr(0, 511));
    EXPECT_EQ(utils::Exception(text).what(), "SMASHv2:" + text);
}
