// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/FileLock.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <cerrno>
#include <cstdio>
#include <sstream>
#include <system_error>

#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/Thread.h"
#include "Utils/Utils.h"

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

/// What the program of a process is called: " (quenxctl)".
std::string programOf(pid_t process) {
    constexpr std::size_t kMaxName = 15;
    std::string name;
    // Anybody can give a program any name, and this one goes to logs and terminals.
    const std::string file = "/proc/" + std::to_string(process) + "/comm";
    for (const char character : readSystemText(file, kMaxName).value_or(""))
        if (character > ' ' && character <= '~') name += character;
    return name.empty() ? "" : " (" + name + ")";
}

}  // namespace

FileLock::FileLock(const std::string& path, std::chrono::milliseconds patience)
    // Writing the holder's number must not change a file that only bears this name, too.
    : m_file(openOwnFile(path, O_RDWR, kPurpose)) {
    // Nobody else may open, and so lock, the file.
    if (!closeToOthers(m_file.number())) fail(path, errno);
    const int error = lockWithin(m_file.number(), patience);
    m_held = error == 0;
    if (!m_held && error != EWOULDBLOCK) fail(path, error);
    if (m_held) leaveProcessId();
}

FileLock::~FileLock() {
    if (!isHeld()) return;
    // Emptied before it is free again, so that nobody reads the id of a process that is done.
    if (::ftruncate(m_file.number(), 0) != 0) errno = 0;
    // Closing frees it only when no child that was forked meanwhile has the file open.
    ::flock(m_file.number(), LOCK_UN);
}

std::string FileLock::holder() const {
    const pid_t process = holdingProcess();
    // One that the kernel does not list runs in another container, where it has another number.
    if (process <= 0) return "another process";
    if (process == ::getpid()) return "this process (" + std::to_string(process) + ")";
    return "process " + std::to_string(process) + programOf(process);
}

pid_t FileLock::holdingProcess() const {
    struct stat status {};
    if (::fstat(m_file.number(), &status) != 0) return 0;
    // The kernel is asked, not the file: in that a holder of another kind leaves no number. Some file systems
    // have a device number of their own in the kernel's list: the inode then has to do.
    pid_t sameInode = 0;
    std::istringstream locks(readSystemText("/proc/locks").value_or(""));
    for (std::string line; std::getline(locks, line);) {
        int process = 0;
        unsigned int major = 0;
        unsigned int minor = 0;
        unsigned long long inode = 0;
        if (std::sscanf(line.c_str(), "%*d: FLOCK %*s %*s %d %x:%x:%llu", &process, &major, &minor, &inode) !=
                4 ||
            inode != status.st_ino)
            continue;
        if (makedev(major, minor) == status.st_dev) return process;
        sameInode = process;
    }
    return sameInode;
}

void FileLock::leaveProcessId() const {
    // Only told to people: without it the lock is as good.
    const std::string text = std::to_string(::getpid()) + "\n";
    if (::ftruncate(m_file.number(), 0) != 0 || ::pwrite(m_file.number(), text.data(), text.size(), 0) < 0)
        errno = 0;
}

}  // namespace os
