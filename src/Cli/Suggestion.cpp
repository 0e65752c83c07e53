// SPDX-License-Identifier: Apache-2.0
#include "Cli/Suggestion.h"

#include <algorithm>

#include "Framework/Model/CimType.h"

namespace cli {

namespace {

bool sameLetter(char left, char right) {
    return core::sameName({&left, 1}, {&right, 1});
}

/// How many letters to insert, delete, replace or swap with their neighbour; case does not count.
std::size_t distance(std::string_view from, std::string_view to) {
    std::vector<std::size_t> beforeLast;
    std::vector<std::size_t> last(to.size() + 1);
    for (std::size_t column = 0; column < last.size(); ++column)
        last[column] = column;
    for (std::size_t row = 1; row <= from.size(); ++row) {
        std::vector<std::size_t> current(to.size() + 1, row);
        for (std::size_t column = 1; column <= to.size(); ++column) {
            const bool same = sameLetter(from[row - 1], to[column - 1]);
            current[column] =
                std::min({last[column] + 1, current[column - 1] + 1, last[column - 1] + (same ? 0 : 1)});
            const bool swapped = row > 1 && column > 1 && sameLetter(from[row - 1], to[column - 2]) &&
                                 sameLetter(from[row - 2], to[column - 1]);
            if (swapped) current[column] = std::min(current[column], beforeLast[column - 2] + 1);
        }
        beforeLast = std::move(last);
        last = std::move(current);
    }
    return last.back();
}

}  // namespace

std::string didYouMean(std::string_view word, const std::vector<std::string>& known) {
    constexpr std::size_t LONGEST = 64;  // nobody mistypes more than that
    if (word.empty() || word.size() > LONGEST) return {};
    const std::size_t farthest = std::max<std::size_t>(1, word.size() / 3);
    std::size_t nearest = farthest + 1;
    const std::string* found = nullptr;
    for (const std::string& one : known) {
        const std::size_t steps = distance(word, one);
        if (steps > nearest) continue;
        found = steps < nearest ? &one : nullptr;
        nearest = steps;
    }
    return found == nullptr ? std::string() : "Did you mean " + *found + "? ";
}

std::string listText(const std::vector<std::string>& words) {
    std::string text;
    for (const std::string& word : words)
        text += (text.empty() ? "" : ", ") + word;
    return text;
}

}  // namespace cli
