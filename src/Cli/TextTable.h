// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <ostream>
#include <string>
#include <vector>

namespace cli {

/// Prints rows with each column as wide as its widest cell; control characters in cells are made visible.
void printTable(std::ostream& out, const std::vector<std::vector<std::string>>& rows);

}  // namespace cli
