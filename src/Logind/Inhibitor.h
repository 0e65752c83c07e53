// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>

#include "Utils/Os/Linux/linux.h"

namespace logind {

/// Loads the library that talks to systemd-logind, where there is a system bus. It stays loaded. To be called
/// before the first update begins: an inhibitor loads nothing, since the thread that has it may be one for
/// whose end somebody waits who has the loader's lock. Returns why it cannot be had; empty when it was.
std::string loadLibrary();

/// Keeps the machine from being shut down and from going to sleep, as long as it lives, where systemd-logind
/// is there and lets this user (systemd's Inhibitor Lock interface, mode "block"). Where it is not, all goes
/// on without: this waits two seconds at most, and throws nothing but for want of memory. The kernel ends it
/// with the process. Used by one thread at a time.
class Inhibitor {
  public:
    /// @param who,why  for people who ask what keeps their machine from shutting down
    Inhibitor(const std::string& who, const std::string& why);
    Inhibitor(const Inhibitor&) = delete;
    Inhibitor& operator=(const Inhibitor&) = delete;

    /// Why there is no lock; empty where there is one.
    const std::string& problem() const { return m_problem; }

  private:
    std::optional<os::Descriptor> m_lock;  ///< logind ends the lock when this is closed
    std::string m_problem;
};

}  // namespace logind
