// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace host {

/// Tells a person and the system log.
void report(const std::string& text);
void reportProblem(const std::string& text);

/// Tells the service manager how the daemon is: lines of NAME=VALUE, as of sd_notify(3). Does nothing where
/// the environment variable NOTIFY_SOCKET is not set.
void notifyServiceManager(const std::string& state);

}  // namespace host
