// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/LockFile.h"

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstring>
#include <stdexcept>

namespace host {

namespace {

std::string holderOf(int file) {
    std::array<char, 32> text{};
    const ssize_t length = ::pread(file, text.data(), text.size() - 1, 0);
    return length <= 0 ? "another process"
                       : "process " + std::string(text.data(), std::strcspn(text.data(), "\n"));
}

[[noreturn]] void failToWrite(const std::string& path, int error) {
    throw std::runtime_error("Cannot write the lock file " + path + ": " + std::strerror(error) + ". " +
                             (error == EACCES ? "Run as root, or set daemon.lock_file."
                                              : "Set daemon.lock_file to a file that can be written."));
}

}  // namespace

LockFile::LockFile(const std::string& path)
    : m_file(::open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0644)) {
    if (m_file < 0) failToWrite(path, errno);
    if (::flock(m_file, LOCK_EX | LOCK_NB) != 0) {
        const std::string holder = holderOf(m_file);
        ::close(m_file);
        throw std::runtime_error("quenx-cimd is already running: " + holder + " holds " + path +
                                 ". Stop it, or set daemon.lock_file to another file.");
    }
    // The file stays when we end: removing it would let two others lock two different files.
    const std::string text = std::to_string(::getpid()) + "\n";
    if (::ftruncate(m_file, 0) != 0 || ::pwrite(m_file, text.data(), text.size(), 0) < 0) {
        const int error = errno;
        ::close(m_file);
        failToWrite(path, error);
    }
}

LockFile::~LockFile() {
    ::close(m_file);
}

}  // namespace host
