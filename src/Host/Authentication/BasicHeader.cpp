#include "Host/Authentication/BasicHeader.h"

#include <cstdint>

#include "Framework/Model/CimType.h"

namespace host {

namespace {

int digitOf(char letter) {
    if (letter >= 'A' && letter <= 'Z') return letter - 'A';
    if (letter >= 'a' && letter <= 'z') return letter - 'a' + 26;
    if (letter >= '0' && letter <= '9') return letter - '0' + 52;
    if (letter == '+') return 62;
    return letter == '/' ? 63 : -1;
}

}  // namespace

std::optional<std::string> decodeBase64(std::string_view text) {
    for (int padding = 0; padding < 2 && text.ends_with('='); ++padding)
        text.remove_suffix(1);
    if (text.size() % 4 == 1) return std::nullopt;
    std::string bytes;
    std::uint32_t bits = 0;
    int count = 0;
    for (const char letter : text) {
        const int digit = digitOf(letter);
        if (digit < 0) return std::nullopt;
        bits = ((bits << 6) | static_cast<std::uint32_t>(digit)) & 0xFFFFFFU;
        count += 6;
        if (count >= 8) {
            count -= 8;
            bytes += static_cast<char>((bits >> count) & 0xFFU);
        }
    }
    return bytes;
}

std::optional<Credentials> readBasicHeader(std::string_view header) {
    constexpr std::string_view kScheme = "Basic ";
    if (!core::sameName(header.substr(0, kScheme.size()), kScheme)) return std::nullopt;
    header.remove_prefix(kScheme.size());
    while (header.starts_with(' '))
        header.remove_prefix(1);
    while (header.ends_with(' '))
        header.remove_suffix(1);
    const std::optional<std::string> decoded = decodeBase64(header);
    if (!decoded || decoded->find('\0') != std::string::npos) return std::nullopt;
    const std::size_t colon = decoded->find(':');
    if (colon == std::string::npos) return std::nullopt;
    return Credentials{decoded->substr(0, colon), decoded->substr(colon + 1)};
}

}  // namespace host
