// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/FlashFiles.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>

#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/linux.h"

namespace ma {

namespace {

constexpr mode_t kFolderMode = 0755;
constexpr const char* kCannotWrite = "cannot write the file";

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
    const int file = os::openOwnFile(path, O_WRONLY, kCannotWrite);
    if (::ftruncate(file, 0) == 0) return file;
    const int error = errno;
    ::close(file);
    errno = error;
    fail(kCannotWrite + (" " + path));
}

void FlashFiles::write(int descriptor, std::span<const std::uint8_t> bytes) {
    os::writeAll(descriptor, bytes, "cannot write to the flash");
}

void FlashFiles::sync(int descriptor) {
    if (::fsync(descriptor) != 0) fail("cannot bring the flash to the medium");
}

void FlashFiles::rename(const std::string& from, const std::string& to) {
    if (::rename(from.c_str(), to.c_str()) != 0) fail("cannot rename " + from);
}

void FlashFiles::syncFolder(const std::string& path) {
    os::syncFolder(path);
}

}  // namespace ma
