// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <vector>

#include "Cli/Context.h"

/// Printing what was enumerated, as text or as JSON.
namespace cli {

/// Text: the path, then one indented line for each property that is not null.
void printInstances(Context& context, const std::vector<core::InstanceValue>& instances);
void printPaths(Context& context, const std::vector<core::CimPath>& paths);

}  // namespace cli
