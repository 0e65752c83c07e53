// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace host {

/// Tells a person and the system log.
void report(const std::string& text);
void reportProblem(const std::string& text);

}  // namespace host
