// SPDX-License-Identifier: Apache-2.0
#include "Cli/Display/Terminal.h"

#include <poll.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <iostream>
#include <limits>
#include <utility>

#include "CimXml/Xml.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

constexpr const char* kClearLine = "\r\x1B[K";

bool isSet(const char* variable) {
    const char* value = std::getenv(variable);
    return value != nullptr && *value != '\0';
}

/// Controls, U+0080 to U+009F among them, move the cursor and more. Marks, overrides and isolates of the
/// direction (U+061C, U+200E, U+200F, U+202A to U+202E, U+2066 to U+2069), line separators (U+2028, U+2029)
/// and what nobody sees (U+00AD, U+200B to U+200D, U+2060 to U+2065, U+206A to U+206F, U+FEFF) make a text
/// look like another.
bool drivesTerminal(std::string_view character) {
    const auto isWithin = [&](std::string_view lead, char first, char last) {
        return character.size() == lead.size() + 1 && character.starts_with(lead) &&
               character.back() >= first && character.back() <= last;
    };
    return utils::isControl(character.front()) || isWithin("\xC2", '\x80', '\x9F') ||
           character == "\xC2\xAD" || character == "\xD8\x9C" || isWithin("\xE2\x80", '\x8B', '\x8F') ||
           isWithin("\xE2\x80", '\xA8', '\xAE') || isWithin("\xE2\x81", '\xA0', '\xAF') ||
           character == "\xEF\xBB\xBF";
}

/// Whether the byte belongs to the character before it.
bool continues(char byte) {
    return (static_cast<unsigned char>(byte) & 0xC0U) == 0x80U;
}

/// How many bytes the first characters take.
std::size_t bytesOfFirst(std::string_view text, std::size_t characters) {
    std::size_t bytes = 0;
    for (; bytes < text.size(); ++bytes) {
        if (!continues(text[bytes]) && characters-- == 0) break;
    }
    return bytes;
}

/// 0 where there is no terminal, or it does not say.
std::size_t columnsOfTerminal(int descriptor) {
    winsize size{};
    const bool isTold = descriptor >= 0 && ioctl(descriptor, TIOCGWINSZ, &size) == 0;
    return isTold ? size.ws_col : 0;
}

}  // namespace

std::string printable(std::string_view text) {
    std::string result;
    result.reserve(text.size());
    while (!text.empty()) {
        const std::size_t known = cimxml::xmlCharacterLength(text);
        const std::string_view character = text.substr(0, std::max<std::size_t>(known, 1));
        if (known == 0 || drivesTerminal(character)) {
            for (const char byte : character)
                result += "\\x" + utils::hexByte(static_cast<unsigned char>(byte));
        } else {
            result += character;
        }
        text.remove_prefix(character.size());
    }
    return result;
}

std::size_t columnsOf(std::string_view text) {
    return static_cast<std::size_t>(std::ranges::count(text, false, continues));
}

std::string elideMiddle(std::string_view text, std::size_t width) {
    constexpr std::string_view kMark = "...";
    const std::size_t columns = columnsOf(text);
    if (columns <= width) return std::string(text);
    if (width <= kMark.size()) return std::string(kMark.substr(0, width));
    const std::size_t kept = width - kMark.size();
    const std::size_t tail = kept / 2;
    return std::string(text.substr(0, bytesOfFirst(text, kept - tail))) + std::string(kMark) +
           std::string(text.substr(bytesOfFirst(text, columns - tail)));
}

std::string takeLine(std::string& text, std::size_t width) {
    if (columnsOf(text) <= width) return std::exchange(text, {});
    // A space right behind the last column ends the line, too.
    const std::size_t most = bytesOfFirst(text, width);
    const std::size_t space = text.rfind(' ', most);
    const bool isBetweenWords = space != std::string::npos && space != 0;
    std::string line = text.substr(0, isBetweenWords ? space : most);
    text.erase(0, isBetweenWords ? space + 1 : most);
    return line;
}

std::vector<std::string> wrapped(std::string text, std::size_t width, std::size_t indent) {
    std::vector<std::string> lines{takeLine(text, width)};
    while (!text.empty())
        lines.push_back(std::string(indent, ' ') + takeLine(text, width - indent));
    return lines;
}

std::size_t widthOf(const std::ostream& out) {
    const std::size_t columns = &out == &std::cout   ? columnsOfTerminal(STDOUT_FILENO)
                                : &out == &std::cerr ? columnsOfTerminal(STDERR_FILENO)
                                                     : 0;
    return columns == 0 ? std::numeric_limits<std::size_t>::max() : columns;
}

Terminal Terminal::of(int descriptor) {
    // NO_COLOR asks for no colours, but people set it wherever escape sequences do harm.
    const char* term = std::getenv("TERM");
    const bool isDumb = term == nullptr || std::string_view(term) == "dumb";
    return {isatty(descriptor) == 1 && !isDumb && !isSet("NO_COLOR"), descriptor};
}

std::size_t Terminal::width() const {
    constexpr std::size_t kUsual = 80;
    const std::size_t columns = columnsOfTerminal(descriptor);
    return columns == 0 ? kUsual : columns;
}

std::optional<std::string> askOnTerminal(const std::string& prompt,
                                         const std::function<bool()>& isInterrupted) {
    // In a script or a service nobody would answer, and the program would wait forever.
    if (isatty(STDIN_FILENO) != 1) return std::nullopt;
    std::cerr << prompt << std::flush;
    constexpr int kMilliseconds = 200;
    pollfd keyboard{STDIN_FILENO, POLLIN, 0};
    std::string line;
    while (isInterrupted && ::poll(&keyboard, 1, kMilliseconds) <= 0)
        if (isInterrupted()) {
            std::cerr << '\n';
            return std::nullopt;
        }
    if (!std::getline(std::cin, line) || line.empty()) std::cerr << '\n';
    return line;
}

std::size_t LinePrinter::width() const {
    // Some terminals wrap as soon as the last column is written.
    return m_terminal.width() - 1;
}

bool LinePrinter::wouldBlock() const {
    pollfd place{m_terminal.descriptor, POLLOUT, 0};
    // What poll() cannot tell is tried.
    return m_terminal.descriptor >= 0 && ::poll(&place, 1, 0) == 0;
}

void LinePrinter::print(const std::string& line) {
    if (wouldBlock()) return;
    // The line that stays takes the bottom line's place, which is written again below it.
    if (!m_bottom.empty()) m_out << kClearLine;
    m_out << line << '\n' << m_bottom << std::flush;
}

void LinePrinter::rewrite(const std::string& line) {
    if (wouldBlock()) return;
    m_bottom = elideMiddle(line, width());
    m_out << kClearLine << m_bottom << std::flush;
}

void LinePrinter::keep() {
    if (m_bottom.empty()) return;
    m_bottom.clear();
    if (wouldBlock()) return;
    m_out << '\n' << std::flush;
}

}  // namespace cli
