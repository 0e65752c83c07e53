// SPDX-License-Identifier: Apache-2.0
#include "Utils/Singleton.h"

#include <gtest/gtest.h>

#include <atomic>
#include <optional>
#include <thread>
#include <vector>

#include "Support/SyslogCapture.h"
#include "Support/Together.h"
#include "Utils/Os/Linux/LinuxOSLocker.h"

using os::OSLocker;
using test::SyslogCapture;

namespace {

struct Plain : utils::Singleton<Plain> {
    static const char* GetSingletonName() { return "Plain"; }
};

struct Slow : utils::AutoSingleton<Slow> {
    Slow() {
        ++constructed;
        std::this_thread::yield();
        isWhole = true;
    }
    static const char* GetSingletonName() { return "Slow"; }
    static std::unique_ptr<Slow> CreateSingleton() { return std::make_unique<Slow>(); }
    static inline std::atomic<int> constructed{0};
    bool isWhole = false;
};

std::string found(const char* name, const void* instance) {
    return utils::formatStr("Instance of %s (#%p)", name, instance);
}

}  // namespace

TEST(SingletonTest, NeverBringsBackADeadInstanceAfterDestructionOutOfOrder) {
    const test::LogLevelGuard guard(2);
    std::optional<Plain> first(std::in_place);
    std::optional<Plain> second(std::in_place);
    std::optional<Plain> third(std::in_place);
    EXPECT_EQ(Plain::getInstance(), &*third);
    EXPECT_EQ(SyslogCapture::count("\"New singleton instance for Plain\""), 3U);
    EXPECT_EQ(SyslogCapture::messages().back(), found("Plain", &*third));
    second.reset();
    EXPECT_EQ(Plain::getInstance(), &*first);  // whoever was current
    third.reset();
    EXPECT_EQ(Plain::getInstance(), &*first);
    first.reset();
    EXPECT_THROW(Plain::getInstance(), utils::Exception);
}

TEST(AutoSingletonTest, MakesOneWholeInstanceOnTwoFirstCallsThatANewerOneHides) {
    test::together(std::vector<std::function<void()>>(8, [] { EXPECT_TRUE(Slow::getInstance()->isWhole); }));
    EXPECT_EQ(Slow::constructed, 1);
    Slow* const created = Slow::getInstance();
    {
        Slow local;
        EXPECT_EQ(Slow::getInstance(), &local);
    }
    EXPECT_EQ(Slow::getInstance(), created);
}

TEST(OSLockerTest, IsTakenAndFreedByAScopeThatNeverWaits) {
    os::OSLockerLinux locker;
    const test::LogLevelGuard guard(2);
    SyslogCapture::clear();
    {
        const OSLocker::AutoOSLocker scope;
        EXPECT_EQ(locker.Lock(), 2);
    }
    const std::string instance = found("OSLocker", &locker);
    EXPECT_EQ(SyslogCapture::messages(), (std::vector<std::string>{"autolocking semaphore", instance,
                                                                   "autoreleasing semaphore", instance}));
    EXPECT_EQ(locker.Lock(), 0);
    { const OSLocker::AutoOSLocker whileBusy; }
    EXPECT_EQ(locker.Lock(), 0);
    EXPECT_EQ(locker.UnLock(), 0);
    EXPECT_EQ(locker.Lock(), 0);
}

TEST(OSLockerTest, FailsTheBeginningButNotTheEndOfAScopeWhenMissing) {
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
