// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <nlohmann/json.hpp>
#include <ostream>
#include <vector>

#include "Cli/Adapters.h"
#include "Cli/Job.h"
#include "Framework/Requests/CimRequests.h"

namespace cli {

using Json = nlohmann::ordered_json;

/// Numbers and booleans as such, all else as text, arrays as arrays. Integers are exact.
Json toJson(const core::CimValue& value);
/// {"path": ..., "class": ..., "properties": {...}}
Json toJson(const core::InstanceValue& instance);
Json toJson(const std::vector<Component>& components);
Json toJson(const JobView& job);

/// One document and a line end. Bytes that are no UTF-8 are replaced: JSON has no place for them.
void printJson(std::ostream& out, const Json& document);

}  // namespace cli
