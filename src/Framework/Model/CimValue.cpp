// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimValue.h"

#include <algorithm>
#include <charconv>
#include <chrono>
#include <cmath>
#include <type_traits>
#include <utility>

#include "Utils/Utils.h"

namespace core {

namespace {

constexpr std::size_t kDatetimeLength = 25;
constexpr int kMaxDays = 99999999;

/// Whether an integer type has room for the value.
template <class T>
bool fits(CimType type, T value) {
    const CimType narrowest = isUnsigned(type) ? CimType::Uint8 : CimType::Sint8;
    const int bits = 8 << (static_cast<int>(type) - static_cast<int>(narrowest));
    if (bits == 64)
        return isUnsigned(type) ? std::in_range<std::uint64_t>(value) : std::in_range<std::int64_t>(value);
    if (isUnsigned(type))
        return std::cmp_greater_equal(value, 0) && std::cmp_less(value, std::uint64_t{1} << bits);
    const std::int64_t bound = std::int64_t{1} << (bits - 1);
    return std::cmp_greater_equal(value, -bound) && std::cmp_less(value, bound);
}

/// A whole number with an optional sign, decimal or hexadecimal.
template <class T>
std::optional<CimScalar> parseInteger(CimType type, std::string_view text) {
    if (text.starts_with('+')) text.remove_prefix(1);
    // DSP0004 knows no negative hexadecimal numbers.
    const bool isHexadecimal = text.size() > 2 && (text.starts_with("0x") || text.starts_with("0X"));
    if (isHexadecimal) text.remove_prefix(2);
    const auto value = utils::parseNumber<T>(text, isHexadecimal ? 16 : 10);
    if (!value || !fits(type, *value)) return std::nullopt;
    return CimScalar(*value);
}

std::optional<CimScalar> parseReal(std::string_view text) {
    const auto value = utils::parseNumber<double>(text);
    return value ? std::optional<CimScalar>(*value) : std::nullopt;
}

std::optional<CimScalar> parseBoolean(std::string_view text) {
    if (sameName(text, "true")) return CimScalar(true);
    if (sameName(text, "false")) return CimScalar(false);
    return std::nullopt;
}

/// With a point (DSP0004, realValue): without one, a whole number would be read back as an integer.
std::string_view realText(double value, CellBuffer& buffer) {
    constexpr std::string_view kFraction = ".0";
    char* const begin = buffer.data();
    char* const last = begin + buffer.size() - kFraction.size();
    auto [end, error] = std::to_chars(begin, last, value);
    if (error != std::errc()) return "0.0";
    if (std::isfinite(value) && std::find(begin, end, '.') == end) {
        char* const exponent = std::find(begin, end, 'e');
        std::copy_backward(exponent, end, end + kFraction.size());
        std::ranges::copy(kFraction, exponent);
        end += kFraction.size();
    }
    return {begin, end};
}

std::string_view integerText(auto number, CellBuffer& buffer) {
    return {buffer.data(), std::to_chars(buffer.data(), buffer.data() + buffer.size(), number).ptr};
}

/// Writes so many digits, which the number has at most, and leading zeros among them.
char* putDigits(char* to, int number, int count) {
    for (char* digit = to + count; digit != to; number /= 10)
        *--digit = static_cast<char>('0' + number % 10);
    return to + count;
}

char* putText(char* to, std::string_view text) {
    return std::ranges::copy(text, to).out;
}

std::string_view timeText(utils::Time time, CellBuffer& buffer) {
    int year = 0;
    int month = 0;
    int day = 0;
    int hour = 0;
    int minute = 0;
    int second = 0;
    time.get(year, month, day, hour, minute, second);
    char* end = buffer.data();
    if (time.isPeriod()) {
        end = putDigits(end, std::min(day, kMaxDays), 8);
    } else {
        end = putDigits(end, std::min(year, 9999), 4);
        end = putDigits(end, month, 2);
        end = putDigits(end, day, 2);
    }
    for (const int part : {hour, minute, second})
        end = putDigits(end, part, 2);
    end = putText(end, ".");
    end = putDigits(end, static_cast<int>(time.getMiliseconds() % 1000), 3);
    end = putText(end, time.isPeriod() ? "000:000" : "000+000");
    return {buffer.data(), end};
}

/// Paths write texts, references and datetimes in quotes, so a text that was read from a path may stand for
/// any of the three.
struct SameValue {
    bool operator()(std::uint64_t left, std::int64_t right) const { return std::cmp_equal(left, right); }
    bool operator()(std::int64_t left, std::uint64_t right) const { return std::cmp_equal(left, right); }
    bool operator()(double left, double right) const { return !(left < right) && !(left > right); }
    bool operator()(const CimPath& left, const CimPath& right) const { return left.isSameObjectAs(right); }
    bool operator()(const CimPath& left, const std::string& right) const {
        return left.isSameObjectAs(CimPath(right));
    }
    bool operator()(const std::string& left, const CimPath& right) const { return (*this)(right, left); }
    bool operator()(const utils::Time& left, const utils::Time& right) const {
        return datetimeText(left) == datetimeText(right);
    }
    bool operator()(const utils::Time& left, const std::string& right) const {
        return datetimeText(left) == right;
    }
    bool operator()(const std::string& left, const utils::Time& right) const { return (*this)(right, left); }
    template <class T>
    bool operator()(const T& left, const T& right) const {
        return left == right;
    }
    template <class Left, class Right>
    bool operator()(const Left&, const Right&) const {
        return false;
    }
};

/// The integer as the type holds it; nothing for another value, or one that is too large.
template <class Held>
std::optional<CimScalar> convertInteger(CimType type, const CimScalar& value) {
    const auto held = [&](auto number) -> std::optional<CimScalar> {
        if (!fits(type, number)) return std::nullopt;
        return CimScalar(static_cast<Held>(number));
    };
    if (const auto* number = std::get_if<std::uint64_t>(&value)) return held(*number);
    if (const auto* number = std::get_if<std::int64_t>(&value)) return held(*number);
    return std::nullopt;
}

/// The digits at a place of the text as a number; nothing when one is no digit.
std::optional<int> digits(std::string_view text, std::size_t place, std::size_t count) {
    // Unsigned, so that no sign passes for a digit.
    const auto value = utils::parseNumber<unsigned int>(text.substr(place, count));
    return value ? std::optional(static_cast<int>(*value)) : std::nullopt;
}

std::optional<utils::Time> parseInterval(std::string_view text, std::chrono::microseconds timeOfDay) {
    const auto days = digits(text, 0, 8);
    if (!days || !text.ends_with(":000")) return std::nullopt;
    const std::chrono::microseconds length = std::chrono::days(*days) + timeOfDay;
    return utils::Time(static_cast<unsigned long long>(length.count()));
}

std::optional<utils::Time> parseTimestamp(std::string_view text, std::chrono::microseconds timeOfDay) {
    const auto year = digits(text, 0, 4);
    const auto month = digits(text, 4, 2);
    const auto day = digits(text, 6, 2);
    const auto offset = digits(text, 22, 3);
    if (!year || !month || !day || !offset || (text[21] != '+' && text[21] != '-')) return std::nullopt;
    const std::chrono::year_month_day date(std::chrono::year(*year),
                                           std::chrono::month(static_cast<unsigned>(*month)),
                                           std::chrono::day(static_cast<unsigned>(*day)));
    // 1969 is refused whole, although an offset could bring a time of its last day into 1970.
    if (!date.ok() || *year < 1970) return std::nullopt;
    const std::chrono::minutes east(text[21] == '+' ? *offset : -*offset);
    const std::chrono::microseconds sinceEpoch =
        std::chrono::sys_days(date).time_since_epoch() + timeOfDay - east;
    if (sinceEpoch.count() < 0) return std::nullopt;
    return utils::Time::fromEpoch(static_cast<unsigned long long>(sinceEpoch.count()));
}

}  // namespace

bool sameValue(const CimScalar& left, const CimScalar& right) {
    return std::visit(SameValue{}, left, right);
}

std::size_t hashOf(const CimCell& cell) {
    struct Hash {
        std::size_t operator()(bool flag) const { return flag ? 1 : 2; }
        std::size_t operator()(std::uint64_t number) const { return std::hash<std::uint64_t>()(number); }
        // Equal numbers of either sign are the same.
        std::size_t operator()(std::int64_t number) const {
            return (*this)(static_cast<std::uint64_t>(number));
        }
        // No key is one, and 0.0 equals -0.0.
        std::size_t operator()(double) const { return 0; }
        std::size_t operator()(std::string_view text) const { return std::hash<std::string_view>()(text); }
        // A text may stand for it.
        std::size_t operator()(const utils::Time& time) const {
            CellBuffer buffer;
            return (*this)(timeText(time, buffer));
        }
    };
    return std::visit(Hash{}, cell);
}

std::size_t hashOf(const CimScalar& value) {
    const auto* path = std::get_if<CimPath>(&value);
    return path != nullptr ? path->hashOfKeys() : hashOf(cellOf(value));
}

std::string scalarText(const CimScalar& value) {
    if (const auto* path = std::get_if<CimPath>(&value)) return path->toString();
    CellBuffer buffer;
    return std::string(cellText(cellOf(value), buffer));
}

CimScalar scalarOf(const CimCell& cell) {
    return std::visit(
        [](const auto& seen) -> CimScalar {
            if constexpr (std::is_same_v<decltype(seen), const std::string_view&>) {
                return std::string(seen);
            } else {
                return seen;
            }
        },
        cell);
}

CimCell cellOf(const CimScalar& value) {
    return std::visit(
        [](const auto& held) -> CimCell {
            if constexpr (std::is_same_v<decltype(held), const CimPath&>) {
                throw std::bad_variant_access();
            } else {
                return held;
            }
        },
        value);
}

std::string_view cellText(const CimCell& cell, CellBuffer& buffer) {
    struct Writer {
        std::string_view operator()(bool flag) const { return flag ? "TRUE" : "FALSE"; }
        std::string_view operator()(std::uint64_t number) const { return integerText(number, to); }
        std::string_view operator()(std::int64_t number) const { return integerText(number, to); }
        std::string_view operator()(double number) const { return realText(number, to); }
        std::string_view operator()(std::string_view text) const { return text; }
        std::string_view operator()(const utils::Time& time) const { return timeText(time, to); }
        CellBuffer& to;
    };
    return std::visit(Writer{buffer}, cell);
}

std::string valueText(const CimValue& value, std::size_t enough) {
    if (const CimScalar* scalar = value.scalar()) return scalarText(*scalar);
    std::string text;
    if (const auto* elements = value.elements()) {
        for (const CimScalar& element : *elements) {
            if (text.size() > enough) break;
            if (!text.empty()) text += ',';
            text += scalarText(element);
        }
    }
    return text;
}

std::optional<CimScalar> parseScalar(CimType type, std::string_view text) {
    const std::string_view bare = utils::trimOf(text, " \t\r\n");
    if (isUnsigned(type)) return parseInteger<std::uint64_t>(type, bare);
    if (isSigned(type)) return parseInteger<std::int64_t>(type, bare);
    if (isReal(type)) return parseReal(bare);
    if (type == CimType::Boolean) return parseBoolean(bare);
    if (type == CimType::Datetime) {
        const auto time = parseDatetime(text);
        return time ? std::optional<CimScalar>(*time) : std::nullopt;
    }
    if (type == CimType::Reference) {
        CimPath path{std::string(text)};
        return path.isValid() ? std::optional<CimScalar>(std::move(path)) : std::nullopt;
    }
    return CimScalar(std::string(text));
}

std::optional<CimScalar> convertScalar(CimType type, const CimScalar& value) {
    if (isUnsigned(type)) return convertInteger<std::uint64_t>(type, value);
    if (isSigned(type)) return convertInteger<std::int64_t>(type, value);
    const bool isHeldSo = isReal(type)                 ? std::holds_alternative<double>(value)
                          : type == CimType::Boolean   ? std::holds_alternative<bool>(value)
                          : type == CimType::Datetime  ? std::holds_alternative<utils::Time>(value)
                          : type == CimType::Reference ? std::holds_alternative<CimPath>(value)
                                                       : std::holds_alternative<std::string>(value);
    if (isHeldSo) return value;
    // Paths and clients write datetimes and references as texts; a number or a flag is never read from one.
    const auto* text = std::get_if<std::string>(&value);
    const bool isRead = type == CimType::Datetime || type == CimType::Reference;
    return text != nullptr && isRead ? parseScalar(type, *text) : std::nullopt;
}

std::string datetimeText(utils::Time time) {
    CellBuffer buffer;
    return std::string(timeText(time, buffer));
}

std::optional<utils::Time> parseDatetime(std::string_view text) {
    if (text.size() != kDatetimeLength || text[14] != '.') return std::nullopt;
    const auto hour = digits(text, 8, 2);
    const auto minute = digits(text, 10, 2);
    const auto second = digits(text, 12, 2);
    const auto fraction = digits(text, 15, 6);
    if (!hour || !minute || !second || !fraction) return std::nullopt;
    if (*hour > 23 || *minute > 59 || *second > 59) return std::nullopt;
    const std::chrono::microseconds timeOfDay = std::chrono::hours(*hour) + std::chrono::minutes(*minute) +
                                                std::chrono::seconds(*second) +
                                                std::chrono::microseconds(*fraction);
    return text[21] == ':' ? parseInterval(text, timeOfDay) : parseTimestamp(text, timeOfDay);
}

}  // namespace core
