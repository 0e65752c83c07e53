// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Framework/Requests/CimOperations.h"
#include "Framework/Requests/Reasons.h"

namespace core {

/// Tells the sink for updates of a method call that its caller may not make, where the method would have
/// installed something. Ten at once, and then one a minute: somebody who may only read must not push out what
/// others did. The audit trail has them all. Thread-safe.
/// @param text  why, as the caller is told
QUENX_EXPORT void tellOfDenied(const std::string& method, const std::vector<Argument>& arguments,
                               ReasonId reason, const std::string& text) noexcept;

}  // namespace core
