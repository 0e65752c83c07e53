// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>

#include "Utils/Os/Linux/FileLock.h"

namespace history {

/// The id of this start of the machine; empty when it cannot be had. A service that sees only processes of
/// /proc is told by its manager, in QUENX_BOOT_ID.
const std::string& bootId();

/// Says in a history's folder that this process lives: a file that it keeps locked. The kernel drops the lock
/// when the process dies, whatever its number is then given to. Made, and looked at by others, under the
/// folder's lock, so that nobody takes a file that is being made for a dead owner's.
class Owner {
  public:
    explicit Owner(const std::string& folder);
    Owner(const Owner&) = delete;
    Owner& operator=(const Owner&) = delete;
    ~Owner();

    /// The file's name.
    const std::string& name() const { return m_name; }

    /// Removes the files of processes that are dead. Those whose file is missing then have died.
    static void sweep(const std::string& folder);
    static bool isAlive(const std::string& folder, const std::string& name);

  private:
    const std::string m_name;
    const std::string m_path;
    std::unique_ptr<os::FileLock> m_lock;
};

}  // namespace history
