// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace host {

/// A lock that one process on the machine can hold; the file names its process. Given back when the process
/// ends, however that is.
class LockFile {
  public:
    /// Throws std::runtime_error, with the holder's process id when there is one.
    explicit LockFile(const std::string& path);
    ~LockFile();
    LockFile(const LockFile&) = delete;
    LockFile& operator=(const LockFile&) = delete;

  private:
    int m_file;
};

}  // namespace host
