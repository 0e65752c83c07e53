#include "Utils/Exception.h"

#include <gtest/gtest.h>

#include "Support/SyslogCapture.h"
#include "Utils/Debug.h"
#include "Utils/Utils.h"

using test::LogLevelGuard;
using test::SyslogCapture;
using utils::Exception;

TEST(Exception, OnlyTheOneFromATextIsPrefixedAndBothLogTheBareText) {
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

TEST(Exception, AssertionsNameFileLineAndCondition) {
    const int two = 2;
    try {
        QUENX_ASSERT(two == 2);
        QUENX_ASSERT(two == 3);
        FAIL();
    } catch (const Exception& failure) {
        EXPECT_EQ(failure.what(), "SMASHv2:tests/Utils/ExceptionTest.cpp:" + std::to_string(__LINE__ - 3) +
                                      ": Assertion failed: 'two == 3'");
    }
}

TEST(TimeStamp, LogsItsEndAndItsStartIfAsked) {
    const LogLevelGuard guard(2);
    { const utils::TimeStamp timer("Class::operation"); }
    const auto messages = SyslogCapture::messages();
    ASSERT_EQ(messages.size(), 1U);
    EXPECT_TRUE(messages[0].starts_with("time(Class::operation) = "));
    EXPECT_TRUE(messages[0].ends_with("ms "));
    const utils::TimeStamp timer;
    EXPECT_EQ(SyslogCapture::messages()[1], utils::formatStr("<%p>", static_cast<const void*>(&timer)));
}
