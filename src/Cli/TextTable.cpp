// SPDX-License-Identifier: Apache-2.0
#include "Cli/TextTable.h"

#include <algorithm>

#include "Cli/Terminal.h"

namespace cli {

void printTable(std::ostream& out, const std::vector<std::vector<std::string>>& rows) {
    std::vector<std::size_t> widths;
    for (const auto& row : rows) {
        widths.resize(std::max(widths.size(), row.size()));
        for (std::size_t i = 0; i < row.size(); ++i)
            widths[i] = std::max(widths[i], printable(row[i]).size());
    }
    for (const auto& row : rows) {
        std::string line;
        for (std::size_t i = 0; i < row.size(); ++i) {
            std::string cell = printable(row[i]);
            // Nothing follows the last cell, so no blanks either.
            if (i + 1 < row.size()) cell.resize(widths[i] + 2, ' ');
            line += cell;
        }
        out << line << '\n';
    }
}

}  // namespace cli
