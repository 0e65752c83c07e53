// SPDX-License-Identifier: Apache-2.0
#include "Framework/Model/CimValue.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <limits>

namespace core {

namespace {

std::string_view withoutBlanks(std::string_view text) {
    const auto first = text.find_first_not_of(" \t\r\n");
    if (first == std::string_view::npos) return {};
    return text.substr(first, text.find_last_not_of(" \t\r\n") - first + 1);
}

std::uint32_t bitsOf(CimType type) {
    switch (type) {
        case CimType::Uint8:
        case CimType::Sint8:
            return 8;
        case CimType::Uint16:
        case CimType::Sint16:
            return 16;
        case CimType::Uint32:
        case CimType::Sint32:
            return 32;
        default:
            return 64;
    }
}

bool fits(CimType type, std::uint64_t value) {
    const std::uint32_t bits = bitsOf(type);
    return bits == 64 || value < (std::uint64_t{1} << bits);
}

bool fits(CimType type, std::int64_t value) {
    const std::uint32_t bits = bitsOf(type);
    if (bits == 64) return true;
    const std::int64_t bound = std::int64_t{1} << (bits - 1);
    return value >= -bound && value < bound;
}

/// A whole number with an optional sign, decimal or hexadecimal.
template <class T>
std::optional<T> parseInteger(std::string_view text) {
    text = withoutBlanks(text);
    if (!text.empty() && text.front() == '+') text.remove_prefix(1);
    int base = 10;
    const bool negative = !text.empty() && text.front() == '-';
    if (std::string_view digits = text.substr(negative ? 1 : 0);
        digits.size() > 2 && digits[0] == '0' && (digits[1] == 'x' || digits[1] == 'X')) {
        if (negative) return std::nullopt;
        text = digits.substr(2);
        base = 16;
    }
    T value{};
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value, base);
    if (error != std::errc() || end != text.data() + text.size() || text.empty()) return std::nullopt;
    return value;
}

std::optional<CimScalar> parseReal(std::string_view text) {
    text = withoutBlanks(text);
    double value = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc() || end != text.data() + text.size()) return std::nullopt;
    return CimScalar(value);
}

std::optional<CimScalar> parseBoolean(std::string_view text) {
    text = withoutBlanks(text);
    if (sameName(text, "true")) return CimScalar(true);
    if (sameName(text, "false")) return CimScalar(false);
    return std::nullopt;
}

/// With a point (DSP0004, realValue): without one, a whole number would be read back as an integer.
std::string realText(double value) {
    char buffer[40];
    const auto [end, error] = std::to_chars(buffer, buffer + sizeof buffer, value);
    if (error != std::errc()) return "0.0";
    std::string text(buffer, end);
    if (!std::isfinite(value) || text.find('.') != std::string::npos) return text;
    return text.insert(std::min(text.find('e'), text.size()), ".0");
}

bool sameInteger(std::uint64_t left, std::int64_t right) {
    return right >= 0 && left == static_cast<std::uint64_t>(right);
}

/// A text against a value of a type that paths write in quotes.
bool sameQuoted(const std::string& text, const CimScalar& other) {
    if (const auto* path = std::get_if<CimPath>(&other)) return path->isSameObjectAs(CimPath(text));
    if (const auto* time = std::get_if<utils::Time>(&other)) return datetimeText(*time) == text;
    return false;
}

}  // namespace

CimValue CimValue::null(CimType type, bool isArray) {
    return {type, isArray, {}};
}

CimValue CimValue::of(CimType type, CimScalar value) {
    return {type, false, std::move(value)};
}

CimValue CimValue::arrayOf(CimType type, std::vector<CimScalar> values) {
    return {type, true, std::move(values)};
}

bool sameValue(const CimScalar& left, const CimScalar& right) {
    if (const auto* a = std::get_if<std::uint64_t>(&left)) {
        if (const auto* b = std::get_if<std::int64_t>(&right)) return sameInteger(*a, *b);
    }
    if (const auto* a = std::get_if<std::int64_t>(&left)) {
        if (const auto* b = std::get_if<std::uint64_t>(&right)) return sameInteger(*b, *a);
    }
    if (left.index() != right.index()) {
        if (const auto* text = std::get_if<std::string>(&left)) return sameQuoted(*text, right);
        if (const auto* text = std::get_if<std::string>(&right)) return sameQuoted(*text, left);
        return false;
    }
    if (const auto* path = std::get_if<CimPath>(&left)) return path->isSameObjectAs(std::get<CimPath>(right));
    if (const auto* time = std::get_if<utils::Time>(&left)) {
        return datetimeText(*time) == datetimeText(std::get<utils::Time>(right));
    }
    if (const auto* real = std::get_if<double>(&left))
        return !(*real < std::get<double>(right)) && !(*real > std::get<double>(right));
    if (const auto* text = std::get_if<std::string>(&left)) return *text == std::get<std::string>(right);
    if (const auto* flag = std::get_if<bool>(&left)) return *flag == std::get<bool>(right);
    if (const auto* number = std::get_if<std::uint64_t>(&left))
        return *number == std::get<std::uint64_t>(right);
    return std::get<std::int64_t>(left) == std::get<std::int64_t>(right);
}

std::string scalarText(CimType type, const CimScalar& value) {
    static_cast<void>(type);
    struct Writer {
        std::string operator()(bool flag) const { return flag ? "TRUE" : "FALSE"; }
        std::string operator()(std::uint64_t number) const { return std::to_string(number); }
        std::string operator()(std::int64_t number) const { return std::to_string(number); }
        std::string operator()(double number) const { return realText(number); }
        std::string operator()(const std::string& text) const { return text; }
        std::string operator()(const utils::Time& time) const { return datetimeText(time); }
        std::string operator()(const CimPath& path) const { return path.toString(); }
    };
    return std::visit(Writer{}, value);
}

std::optional<CimScalar> parseScalar(CimType type, std::string_view text) {
    if (isUnsigned(type)) {
        const auto number = parseInteger<std::uint64_t>(text);
        if (!number || !fits(type, *number)) return std::nullopt;
        return CimScalar(*number);
    }
    if (isSigned(type)) {
        const auto number = parseInteger<std::int64_t>(text);
        if (!number || !fits(type, *number)) return std::nullopt;
        return CimScalar(*number);
    }
    if (isReal(type)) return parseReal(text);
    if (type == CimType::Boolean) return parseBoolean(text);
    if (type == CimType::Datetime) {
        const auto time = parseDatetime(text);
        if (!time) return std::nullopt;
        return CimScalar(*time);
    }
    if (type == CimType::Reference) {
        CimPath path{std::string(text)};
        if (!path.isValid()) return std::nullopt;
        return CimScalar(std::move(path));
    }
    return CimScalar(std::string(text));
}

std::optional<CimScalar> convertScalar(CimType type, const CimScalar& value) {
    if (isUnsigned(type)) {
        if (const auto* number = std::get_if<std::uint64_t>(&value); number && fits(type, *number))
            return value;
        if (const auto* number = std::get_if<std::int64_t>(&value);
            number && *number >= 0 && fits(type, static_cast<std::uint64_t>(*number))) {
            return CimScalar(static_cast<std::uint64_t>(*number));
        }
        return std::nullopt;
    }
    if (isSigned(type)) {
        if (const auto* number = std::get_if<std::int64_t>(&value); number && fits(type, *number))
            return value;
        if (const auto* number = std::get_if<std::uint64_t>(&value);
            number && *number <= static_cast<std::uint64_t>(std::numeric_limits<std::int64_t>::max()) &&
            fits(type, static_cast<std::int64_t>(*number))) {
            return CimScalar(static_cast<std::int64_t>(*number));
        }
        return std::nullopt;
    }
    if (isReal(type)) return std::holds_alternative<double>(value) ? std::optional(value) : std::nullopt;
    if (type == CimType::Boolean)
        return std::holds_alternative<bool>(value) ? std::optional(value) : std::nullopt;
    if (const auto* text = std::get_if<std::string>(&value)) return parseScalar(type, *text);
    if (type == CimType::Datetime && std::holds_alternative<utils::Time>(value)) return value;
    if (type == CimType::Reference && std::holds_alternative<CimPath>(value)) return value;
    return std::nullopt;
}

}  // namespace core
