// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace host {

/// Tells the service manager how the daemon is, by the datagrams of sd_notify(3). Does nothing where the
/// environment variable NOTIFY_SOCKET is not set.
class ServiceManager {
  public:
    static void ready(const std::string& status);
    static void reloading();
    static void stopping(const std::string& status);
    /// Asks for more time to stop, and says what for.
    static void stillStopping(const std::string& status, unsigned int seconds);
};

}  // namespace host
