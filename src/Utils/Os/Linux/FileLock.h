// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/types.h>

#include <chrono>
#include <string>

#include "Utils/Export.h"
#include "Utils/Os/Linux/linux.h"

namespace os {

/// An exclusive lock (flock) on a file, between processes and between the threads of one. The kernel drops it
/// when its holder dies; the file stays, since removing it would let two others lock two different files.
class QUENX_EXPORT FileLock {
  public:
    /// Makes the file when it is not there, for its owner alone: whoever can open a file can lock it. One of
    /// this user's that others could open is closed to them.
    /// @param patience  how long to wait for another holder; with 0 there is one try. A lock that somebody
    ///                  else still holds then is not an error, see isHeld().
    /// @throws std::system_error "cannot lock PATH: REASON", also for a symbolic link, for what is no regular
    ///         file, and for one that has further names
    /// @throws ForeignFile "cannot lock PATH: it belongs to user N; ..."
    explicit FileLock(const std::string& path, std::chrono::milliseconds patience = {});
    FileLock(const FileLock&) = delete;
    FileLock& operator=(const FileLock&) = delete;
    ~FileLock();

    /// False in a child that was forked since.
    bool isHeld() const { return m_held && m_process == ::getpid(); }

    /// Who holds the lock that this one did not get, for a person; see describeLockHolder().
    std::string holder() const;

  private:
    void leaveNote() const;

    const Descriptor m_file;
    bool m_held = false;
    const pid_t m_process = ::getpid();
};

}  // namespace os
