// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/OwnFiles.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>

#include "Utils/Os/Linux/linux.h"

namespace os {

namespace {

[[noreturn]] void fail(int error, const std::string& what) {
    throw std::system_error(error, std::generic_category(), what);
}

}  // namespace

bool closeFolderToOthers(const std::string& path) {
    const Descriptor folder(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC | O_NOFOLLOW));
    if (folder.number() < 0 && errno == ENOENT) return false;
    struct stat status {};
    if (folder.number() < 0 || ::fstat(folder.number(), &status) != 0)
        fail(errno, "cannot use the folder " + path);
    if (status.st_uid != ::geteuid()) {
        fail(EACCES, "the folder " + path + " belongs to user " + std::to_string(status.st_uid) +
                         ", who could exchange the flash; choose another one, or make it yours");
    }
    const bool isOpen = (status.st_mode & (S_IRWXG | S_IRWXO)) != 0;
    if (isOpen && ::fchmod(folder.number(), S_IRWXU) != 0) fail(errno, "cannot protect the folder " + path);
    return true;
}

void writeAll(int file, std::span<const std::uint8_t> bytes, const std::string& what) {
    // A signal, or a medium that is nearly full, ends a write early.
    while (!bytes.empty()) {
        const ssize_t written = ::write(file, bytes.data(), bytes.size());
        if (written < 0 && errno == EINTR) continue;
        if (written < 0) fail(errno, what);
        bytes = bytes.subspan(static_cast<std::size_t>(written));
    }
}

void syncFolder(const std::string& path) {
    const Descriptor folder(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.number() < 0) fail(errno, "cannot open the folder " + path);
    if (::fsync(folder.number()) != 0) fail(errno, "cannot bring the folder " + path + " to the medium");
}

}  // namespace os
