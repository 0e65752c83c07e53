#include "Utils/Os/Linux/LinuxOSLocker.h"

#include <gtest/gtest.h>

#include <optional>

#include "Support/SyslogCapture.h"

using os::OSLocker;
using test::SyslogCapture;

TEST(OSLocker, AScopeTakesTheCurrentLockerAndFreesItEvenIfItWasBusy) {
    const test::LogLevelGuard guard(2);
    os::OSLockerLinux locker;
    EXPECT_EQ(locker.Lock(), 0);
    {
        const OSLocker::AutoOSLocker scope;
        EXPECT_EQ(locker.Lock(), 2);
    }
    EXPECT_EQ(locker.Lock(), 0);
    EXPECT_EQ(locker.UnLock(), 0);
    EXPECT_EQ(locker.UnLock(), 0);
    EXPECT_EQ(SyslogCapture::count("\"autolocking semaphore\""), 1U);
    EXPECT_EQ(SyslogCapture::count("\"autoreleasing semaphore\""), 1U);
}

TEST(OSLocker, AMissingLockerFailsTheBeginningButNotTheEndOfAScope) {
    const test::LogLevelGuard guard(1);
    EXPECT_THROW(const OSLocker::AutoOSLocker scope, utils::Exception);
    {
        std::optional<os::OSLockerLinux> locker(std::in_place);
        const OSLocker::AutoOSLocker scope;
        locker.reset();
    }
    EXPECT_EQ(SyslogCapture::messages("error"),
              std::vector<std::string>(2, "No singleton instance found for OSLocker"));
}
