// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <array>

#include "CimXml/Xml.h"

namespace cimxml {

namespace {

/// What a byte means for escaping. One look-up a byte keeps long texts, most of them plain, as fast as a
/// copy.
enum class ByteKind : unsigned char { Plain, Special, Forbidden, Multi };

constexpr std::array<ByteKind, 256> makeKinds() {
    std::array<ByteKind, 256> kinds{};
    for (std::size_t byte = 0; byte < kinds.size(); ++byte) {
        if (byte >= 0x80) {
            kinds[byte] = ByteKind::Multi;
        } else if (byte < 0x20 && byte != '\t' && byte != '\n' && byte != '\r') {
            kinds[byte] = ByteKind::Forbidden;
        } else {
            kinds[byte] = ByteKind::Plain;
        }
    }
    for (const char special : {'&', '<', '>', '"'}) {
        kinds[static_cast<unsigned char>(special)] = ByteKind::Special;
    }
    return kinds;
}

constexpr auto kKinds = makeKinds();

ByteKind kindOf(char byte) {
    return kKinds[static_cast<unsigned char>(byte)];
}

/// By the lead byte; C0, C1 and F5 to FF lead no sequence of shortest form (RFC 3629 3).
std::size_t sequenceLength(unsigned char lead) {
    if (lead < 0x80) return 1;
    if (lead >= 0xC2 && lead < 0xE0) return 2;
    if (lead >= 0xE0 && lead < 0xF0) return 3;
    if (lead >= 0xF0 && lead < 0xF5) return 4;
    return 0;
}

std::string_view entityOf(char special) {
    switch (special) {
        case '&':
            return "&amp;";
        case '<':
            return "&lt;";
        case '>':
            return "&gt;";
        default:
            return "&quot;";
    }
}

constexpr std::size_t kBlock = 16;

/// Whether the block of bytes is of printable ASCII, and with `special` none of them to be escaped. Without a
/// branch for each byte, so that it takes a few instructions for all of them.
template <bool special>
bool isPlainBlock(const char* bytes) {
    unsigned char other = 0;
    for (std::size_t i = 0; i < kBlock; ++i) {
        const auto byte = static_cast<unsigned char>(bytes[i]);
        other |= static_cast<unsigned char>(byte < 0x20) | static_cast<unsigned char>(byte >= 0x80);
        if constexpr (special) {
            other |= static_cast<unsigned char>(byte == '&') | static_cast<unsigned char>(byte == '<') |
                     static_cast<unsigned char>(byte == '>') | static_cast<unsigned char>(byte == '"');
        }
    }
    return other == 0;
}

/// The length of the run at the front that needs no change, or with `special` false is allowed at least.
template <bool special>
std::size_t plainRun(std::string_view text) {
    std::size_t length = 0;
    while (length < text.size()) {
        while (text.size() - length >= kBlock && isPlainBlock<special>(text.data() + length))
            length += kBlock;
        // The rest, or the block that is not plain, byte by byte.
        const std::size_t end = std::min(length + kBlock, text.size());
        while (length < end) {
            const ByteKind kind = kindOf(text[length]);
            const bool isPlain = kind == ByteKind::Plain || (!special && kind == ByteKind::Special);
            const std::size_t step = isPlain                   ? 1
                                     : kind == ByteKind::Multi ? xmlCharacterLength(text.substr(length))
                                                               : 0;
            if (step == 0) return length;
            length += step;
        }
    }
    return length;
}

}  // namespace

bool isXmlCharacter(char32_t character) {
    if (character < 0x20) return character == '\t' || character == '\n' || character == '\r';
    if (character >= 0xD800 && character <= 0xDFFF) return false;
    return character <= 0x10FFFF && character != 0xFFFE && character != 0xFFFF;
}

std::size_t xmlCharacterLength(std::string_view text) {
    if (text.empty()) return 0;
    const auto lead = static_cast<unsigned char>(text[0]);
    const std::size_t length = sequenceLength(lead);
    if (length == 0 || length > text.size()) return 0;
    char32_t character = length == 1 ? lead : lead & (0x7FU >> length);
    for (std::size_t i = 1; i < length; ++i) {
        const auto next = static_cast<unsigned char>(text[i]);
        if ((next & 0xC0U) != 0x80U) return 0;
        character = (character << 6) | (next & 0x3FU);
    }
    constexpr char32_t kSmallest[] = {0, 0x80, 0x800, 0x10000};
    return character >= kSmallest[length - 1] && isXmlCharacter(character) ? length : 0;
}

bool isXmlText(std::string_view text) {
    return plainRun<false>(text) == text.size();
}

void appendEscaped(std::string& out, std::string_view text) {
    for (;;) {
        const std::size_t length = plainRun<true>(text);
        out.append(text.substr(0, length));
        text.remove_prefix(length);
        if (text.empty()) return;
        switch (kindOf(text[0])) {
            case ByteKind::Plain:
            case ByteKind::Special:
                out.append(entityOf(text[0]));
                break;
            case ByteKind::Forbidden:
                // A character reference to it would be just as ill-formed, so it has to go.
                break;
            case ByteKind::Multi:
                // Visible, unlike a byte that is dropped: whoever reads it sees that something was there.
                out.append("\xEF\xBF\xBD");
                break;
        }
        text.remove_prefix(1);
    }
}

}  // namespace cimxml
