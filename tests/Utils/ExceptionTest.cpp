#include "Utils/Exception.h"

#include <gtest/gtest.h>

#include "Support/SyslogCapture.h"
#include "Utils/Debug.h"
#include "Utils/Utils.h"

using test::LogLevelGuard;
using test::SyslogCapture;
using utils::Exception;

namespace {

class EDerived : public Exception {
  public:
    explicit EDerived(std::string text) : Exception("EDerived:" + text) {}
};

std::vector<std::string> loggedErrors() {
    return SyslogCapture::messages("error");
}

}  // namespace

TEST(Exception, OnlyTheOneFromATextIsPrefixedAndBothLogTheBareText) {
    const LogLevelGuard guard(1);
    EXPECT_STREQ(Exception("wrong value %d", 7).what(), "wrong value 7");
    EXPECT_STREQ(Exception(std::string("a%n%s")).what(), "SMASHv2:a%n%s");
    EXPECT_STREQ(EDerived("%s text").what(), "SMASHv2:EDerived:%s text");
    EXPECT_EQ(loggedErrors(), (std::vector<std::string>{"wrong value 7", "a%n%s", "EDerived:%s text"}));
    EXPECT_EQ(SyslogCapture::count("(Exception@Exception.cpp:"), 3U);
    EXPECT_EQ(SyslogCapture::count("  Backtrace: "), 3U);
}

TEST(Exception, AFormatIsCutAt511AndATextIsNot) {
    const LogLevelGuard guard(0);
    const std::string text(600, 'x');
    EXPECT_EQ(std::string(Exception("%s", text.c_str()).what()), text.substr(0, 511));
    EXPECT_EQ(std::string(Exception(text).what()), "SMASHv2:" + text);
    EXPECT_TRUE(SyslogCapture::lines().empty());
}

TEST(Exception, AssertionsNameFileLineAndCondition) {
    const int two = 2;
    try {
        QUENX_ASSERT(two == 3);
        FAIL();
    } catch (const Exception& failure) {
        EXPECT_EQ(failure.what(), "SMASHv2:tests/Utils/ExceptionTest.cpp:" + std::to_string(__LINE__ - 3) +
                                      ": Assertion failed: 'two == 3'");
    }
    EXPECT_NO_THROW(QUENX_ASSERT(two == 2));
    try {
        QUENX_ASSERT_TEXT(two == 3, "a.cpp", 9, "__null != %d");
        FAIL();
    } catch (const Exception& failure) {
        EXPECT_STREQ(failure.what(), "SMASHv2:a.cpp:9: Assertion failed: '__null != %d'");
    }
}

TEST(TimeStamp, LogsItsEndAndItsStartIfAsked) {
    const LogLevelGuard guard(2);
    { const utils::TimeStamp timer("Class::operation"); }
    { const utils::TimeStamp timer("loud", true); }
    std::string name;
    {
        const utils::TimeStamp timer;
        name = utils::formatStr("<%p>", static_cast<const void*>(&timer));
    }
    const auto messages = SyslogCapture::messages();
    ASSERT_EQ(messages.size(), 5U);
    EXPECT_EQ(messages[0].rfind("time(Class::operation) = ", 0), 0U);
    EXPECT_EQ(messages[0].substr(messages[0].size() - 3), "ms ");
    EXPECT_EQ(messages[1], "<loud>");
    EXPECT_EQ(messages[3], name);
    EXPECT_EQ(SyslogCapture::count("(Init@Debug.cpp:"), 2U);
    EXPECT_EQ(SyslogCapture::count("(~TimeStamp@Debug.cpp:"), 3U);
}
