// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace cli {

/// "Did you mean eth0? " for a misspelt word: the one known word that it is nearest to, with a blank behind
/// for what follows. Empty when none is near, or when several are equally near.
std::string didYouMean(std::string_view word, const std::vector<std::string>& known);

/// "eth0, eth1, eth2"
std::string listText(const std::vector<std::string>& words);

}  // namespace cli
