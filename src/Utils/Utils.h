// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <algorithm>
#include <charconv>
#include <cstdarg>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"
#include "Utils/StringArray.h"

/// Formatting and small helpers for texts, numbers and addresses. All are reentrant; all may throw
/// std::bad_alloc and nothing else.
namespace utils {

/// The expansion of a printf format, cut at 511 characters. The first form is for this library alone.
std::string vformatStr(const char* format, va_list arguments) __attribute__((format(printf, 1, 0)));
QUENX_EXPORT std::string formatStr(const char* format, ...) __attribute__((format(printf, 1, 2)));

/// The local wall-clock time as "hh:mm:ss", "??:??:??" when it cannot be had.
QUENX_EXPORT std::string getCurrentTime();

/// The pieces of `text` between its separators: one more than there are separators, empty ones included.
QUENX_EXPORT StringArray split(std::string_view text, char separator);

/// `text` without blanks and tabs at its ends.
QUENX_EXPORT std::string trim(std::string_view text);

/// `text` without any of `characters` at its ends.
QUENX_EXPORT std::string_view trimOf(std::string_view text, std::string_view characters);

/// Reads a decimal number below 2^31, or a hexadecimal one of 32 bits with the prefix "0x" in either letter
/// case; blanks around it are ignored. A text that the number would not print back as is refused: a sign,
/// leading zeros of a decimal number, anything after it. False, and `value` untouched, when refused.
QUENX_EXPORT bool toUint(std::string_view text, std::uint32_t& value);

/// Reads the whole text as a number, the way std::from_chars() does: no blanks, no prefix, and a sign only
/// for a T that has one. Nothing for any other text, or one that T cannot hold.
template <class T, class... Format>
std::optional<T> parseNumber(std::string_view text, Format... format) {
    T number{};
    const char* const end = text.data() + text.size();
    const auto [rest, error] = std::from_chars(text.data(), end, number, format...);
    return error == std::errc() && rest == end ? std::optional<T>(number) : std::nullopt;
}

/// Folds the letters of ASCII to one case, and no others: names of the protocols and of CIM are compared so
/// in every locale.
constexpr char lowerCase(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}
QUENX_EXPORT std::string lowerCase(std::string_view text);
constexpr bool equalsIgnoringCase(std::string_view left, std::string_view right) {
    return std::equal(left.begin(), left.end(), right.begin(), right.end(),
                      [](char a, char b) { return lowerCase(a) == lowerCase(b); });
}

/// The letters and the digits of ASCII, whatever the locale.
constexpr bool isLetter(char c) {
    return lowerCase(c) >= 'a' && lowerCase(c) <= 'z';
}
constexpr bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

/// A control character of ASCII, which would forge lines in a log and colours on a terminal.
constexpr bool isControl(char c) {
    return static_cast<unsigned char>(c) < 0x20 || c == 0x7F;
}

/// The texts in one, with the separator between them.
QUENX_EXPORT std::string joined(const StringArray& texts, std::string_view separator = ", ");

/// The beginning of a text, of at most so many bytes, and never with half a character of UTF-8 at its end,
/// which would make unreadable what it goes into.
QUENX_EXPORT std::string shortened(std::string_view text, std::size_t most);

/// The byte as two hexadecimal digits in lower case.
QUENX_EXPORT std::string hexByte(unsigned char byte);

/// The text between double quotes, with a backslash before each quote and backslash in it.
QUENX_EXPORT std::string quoted(std::string_view text);

/// Replaces every `from` by `to`, in place.
QUENX_EXPORT void replaceCharacter(std::string& text, char from, char to);

/// "bb:dd.f" in lower-case hexadecimal digits, "bb:dd" for an address without function.
QUENX_EXPORT std::string formatPCIAddr(const PCIAddr& address);

}  // namespace utils

/// A second name of utils::formatStr.
QUENX_EXPORT std::string fmt(const char* format, ...) __attribute__((format(printf, 1, 2)));
