// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

#include "Cli/Candidate.h"
#include "Cli/Explanation.h"

namespace cli {

/// Who keeps a server from taking the candidate, where its answer leaves that open. Empty when nobody does,
/// and in process, where there is nobody else.
Explanation explainBusyness(Management& management, std::uint32_t returnValue, const Candidate& candidate);

/// What a check on a server does to those that come after it; empty in process.
std::string holdAfterCheck(const Management& management, const std::string& adapter);

}  // namespace cli
