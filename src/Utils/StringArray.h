// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

namespace utils {

/// A list of names, such as those of adapters or directories.
using StringArray = std::vector<std::string>;

}  // namespace utils
