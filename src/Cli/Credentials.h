// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace cli {

/// The name to log in with: from the environment variable QUENXCTL_USER, else asked for on the terminal.
/// Throws Failure where there is neither.
std::string userName();

/// The password for a user: from the environment variable QUENXCTL_PASSWORD, else asked for on the terminal
/// without showing what is typed. Throws Failure where there is neither, since nobody could answer.
std::string passwordOf(const std::string& user);

}  // namespace cli
