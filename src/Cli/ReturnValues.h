// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>

#include "Cli/Failure.h"
#include "Providers/Schema/ValueMaps.h"

namespace cli {

/// What a return value means to a person, and what to do about it.
Explanation explainReturnValue(std::uint32_t value);

}  // namespace cli
