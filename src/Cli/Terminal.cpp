// SPDX-License-Identifier: Apache-2.0
#include "Cli/Terminal.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <cstdlib>

#include "Utils/Utils.h"

namespace cli {

namespace {

bool isSet(const char* variable) {
    const char* value = std::getenv(variable);
    return value != nullptr && *value != '\0';
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
    std::string result;
    result.reserve(text.size());
    for (const char c : text) {
        if (utils::isControl(c))
            result += "\\x" + utils::hexByte(static_cast<unsigned char>(c));
        else
            result += c;
    }
    return result;
}

}  // namespace cli
