// SPDX-License-Identifier: Apache-2.0
#include "Utils/Exception.h"

#include <gtest/gtest.h>

#include "Support/SyslogCapture.h"

using test::LogLevelGuard;
using test::SyslogCapture;
using utils::Exception;

TEST(ExceptionTest, PrefixesOnlyATextAndLogsItBare) {
    const LogLevelGuard guard(1);
    EXPECT_STREQ(Exception("wrong value %d", 7).what(), "wrong value 7");
    EXPECT_STREQ(Exception(std::string("a%n%s")).what(), "SMASHv2:a%n%s");
    EXPECT_EQ(SyslogCapture::messages("error"), (std::vector<std::string>{"wrong value 7", "a%n%s"}));
    EXPECT_EQ(SyslogCapture::count("(Exception@Exception.cpp:"), 2U);
    EXPECT_EQ(SyslogCapture::count("  Backtrace: "), 2U);
    // A format is cut, a text is not.
    const std::string text(600, 'x');
    EXPECT_EQ(Exception("%s", text.c_str()).what(), text.substr(0, 511));
    EXPECT_EQ(Exception(text).what(), "SMASHv2:" + text);
}
