// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>

#include "Cli/Display/Output.h"
#include "History/Record.h"

namespace cli {

/// "2026-11-22 16:20:03 +0100" in the local zone; "-" for no time.
/// @param microseconds  since the Unix epoch
std::string localTimeText(std::int64_t microseconds);

/// How the attempt ended, in a word: "active" for firmware that was seen to run.
std::string outcomeText(const history::Record& record);

}  // namespace cli

namespace history {

/// The members in the order of docs/user-guide.md; null for what is not known.
void to_json(cli::Json& json, const Record& record);

}  // namespace history
