// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/LockFile.h"

#include <cerrno>
#include <stdexcept>
#include <system_error>

namespace host {

LockFile::LockFile(const std::string& path) try : m_lock(path, os::FileLock::Mode::Try) {
    if (m_lock.isHeld()) return;
    const pid_t holder = m_lock.holder();
    // A daemon that has just taken the lock has not left its number yet.
    throw std::runtime_error("quenx-cimd is already running: " +
                             (holder == 0 ? "another process" : "process " + std::to_string(holder)) +
                             " holds " + path + ". Stop it, or set daemon.lock_file to another file.");
} catch (const std::system_error& error) {
    throw std::runtime_error("Cannot write the lock file " + path + ": " + error.code().message() + ". " +
                             (error.code().value() == EACCES
                                  ? "Run as root, or set daemon.lock_file."
                                  : "Set daemon.lock_file to a file that can be written."));
}

}  // namespace host
