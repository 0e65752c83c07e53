// SPDX-License-Identifier: Apache-2.0
#include "Utils/Time.h"

#include <chrono>
#include <ctime>

#include "Utils/Exception.h"
#include "Utils/Os/Linux/linux.h"

namespace utils {

namespace {

constexpr std::uint64_t kMicrosecondsPerSecond = 1000000;

/// The same year of a calendar that std::chrono knows: its years end at 32767, and the calendar repeats every
/// 400.
std::chrono::year likeYear(int year) {
    return std::chrono::year(2000 + year % 400);
}

int daysOfMonth(int year, int month) {
    const auto last = (likeYear(year) / month / std::chrono::last).day();
    return static_cast<int>(static_cast<unsigned int>(last));
}

}  // namespace

Time::Time() {
    resetTimer();
}

Time::Time(unsigned long long microseconds) : m_value(microseconds) {}

Time Time::fromEpoch(unsigned long long microseconds) {
    Time time(microseconds);
    time.m_isTimestamp = true;
    return time;
}

Time::Time(int year, int month, int day, int hour, int minute, int second) : m_isTimestamp(true) {
    if (year < 1900) throw Exception("wrong year value %d", year);
    if (month < 1 || month > 12) throw Exception("wrong month value %d", month);
    if (day < 1 || day > daysOfMonth(year, month)) throw Exception("wrong day value %d", day);
    if (hour < 0 || hour > 23) throw Exception("wrong hour value %d", hour);
    if (minute < 0 || minute > 59) throw Exception("wrong minute value %d", minute);
    if (second < 0 || second > 59) throw Exception("wrong second value %d", second);

    std::tm fields{};
    fields.tm_year = year - 1900;
    fields.tm_mon = month - 1;
    fields.tm_mday = day;
    fields.tm_hour = hour;
    fields.tm_min = minute;
    fields.tm_sec = second;
    // Not mktime and `timezone`: a zone whose offset has changed has another one for an old date.
    const std::time_t seconds = timegm(&fields);
    // timegm() has no other way to fail: the last second of 1969 is refused too.
    if (seconds == -1) throw Exception("wrong time value");
    // Modulo 2^64 before 1970.
    m_value = static_cast<std::uint64_t>(seconds) * kMicrosecondsPerSecond;
}

void Time::resetTimer() {
    m_value = os::getuSecondsSinceEpoch();
    m_isTimestamp = true;
}

void Time::setInterval(const Time& start) {
    QUENX_ASSERT_TEXT(start.m_isTimestamp, __FILE__, __LINE__, "dtStart.isTimestamp == true");
    // Modulo 2^64: after the clock was set back, an interval is huge rather than an error in a running job.
    m_value = os::getuSecondsSinceEpoch() - start.m_value;
    m_isTimestamp = false;
}

Time Time::setIntervalInSeconds(unsigned int seconds) {
    m_value = seconds * kMicrosecondsPerSecond;
    m_isTimestamp = false;
    return *this;
}

Time Time::setIntervalInMinutes(unsigned int minutes) {
    return setIntervalInSeconds(minutes * 60U);
}

void Time::get(int& year, int& month, int& day, int& hour, int& minute, int& second) const {
    if (m_isTimestamp) {
        decodeToDate(year, month, day, hour, minute, second);
        return;
    }
    year = 0;
    month = 0;
    decodeToPeriod(day, hour, minute, second);
}

void Time::decodeToDate(int& year, int& month, int& day, int& hour, int& minute, int& second) const {
    QUENX_ASSERT_TEXT(m_isTimestamp, __FILE__, __LINE__, "this->isTimestamp");
    const auto seconds = static_cast<std::time_t>(getSeconds());
    // Not std::chrono's calendar, whose years end at 32767: a value may lie beyond.
    std::tm fields{};
    QUENX_ASSERT_TEXT(gmtime_r(&seconds, &fields) != nullptr, __FILE__, __LINE__, "ptm != __null");
    year = fields.tm_year + 1900;
    month = fields.tm_mon + 1;
    day = fields.tm_mday;
    hour = fields.tm_hour;
    minute = fields.tm_min;
    second = fields.tm_sec;
}

void Time::decodeToPeriod(int& days, int& hours, int& minutes, int& seconds) const {
    QUENX_ASSERT(this->isPeriod());
    const std::uint64_t total = getSeconds();
    seconds = static_cast<int>(total % 60);
    minutes = static_cast<int>(total / 60 % 60);
    hours = static_cast<int>(total / 3600 % 24);
    days = static_cast<int>(total / 86400);
}

bool Time::isLeapYear(unsigned short year) {
    return likeYear(year).is_leap();
}

Time& Time::operator=(unsigned long long microseconds) {
    m_value = microseconds;
    m_isTimestamp = false;
    return *this;
}

Time& Time::operator+=(unsigned long long microseconds) {
    m_value += microseconds;
    m_isTimestamp = false;
    return *this;
}

Time Time::operator-(Time other) const {
    return Time(m_value - other.m_value);
}

}  // namespace utils
