// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/FlashFiles.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>

#include "Utils/Os/Linux/linux.h"

namespace ma {

namespace {

constexpr mode_t kFolderMode = 0755;

[[noreturn]] void fail(const std::string& what) {
    throw std::system_error(errno, std::generic_category(), what);
}

}  // namespace

FlashFiles::~FlashFiles() = default;

void FlashFiles::makeFolder(const std::string& path) {
    if (::mkdir(path.c_str(), kFolderMode) != 0 && errno != EEXIST) fail("cannot make the folder " + path);
}

int FlashFiles::create(const std::string& path) {
    // A link in the state directory, or somebody else's file, must not lead the daemon, which is root, to
    // another file.
    const int file = os::openOwnFile(path, O_WRONLY);
    if (file >= 0 && ::ftruncate(file, 0) == 0) return file;
    const int error = errno;
    if (file >= 0) ::close(file);
    errno = error;
    fail("cannot write the file " + path);
}

void FlashFiles::write(int descriptor, std::span<const std::uint8_t> bytes) {
    // A signal, or a medium that is nearly full, ends a write early.
    while (!bytes.empty()) {
        const ssize_t written = ::write(descriptor, bytes.data(), bytes.size());
        if (written < 0 && errno == EINTR) continue;
        if (written < 0) fail("cannot write to the flash");
        bytes = bytes.subspan(static_cast<std::size_t>(written));
    }
}

void FlashFiles::sync(int descriptor) {
    if (::fsync(descriptor) != 0) fail("cannot bring the flash to the medium");
}

void FlashFiles::rename(const std::string& from, const std::string& to) {
    if (::rename(from.c_str(), to.c_str()) != 0) fail("cannot rename " + from);
}

void FlashFiles::syncFolder(const std::string& path) {
    const os::Descriptor folder(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.number() < 0) fail("cannot open the folder " + path);
    if (::fsync(folder.number()) != 0) fail("cannot bring the folder " + path + " to the medium");
}

}  // namespace ma
