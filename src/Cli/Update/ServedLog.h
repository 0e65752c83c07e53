// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "Cli/Connection/Connection.h"
#include "Framework/Requests/Reasons.h"
#include "History/Record.h"

namespace cli {

/// The records that the filter wants, in its order: from the file of this process's history, or of the newest
/// thousand that a server serves. Throws CommandError where there is no history to be read.
std::vector<history::Record> readHistory(const Connection& connection, const history::Filter& filter);

/// Why the service has just answered an attempt to install this on the adapter with this value, in its words;
/// empty where nobody tells.
/// @param id  of the reason, where the answer has named one: an earlier refusal had another one, perhaps
std::string toldReason(const Connection& connection, const std::string& adapter, const std::string& uri,
                       std::uint32_t returnValue, core::ReasonId id);

}  // namespace cli
