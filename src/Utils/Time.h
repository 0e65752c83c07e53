// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

#include "Utils/Export.h"

namespace utils {

/// A CIM datetime (DSP0004 5.2.4): a timestamp, microseconds since 1970-01-01 00:00:00 UTC, or an interval,
/// microseconds. A plain value: threads that share one need a lock of their own. Failures are
/// utils::Exception.
class QUENX_EXPORT Time {
  public:
    /// The timestamp of now.
    Time();

    /// An interval.
    explicit Time(unsigned long long microseconds);

    /// A timestamp from calendar fields, taken as UTC in every time zone; month and day count from 1.
    /// @throws Exception "wrong ... value %d" for a field out of range
    Time(int year, int month, int day, int hour, int minute, int second);

    /// A timestamp from microseconds since 1970-01-01 00:00:00 UTC.
    static Time fromEpoch(unsigned long long microseconds);

    /// True for an interval.
    bool isPeriod() const { return !m_isTimestamp; }

    /// Becomes the timestamp of now.
    void resetTimer();

    /// Becomes the interval from the timestamp `start` until now.
    /// @throws Exception when `start` is an interval
    void setInterval(const Time& start);

    /// Becomes an interval; returns a copy of itself.
    Time setIntervalInSeconds(unsigned int seconds);

    /// As setIntervalInSeconds; the product is taken modulo 2^32 seconds.
    Time setIntervalInMinutes(unsigned int minutes);

    /// Whole milliseconds, whole seconds.
    std::uint64_t getMiliseconds() const { return m_value / 1000; }
    std::uint64_t getSeconds() const { return m_value / 1000000; }

    /// The calendar fields of a timestamp (UTC), or year 0, month 0 and the days, hours, minutes and seconds
    /// of an interval.
    void get(int& year, int& month, int& day, int& hour, int& minute, int& second) const;

    /// The halves of get(). @throws Exception for a value of the other kind
    void decodeToDate(int& year, int& month, int& day, int& hour, int& minute, int& second) const;
    void decodeToPeriod(int& days, int& hours, int& minutes, int& seconds) const;

    /// The Gregorian rule.
    static bool isLeapYear(unsigned short year);

    /// Becomes an interval.
    Time& operator=(unsigned long long microseconds);

    /// The result is an interval, even if this was a timestamp.
    Time& operator+=(unsigned long long microseconds);

    /// An interval of the difference, modulo 2^64; the kinds are not looked at.
    Time operator-(Time other) const;

    /// Compare the values only, never the kinds.
    bool operator==(const Time& other) const { return m_value == other.m_value; }
    bool operator<=(const Time& other) const { return m_value <= other.m_value; }

  private:
    std::uint64_t m_value = 0;
    bool m_isTimestamp = false;
};

}  // namespace utils
