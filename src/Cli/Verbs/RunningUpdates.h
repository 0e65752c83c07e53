// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <map>
#include <optional>
#include <string>
#include <vector>

#include "Cli/Update/Jobs.h"
#include "Cli/Update/Targets.h"
#include "Cli/Verbs/Verbs.h"

namespace cli {

/// An update of an adapter that somebody else had begun, an earlier run of this program among others, and
/// whose end was waited for.
struct FollowedUpdate {
    std::vector<Component> before;  ///< as it was shown while that ran
    std::optional<JobView> job;     ///< as it was last seen; nothing where another process was at work
};

/// Waits until nothing writes to the adapters any more, with progress where a job of the server tells it.
/// Returns what there was to wait for, by the adapter's name.
/// @param pattern  as ManyOptions::match
/// @throws CommandError  as followJob(), and for a pattern that matches nothing
std::map<std::string, FollowedUpdate> followUpdates(Context& context, const std::string& pattern);

}  // namespace cli
