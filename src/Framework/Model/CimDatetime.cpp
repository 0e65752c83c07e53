// SPDX-License-Identifier: Apache-2.0
// The text form of CIM datetimes.
#include <algorithm>
#include <array>
#include <charconv>
#include <cstdio>

#include "Framework/Model/CimValue.h"
#include "Utils/Utils.h"

namespace core {

namespace {

constexpr std::size_t kTextLength = 25;
constexpr int kMostDays = 99999999;
constexpr unsigned long long kMicrosecondsPerSecond = 1000000;

/// The digits at a place of the text as a number; nothing when one is no digit.
std::optional<int> digits(std::string_view text, std::size_t place, std::size_t count) {
    const std::string_view field = text.substr(place, count);
    if (!std::all_of(field.begin(), field.end(), utils::isDigit)) return std::nullopt;
    int value = 0;
    std::from_chars(field.data(), field.data() + field.size(), value);
    return value;
}

std::optional<utils::Time> parseInterval(std::string_view text, int hour, int minute, int second,
                                         int fraction) {
    const auto days = digits(text, 0, 8);
    if (!days || text.substr(22) != "000" || hour > 23 || minute > 59 || second > 59) return std::nullopt;
    const auto seconds = ((static_cast<unsigned long long>(*days) * 24 + static_cast<unsigned>(hour)) * 60 +
                          static_cast<unsigned>(minute)) *
                             60 +
                         static_cast<unsigned>(second);
    return utils::Time(seconds * kMicrosecondsPerSecond + static_cast<unsigned>(fraction));
}

/// Days from 1970-01-01 to a date of the Gregorian calendar.
long long daysSinceEpoch(int year, int month, int day) {
    const long long y = month <= 2 ? year - 1 : year;
    const long long era = y / 400;
    const long long yearOfEra = y - era * 400;
    const long long dayOfYear = (153 * (month + (month > 2 ? -3 : 9)) + 2) / 5 + day - 1;
    return era * 146097 + yearOfEra * 365 + yearOfEra / 4 - yearOfEra / 100 + dayOfYear - 719468;
}

}  // namespace

std::string datetimeText(utils::Time time) {
    int year = 0;
    int month = 0;
    int day = 0;
    int hour = 0;
    int minute = 0;
    int second = 0;
    time.get(year, month, day, hour, minute, second);
    const int milliseconds = static_cast<int>(time.getMiliseconds() % 1000);
    std::array<char, 80> text{};
    if (time.isPeriod()) {
        std::snprintf(text.data(), text.size(), "%08d%02d%02d%02d.%03d000:000", std::min(day, kMostDays),
                      hour, minute, second, milliseconds);
    } else {
        std::snprintf(text.data(), text.size(), "%04d%02d%02d%02d%02d%02d.%03d000+000", std::min(year, 9999),
                      month, day, hour, minute, second, milliseconds);
    }
    return {text.data(), std::min(kTextLength, std::char_traits<char>::length(text.data()))};
}

std::optional<utils::Time> parseDatetime(std::string_view text) {
    if (text.size() != kTextLength || text[14] != '.') return std::nullopt;
    const auto hour = digits(text, 8, 2);
    const auto minute = digits(text, 10, 2);
    const auto second = digits(text, 12, 2);
    const auto fraction = digits(text, 15, 6);
    const auto offset = digits(text, 22, 3);
    if (!hour || !minute || !second || !fraction || !offset) return std::nullopt;
    if (text[21] == ':') return parseInterval(text, *hour, *minute, *second, *fraction);
    if (text[21] != '+' && text[21] != '-') return std::nullopt;

    const auto year = digits(text, 0, 4);
    const auto month = digits(text, 4, 2);
    const auto day = digits(text, 6, 2);
    if (!year || !month || !day || *year < 1970 || *month < 1 || *month > 12 || *day < 1 || *hour > 23 ||
        *minute > 59 || *second > 59) {
        return std::nullopt;
    }
    const int nextYear = *month == 12 ? *year + 1 : *year;
    const int nextMonth = *month == 12 ? 1 : *month + 1;
    const long long firstOfMonth = daysSinceEpoch(*year, *month, 1);
    if (*day > daysSinceEpoch(nextYear, nextMonth, 1) - firstOfMonth) return std::nullopt;

    const long long east = text[21] == '+' ? *offset : -*offset;
    const long long seconds = (((firstOfMonth + *day - 1) * 24 + *hour) * 60 + *minute - east) * 60 + *second;
    if (seconds < 0) return std::nullopt;
    return utils::Time::fromEpoch(static_cast<unsigned long long>(seconds) * kMicrosecondsPerSecond +
                                  static_cast<unsigned>(*fraction));
}

}  // namespace core
