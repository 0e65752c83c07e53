// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/FileLock.h"

#include <fcntl.h>
#include <sys/file.h>

#include <cerrno>
#include <system_error>

#include "Utils/Os/Linux/LockHolder.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/Thread.h"

namespace os {

namespace {

constexpr unsigned int kPoll = 5;  // ms

constexpr const char* kPurpose = "cannot lock";

[[noreturn]] void fail(const std::string& path, int error) {
    throw std::system_error(error, std::generic_category(), std::string(kPurpose) + " " + path);
}

/// flock has no time-out, so it is asked again and again. Returns 0, or the errno value.
int lockWithin(int file, std::chrono::milliseconds patience) {
    const auto end = std::chrono::steady_clock::now() + patience;
    while (::flock(file, LOCK_EX | LOCK_NB) != 0) {
        if (errno != EWOULDBLOCK && errno != EINTR) return errno;
        if (std::chrono::steady_clock::now() >= end) return EWOULDBLOCK;
        utils::Thread::msleep(kPoll);
    }
    return 0;
}

}  // namespace

FileLock::FileLock(const std::string& path, std::chrono::milliseconds patience)
    // Writing the holder's note must not change a file that only bears this name, too.
    : m_file(openOwnFile(path, O_RDWR, kPurpose)) {
    // Nobody else may open, and so lock, the file.
    if (!closeToOthers(m_file.number())) fail(path, errno);
    const int error = lockWithin(m_file.number(), patience);
    m_held = error == 0;
    if (!m_held && error != EWOULDBLOCK) fail(path, error);
    if (m_held) leaveNote();
}

FileLock::~FileLock() {
    if (!isHeld()) return;
    // Emptied before it is free again, so that nobody reads of a process that is done.
    if (::ftruncate(m_file.number(), 0) != 0) errno = 0;
    // Closing frees it only when no child that was forked meanwhile has the file open.
    ::flock(m_file.number(), LOCK_UN);
}

std::string FileLock::holder() const {
    return describeLockHolder(m_file.number());
}

void FileLock::leaveNote() const {
    // Only told to people: without it the lock is as good.
    const std::string text = lockNote();
    if (::ftruncate(m_file.number(), 0) != 0 || ::pwrite(m_file.number(), text.data(), text.size(), 0) < 0)
        errno = 0;
}

}  // namespace os
