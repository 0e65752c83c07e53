// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/types.h>

#include <string>

#include "Utils/Export.h"
#include "Utils/Os/Linux/Descriptor.h"

namespace os {

/// An exclusive lock (flock) on a file, between processes and between the threads of one. The kernel drops it
/// when its holder dies; the file stays, since removing it would let two others lock two different files.
class QUENX_EXPORT FileLock {
  public:
    enum class Mode { Wait, Try };

    /// Makes the file when it is not there. With Mode::Try a lock that somebody else holds is not an error.
    /// @throws std::system_error "cannot lock PATH: REASON"
    FileLock(const std::string& path, Mode mode);
    FileLock(const FileLock&) = delete;
    FileLock& operator=(const FileLock&) = delete;
    ~FileLock();

    bool isHeld() const { return m_held; }

    /// Who holds the lock that this one did not get: the process id that the holder left in the file, 0 when
    /// it was not there yet.
    pid_t holder() const;

  private:
    void leaveProcessId() const;

    const Descriptor m_file;
    bool m_held = false;
};

}  // namespace os
