// SPDX-License-Identifier: Apache-2.0
#include "Cli/Display/Messages.h"

#include <algorithm>
#include <cerrno>
#include <system_error>

namespace cli {

namespace {

/// How many letters to insert, delete, replace or swap with their neighbour; case does not count.
std::size_t distance(std::string_view from, std::string_view to) {
    const auto same = [](char left, char right) { return utils::lowerCase(left) == utils::lowerCase(right); };
    // Row by row of the table of distances between prefixes; a swap looks two rows back.
    std::vector<std::size_t> beforeLast;
    std::vector<std::size_t> last(to.size() + 1);
    for (std::size_t column = 0; column < last.size(); ++column)
        last[column] = column;
    for (std::size_t row = 1; row <= from.size(); ++row) {
        std::vector<std::size_t> current(to.size() + 1, row);
        for (std::size_t column = 1; column <= to.size(); ++column) {
            const std::size_t replaced = last[column - 1] + (same(from[row - 1], to[column - 1]) ? 0 : 1);
            current[column] = std::min({last[column] + 1, current[column - 1] + 1, replaced});
            const bool isSwapped = row > 1 && column > 1 && same(from[row - 1], to[column - 2]) &&
                                   same(from[row - 2], to[column - 1]);
            if (isSwapped) current[column] = std::min(current[column], beforeLast[column - 2] + 1);
        }
        beforeLast = std::move(last);
        last = std::move(current);
    }
    return last.back();
}

}  // namespace

Explanation cannotRead(const std::string& file, int error) {
    const std::string message = "Cannot read " + file + ": " + std::generic_category().message(error) + ".";
    switch (error) {
        case ENOENT:
        case ENOTDIR:
        case ENAMETOOLONG:
            return {message, "Check the path.", ExitStatus::NotFound};
        case EACCES:
        case EPERM:
            return {message, "Check its permissions."};
        default:
            return {message, "Check the file and the disk that it is on."};
    }
}

std::string sentence(std::string text) {
    if (text.empty()) return "The service gave no reason.";
    const std::size_t end = std::string_view(text).find_first_of(" :=.");
    if (text.front() >= 'a' && text.front() <= 'z' && (end == std::string::npos || text[end] == ' '))
        text.front() = static_cast<char>(text.front() - 'a' + 'A');
    if (std::string_view(".!?").find(text.back()) == std::string_view::npos) text += '.';
    return text;
}

std::string didYouMean(std::string_view word, const std::vector<std::string>& known) {
    // The distance takes time and memory by the product of both lengths, and nobody mistypes more than this.
    constexpr std::size_t kLongest = 64;
    if (word.empty() || word.size() > kLongest) return {};
    // A third of the letters wrong is a typing error; more is another word.
    const std::size_t farthest = std::max<std::size_t>(1, word.size() / 3);
    std::size_t nearest = farthest + 1;
    const std::string* found = nullptr;
    for (const std::string& each : known) {
        const std::size_t steps = distance(word, each);
        if (steps > nearest) continue;
        // A second word as near as the first: no telling which was meant.
        found = steps < nearest ? &each : nullptr;
        nearest = steps;
    }
    return found == nullptr ? std::string() : "Did you mean " + *found + "? ";
}

}  // namespace cli
