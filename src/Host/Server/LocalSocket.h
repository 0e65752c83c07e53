// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/types.h>

#include <optional>
#include <string>

#include "Host/Authentication/PasswordChecker.h"
#include "Utils/Os/Linux/FileLock.h"

namespace host {

/// The Unix socket on which this machine's root is served without a password, however many clients crowd the
/// network. Nobody else can open it, and whoever connects is asked of the kernel.
class LocalSocket {
  public:
    /// Makes the socket, mode 0600, in a folder that nobody else can write to. Replaces one that a killed
    /// daemon left behind, never one that is listened on, nor any other kind of file. Throws ListenError.
    explicit LocalSocket(const std::string& path);
    /// Removes the file.
    ~LocalSocket();
    LocalSocket(const LocalSocket&) = delete;
    LocalSocket& operator=(const LocalSocket&) = delete;

    /// The listening socket, which the caller owns from then on.
    int listener() const { return m_listener; }

    /// Whether the socket could be made there. Throws ListenError.
    static void check(const std::string& path);

  private:
    const std::string m_path;
    const os::FileLock m_lock;
    const int m_listener;
    const ino_t m_file;
};

/// Who is at the other end: an administrator if it is root or the user that this process runs as, nothing
/// for anybody else.
std::optional<User> localUserAt(int socket);

}  // namespace host
