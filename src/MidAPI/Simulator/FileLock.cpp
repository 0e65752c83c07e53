#include "MidAPI/Simulator/FileLock.h"

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <system_error>

#include "MidAPI/Simulator/FlashFiles.h"

namespace ma {
namespace {

std::string describe(const std::string& path, int reason) {
    return "cannot lock " + path + ": " + std::generic_category().message(reason);
}

}  // namespace

FileLock::FileLock(const std::string& path, Mode mode)
    : m_descriptor(::open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC | O_NOFOLLOW, 0644)) {
    if (m_descriptor < 0) throw FlashError(describe(path, errno));
    int result;
    do {
        result = ::flock(m_descriptor, mode == Mode::Wait ? LOCK_EX : LOCK_EX | LOCK_NB);
    } while (result != 0 && errno == EINTR);
    m_held = result == 0;
    if (m_held) {
        leaveProcessId();
    } else if (errno != EWOULDBLOCK) {
        const int reason = errno;
        ::close(m_descriptor);
        throw FlashError(describe(path, reason));
    }
}

FileLock::~FileLock() {
    // Emptied before it is free again, so that nobody reads the id of a process that is done.
    if (m_held && ::ftruncate(m_descriptor, 0) != 0) errno = 0;
    ::close(m_descriptor);
}

pid_t FileLock::holder() const {
    char text[16] = {};
    if (::pread(m_descriptor, text, sizeof text - 1, 0) <= 0) return 0;
    return static_cast<pid_t>(std::strtol(text, nullptr, 10));
}

void FileLock::leaveProcessId() const {
    // Only told to people: without it the lock is as good.
    const std::string text = std::to_string(::getpid()) + "\n";
    if (::ftruncate(m_descriptor, 0) != 0 || ::pwrite(m_descriptor, text.data(), text.size(), 0) < 0)
        errno = 0;
}

}  // namespace ma
