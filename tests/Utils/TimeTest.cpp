// SPDX-License-Identifier: Apache-2.0
#include "Utils/Time.h"

#include <gmock/gmock.h>

#include <array>
#include <cstdlib>
#include <ctime>
#include <string>

#include "Support/SyslogCapture.h"
#include "Utils/Exception.h"

using utils::Time;
using Fields = std::array<int, 6>;

namespace {

Time make(const Fields& f) {
    return Time(f[0], f[1], f[2], f[3], f[4], f[5]);
}

Fields decode(const Time& time) {
    Fields f{};
    time.get(f[0], f[1], f[2], f[3], f[4], f[5]);
    return f;
}

void expectRefusal(const Fields& f, const char* text) {
    EXPECT_THAT([&] { make(f); }, testing::ThrowsMessage<utils::Exception>(text));
}

}  // namespace

TEST(TimeTest, TakesCalendarFieldsAsUtcInEveryZone) {
    const std::pair<Fields, std::uint64_t> table[] = {
        {{1970, 1, 1, 0, 0, 0}, 0},
        {{1970, 6, 15, 0, 0, 0}, 14256000},    // Dublin kept UTC+1 all year
        {{1971, 6, 1, 12, 0, 0}, 44625600},    // Monrovia was 44 minutes and a half off
        {{2024, 7, 1, 1, 30, 0}, 1719797400},  // summer time in the north
        {{2038, 1, 19, 3, 14, 8}, 2147483648},
    };
    for (const char* zone : {"EST5EDT,M3.2.0,M11.1.0", "<+1030>-10:30", "Europe/Dublin", "Africa/Monrovia"}) {
        setenv("TZ", zone, 1);
        tzset();
        SCOPED_TRACE(zone);
        for (const auto& [fields, seconds] : table) {
            EXPECT_EQ(make(fields).getSeconds(), seconds);
            EXPECT_EQ(decode(make(fields)), fields);
        }
        // Before 1970 the count wraps, by the same amount everywhere.
        EXPECT_EQ(make({1900, 1, 1, 0, 0, 0}), Time(-2208988800ULL * 1000000));
        expectRefusal({1969, 12, 31, 23, 59, 59}, "wrong time value");
    }
    unsetenv("TZ");
    tzset();
}

TEST(TimeTest, ChecksFieldsInOrder) {
    const std::pair<Fields, const char*> table[] = {
        {{1899, 13, 0, 0, 0, 0}, "wrong year value 1899"},
        {{2012, 0, 40, 0, 0, 0}, "wrong month value 0"},
        {{2012, 1, 0, 99, 0, 0}, "wrong day value 0"},
        {{2012, 4, 31, 0, 0, 0}, "wrong day value 31"},
        {{1900, 2, 29, 0, 0, 0}, "wrong day value 29"},
        {{2012, 12, 31, -1, 99, 0}, "wrong hour value -1"},
        {{2012, 12, 31, 23, 60, 99}, "wrong minute value 60"},
        {{2012, 12, 31, 23, 59, 60}, "wrong second value 60"},
    };
    for (const auto& [fields, text] : table)
        expectRefusal(fields, text);
    EXPECT_EQ(decode(make({2000, 2, 29, 23, 59, 59})), (Fields{2000, 2, 29, 23, 59, 59}));
    EXPECT_TRUE(Time::isLeapYear(2000) && Time::isLeapYear(2024));
    EXPECT_FALSE(Time::isLeapYear(1900) || Time::isLeapYear(2023));
}

TEST(TimeTest, CountsIntervalsModuloTheirWidth) {
    Time time(5ULL);
    EXPECT_EQ(decode(time.setIntervalInSeconds(90061)), (Fields{0, 0, 1, 1, 1, 1}));
    time.setIntervalInMinutes(71582789);  // 44 s above 2^32
    EXPECT_EQ(time.getMiliseconds(), 44000U);
    EXPECT_EQ(decode(Time(~0ULL)), (Fields{0, 0, 213503982, 8, 1, 49}));
    EXPECT_TRUE(Time(5ULL) - Time(6ULL) == Time(~0ULL));
}

TEST(TimeTest, TurnsFromATimestampIntoAnIntervalAndBack) {
    const std::pair<void (*)(Time&), unsigned long long> rows[] = {
        {[](Time& time) { time = 7; }, 7},
        {[](Time& time) { time += 7; }, 1000007},
        {[](Time& time) { time = time - Time::fromEpoch(1); }, 999999},
        {[](Time& time) { time.setIntervalInSeconds(7); }, 7000000},
        {[](Time& time) { time.setIntervalInMinutes(1); }, 60000000},
    };
    for (const auto& [change, microseconds] : rows) {
        Time time = Time::fromEpoch(1000000);
        change(time);
        EXPECT_TRUE(time.isPeriod());
        EXPECT_TRUE(time == Time::fromEpoch(microseconds)) << "the kinds are not compared";
        time.resetTimer();
        EXPECT_FALSE(time.isPeriod());
    }
}

TEST(TimeTest, TakesNeitherKindForTheOther) {
    const Time start(1970, 1, 1, 0, 0, 1);
    const Time before;
    Time elapsed;
    elapsed.setInterval(start);
    EXPECT_TRUE(elapsed.isPeriod());
    EXPECT_TRUE(before - start <= elapsed && elapsed <= Time() - start);
    EXPECT_FALSE(elapsed <= Time(5ULL));

    const test::LogLevelGuard guard(1);
    int i = 0;
    EXPECT_THROW(elapsed.setInterval(Time(5ULL)), utils::Exception);
    EXPECT_THROW(Time(5ULL).decodeToDate(i, i, i, i, i, i), utils::Exception);
    EXPECT_THROW(before.decodeToPeriod(i, i, i, i), utils::Exception);
    for (const char* condition : {"dtStart.isTimestamp == true", "this->isTimestamp", "this->isPeriod()"})
        EXPECT_TRUE(test::SyslogCapture::says("Assertion failed: '" + std::string(condition) + "'"));
}
