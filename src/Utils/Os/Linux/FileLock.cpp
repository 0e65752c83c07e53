// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/FileLock.h"

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <system_error>

namespace os {

namespace {

[[noreturn]] void fail(const std::string& path) {
    throw std::system_error(errno, std::generic_category(), "cannot lock " + path);
}

}  // namespace

FileLock::FileLock(const std::string& path, Mode mode)
    : m_file(::open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, 0644)) {
    if (m_file.number() < 0) fail(path);
    int result;
    do {
        result = ::flock(m_file.number(), mode == Mode::Wait ? LOCK_EX : LOCK_EX | LOCK_NB);
    } while (result != 0 && errno == EINTR);
    m_held = result == 0;
    if (!m_held && errno != EWOULDBLOCK) fail(path);
    if (m_held) leaveProcessId();
}

FileLock::~FileLock() {
    // Emptied before it is free again, so that nobody reads the id of a process that is done.
    if (m_held && ::ftruncate(m_file.number(), 0) != 0) errno = 0;
}

pid_t FileLock::holder() const {
    char text[16] = {};
    if (::pread(m_file.number(), text, sizeof text - 1, 0) <= 0) return 0;
    return static_cast<pid_t>(std::strtol(text, nullptr, 10));
}

void FileLock::leaveProcessId() const {
    // Only told to people: without it the lock is as good.
    const std::string text = std::to_string(::getpid()) + "\n";
    if (::ftruncate(m_file.number(), 0) != 0 || ::pwrite(m_file.number(), text.data(), text.size(), 0) < 0)
        errno = 0;
}

}  // namespace os
