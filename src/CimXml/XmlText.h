#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace cimxml {

/// Whether XML 1.0 allows the character (XML 1.0 2.2).
bool isXmlCharacter(char32_t character);

/// The bytes that the first character of the text takes, or 0 when the text is empty or does not begin with
/// UTF-8 (RFC 3629: shortest form, no surrogates) of a character that XML 1.0 allows.
std::size_t xmlCharacterLength(std::string_view text);

/// Whether the whole text is UTF-8 of characters that XML 1.0 allows.
bool isXmlText(std::string_view text);

/// Appends the text with `&`, `<`, `>` and `"` escaped, good for content and attributes alike. Characters
/// below U+0020 that XML forbids are dropped; any other bytes that are no allowed character become U+FFFD.
void appendEscaped(std::string& out, std::string_view text);

}  // namespace cimxml
