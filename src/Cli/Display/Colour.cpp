// SPDX-License-Identifier: Apache-2.0
#include "Cli/Display/Colour.h"

namespace cli {

namespace {

/// A word of the stream itself, so that nothing has to be handed along to wherever something is printed.
long& mayHaveColours(std::ostream& out) {
    static const int kIndex = std::ios_base::xalloc();
    return out.iword(kIndex);
}

/// What switches it on (ECMA-48, 8.3.117). No more than the basic colours: which red is theirs, and whether
/// one can read it, people have chosen in their terminal.
const char* parametersOf(Look look) {
    switch (look) {
        case Look::Failure:
            return "31";
        case Look::Success:
            return "32";
        case Look::Heading:
            return "1";
        case Look::Hint:
            return "2";
        default:
            return "";
    }
}

}  // namespace

void allowColours(std::ostream& out, const Terminal& terminal) {
    mayHaveColours(out) = terminal.canRewrite ? 1 : 0;
}

std::string coloured(std::ostream& out, Look look, std::string_view text) {
    if (look == Look::Plain || text.empty() || mayHaveColours(out) == 0) return std::string(text);
    return std::string("\x1B[") + parametersOf(look) + 'm' + std::string(text) + "\x1B[0m";
}

void printHint(std::ostream& out, const std::string& advice) {
    if (advice.empty()) return;
    for (const std::string& line : wrapped(printable(advice), widthOf(out)))
        out << coloured(out, Look::Hint, line) << '\n';
}

void printFailure(std::ostream& out, const std::string& message, const std::string& advice) {
    constexpr std::string_view kName = "quenxctl:";
    std::vector<std::string> lines = wrapped(std::string(kName) + ' ' + printable(message), widthOf(out));
    out << coloured(out, Look::Failure, kName);
    lines.front().erase(0, kName.size());
    for (const std::string& line : lines)
        out << line << '\n';
    printHint(out, advice);
}

}  // namespace cli
