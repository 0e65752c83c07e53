#include "Utils/Os/Linux/LinuxOSLocker.h"

#include <gtest/gtest.h>

#include <optional>

#include "Support/SyslogCapture.h"

using os::OSLocker;
using test::SyslogCapture;

TEST(OSLocker, LocksOnceAndNeverWaits) {
    os::OSLockerLinux locker;
    EXPECT_EQ(locker.Lock(), 0);
    EXPECT_EQ(locker.Lock(), 2);
    EXPECT_EQ(locker.UnLock(), 0);
    EXPECT_EQ(locker.UnLock(), 0);
    EXPECT_EQ(locker.Lock(), 0);
}

TEST(OSLocker, AScopeTakesTheCurrentLockerAndFreesItEvenIfItWasBusy) {
    const test::LogLevelGuard guard(2);
    os::OSLockerLinux locker;
    locker.Lock();
    SyslogCapture::clear();
    {
        const OSLocker::AutoOSLocker scope;
        EXPECT_EQ(locker.Lock(), 2);
    }
    EXPECT_EQ(locker.Lock(), 0);
    const auto messages = SyslogCapture::messages();
    ASSERT_EQ(messages.size(), 4U);
    EXPECT_EQ(messages[0], "autolocking semaphore");
    EXPECT_EQ(messages[1].rfind("Instance of OSLocker (#", 0), 0U);
    EXPECT_EQ(messages[2], "autoreleasing semaphore");
}

TEST(OSLocker, AMissingLockerFailsTheBeginningButNotTheEndOfAScope) {
    const test::LogLevelGuard guard(1);
    try {
        const OSLocker::AutoOSLocker scope;
        FAIL();
    } catch (const utils::Exception& failure) {
        EXPECT_STREQ(failure.what(), "SMASHv2:No singleton instance found for OSLocker");
    }
    SyslogCapture::clear();
    {
        std::optional<os::OSLockerLinux> locker(std::in_place);
        const OSLocker::AutoOSLocker scope;
        locker.reset();
    }
    EXPECT_EQ(SyslogCapture::messages("error"),
              std::vector<std::string>{"No singleton instance found for OSLocker"});
}
