#pragma once

#include <sys/types.h>

#include <string>

namespace ma {

/// An exclusive lock (flock) on a file, between processes and between the threads of one. The kernel drops it
/// when its holder dies.
class FileLock {
  public:
    enum class Mode { Wait, Try };

    /// Makes the file when it is not there. Throws FlashError when it cannot be opened or locked; with
    /// Mode::Try a lock that somebody else holds is no error.
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

    int m_descriptor;
    bool m_held = false;
};

}  // namespace ma
