#include "Cli/Terminal.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <cstdlib>

namespace cli {

namespace {

bool isSet(const char* variable) {
    const char* value = std::getenv(variable);
    return value != nullptr && *value != '\0';
}

bool isControl(char c) {
    const auto byte = static_cast<unsigned char>(c);
    return byte < 0x20 || byte == 0x7F;
}

}  // namespace

Terminal Terminal::of(int descriptor) {
    const char* term = std::getenv("TERM");
    const bool dumb = term == nullptr || std::string_view(term) == "dumb";
    return {isatty(descriptor) == 1 && !dumb && !isSet("NO_COLOR"), descriptor};
}

std::optional<std::size_t> Terminal::width() const {
    winsize size{};
    if (descriptor < 0 || ioctl(descriptor, TIOCGWINSZ, &size) != 0 || size.ws_col == 0) return std::nullopt;
    return size.ws_col;
}

std::string elideMiddle(std::string_view text, std::size_t width) {
    constexpr std::string_view MARK = "...";
    if (text.size() <= width) return std::string(text);
    if (width <= MARK.size()) return std::string(MARK.substr(0, width));
    const std::size_t kept = width - MARK.size();
    const std::size_t tail = kept / 2;
    return std::string(text.substr(0, kept - tail)) + std::string(MARK) +
           std::string(text.substr(text.size() - tail));
}

std::string printable(std::string_view text) {
    constexpr std::string_view DIGITS = "0123456789abcdef";
    std::string result;
    result.reserve(text.size());
    for (const char c : text) {
        if (!isControl(c)) {
            result += c;
            continue;
        }
        const auto byte = static_cast<unsigned char>(c);
        result += "\\x";
        result += DIGITS[byte >> 4];
        result += DIGITS[byte & 0xF];
    }
    return result;
}

}  // namespace cli
