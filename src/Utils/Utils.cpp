// SPDX-License-Identifier: Apache-2.0
#include "Utils/Utils.h"

#include <algorithm>
#include <cstdarg>
#include <cstdio>
#include <ctime>

#include "Utils/Log.h"

namespace utils {

std::string vformatStr(const char* format, va_list arguments) {
    constexpr std::size_t kLongest = 511;
    char buffer[kLongest + 1] = {};
    const int length = vsnprintf(buffer, sizeof buffer, format, arguments);
    // Also for a negative result: the text is then the whole buffer, as log readers know it.
    const bool isCut = static_cast<unsigned int>(length) > kLongest;
    return std::string(buffer, isCut ? kLongest : static_cast<std::size_t>(length));
}

std::string formatStr(const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    std::string text = vformatStr(format, arguments);
    va_end(arguments);
    return text;
}

std::string getCurrentTime() {
    // localtime() has one buffer for all threads.
    const std::time_t now = std::time(nullptr);
    std::tm local{};
    if (localtime_r(&now, &local) == nullptr) return "??:??:??";
    return formatStr("%02d:%02d:%02d", local.tm_hour, local.tm_min, local.tm_sec);
}

StringArray split(std::string_view text, char separator) {
    StringArray pieces;
    for (;;) {
        const std::size_t end = text.find(separator);
        pieces.emplace_back(text.substr(0, end));
        if (end == std::string_view::npos) return pieces;
        text.remove_prefix(end + 1);
    }
}

std::string_view trimOf(std::string_view text, std::string_view characters) {
    const std::size_t begin = text.find_first_not_of(characters);
    if (begin == std::string_view::npos) return {};
    return text.substr(begin, text.find_last_not_of(characters) - begin + 1);
}

std::string trim(std::string_view text) {
    return std::string(trimOf(text, " \t"));
}

bool toUint(std::string_view text, std::uint32_t& value) {
    text = trimOf(text, " ");
    const bool isHex = text.size() > 2 && text[0] == '0' && (text[1] == 'x' || text[1] == 'X');
    if (isHex) text.remove_prefix(2);
    // Without its prefix a number consists of digits only, so it prints back the same unless it is a decimal
    // one that has leading zeros or does not fit a signed int.
    const auto number = parseNumber<std::uint32_t>(text, isHex ? 16 : 10);
    if (!number) return false;
    if (!isHex && (*number > INT32_MAX || (text.size() > 1 && text[0] == '0'))) return false;
    value = *number;
    return true;
}

std::string lowerCase(std::string_view text) {
    std::string folded(text);
    for (char& c : folded)
        c = lowerCase(c);
    return folded;
}

std::string shortened(std::string_view text, std::size_t most) {
    std::size_t shown = std::min(text.size(), most);
    while (shown > 0 && shown < text.size() && (text[shown] & 0xC0) == 0x80)
        --shown;
    return std::string(text.substr(0, shown));
}

std::string joined(const StringArray& texts, std::string_view separator) {
    std::string result;
    for (const std::string& text : texts) {
        if (&text != &texts.front()) result += separator;
        result += text;
    }
    return result;
}

std::string hexByte(unsigned char byte) {
    constexpr std::string_view kDigits = "0123456789abcdef";
    return {kDigits[byte >> 4], kDigits[byte & 0xF]};
}

std::string quoted(std::string_view text) {
    std::string result;
    result.reserve(text.size() + 2);
    result += '"';
    for (const char c : text) {
        if (c == '"' || c == '\\') result += '\\';
        result += c;
    }
    result += '"';
    return result;
}

void replaceCharacter(std::string& text, char from, char to) {
    std::replace(text.begin(), text.end(), from, to);
}

std::string formatPCIAddr(const PCIAddr& address) {
    if (address.noFunction) return formatStr("%02x:%02x", address.bus, address.device);
    return formatStr("%02x:%02x.%x", address.bus, address.device, address.function);
}

}  // namespace utils

std::string fmt(const char* format, ...) {
    va_list arguments;
    va_start(arguments, format);
    std::string text = utils::vformatStr(format, arguments);
    va_end(arguments);
    return text;
}

void vpddbg(const char* format, ...) noexcept {
    va_list arguments;
    va_start(arguments, format);
    try {
        std::string text = utils::vformatStr(format, arguments);
        std::erase(text, '\n');
        utils::writeDebugLog(__FILE__, "vpddbg", __LINE__, std::move(text));
    } catch (...) {
    }
    va_end(arguments);
}
