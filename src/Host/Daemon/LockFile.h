// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "Utils/Os/Linux/FileLock.h"

namespace host {

/// The lock that one daemon on the machine can hold; the file names its process. Given back when the process
/// ends, however that is.
class LockFile {
  public:
    /// Throws std::runtime_error, with the holder's process id when there is one.
    explicit LockFile(const std::string& path);

  private:
    os::FileLock m_lock;
};

}  // namespace host
