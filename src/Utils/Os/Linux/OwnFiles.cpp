// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/OwnFiles.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <system_error>

#include "Utils/Os/Linux/linux.h"

namespace os {

namespace {

[[noreturn]] void fail(int error, const std::string& what) {
    throw std::system_error(error, std::generic_category(), what);
}

/// 0, or the errno value of what lets others share the file.
int whyNotAlone(const struct stat& status) noexcept {
    if (!S_ISREG(status.st_mode)) return EINVAL;
    return status.st_nlink > 1 ? EMLINK : 0;
}

/// The descriptor or, in its place, a copy with a number above 2.
int aboveStandard(int descriptor) noexcept {
    if (descriptor < 0 || descriptor > STDERR_FILENO) return descriptor;
    const int copy = fcntl(descriptor, F_DUPFD_CLOEXEC, STDERR_FILENO + 1);
    const int error = errno;
    close(descriptor);
    errno = error;
    return copy;
}

/// Whoever owns the folder around ours, or may write to it where no sticky bit protects what is others', can
/// put another one in its place.
void requireSafePlace(const Descriptor& folder, const std::string& path, const std::string& purpose) {
    struct stat status {};
    if (::fstatat(folder.number(), "..", &status, 0) != 0) fail(errno, purpose + " " + path);
    const std::string place = std::filesystem::path(path).parent_path().string();
    if (status.st_uid != ::geteuid() && status.st_uid != 0) throw ForeignFile(place, status.st_uid, purpose);
    if ((status.st_mode & S_IWOTH) != 0 && (status.st_mode & S_ISVTX) == 0)
        throw std::runtime_error(purpose + " " + path + ": everybody may exchange it; run: chmod o-w " +
                                 place);
}

}  // namespace

ForeignFile::ForeignFile(const std::string& path, uid_t owner, const std::string& purpose)
    : std::runtime_error(purpose + " " + path + ": it belongs to user " + std::to_string(owner) +
                         ", who could exchange it; remove it, or run: chown " + std::to_string(geteuid()) +
                         " " + path) {}

int openOwnFile(const std::string& path, int access, const std::string& purpose) {
    constexpr int kFlags = O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY;
    const uid_t user = geteuid();
    const int file = aboveStandard(open(path.c_str(), access | kFlags, S_IRUSR | S_IWUSR));
    int error = file < 0 ? errno : 0;
    struct stat status {};
    status.st_uid = user;
    // Rights refuse root nothing: in a folder like /tmp it is another user's file that the system keeps
    // closed.
    if (error == EACCES && user == 0) static_cast<void>(lstat(path.c_str(), &status));
    if (error == 0) error = fstat(file, &status) != 0 ? errno : whyNotAlone(status);
    if (error == 0 && status.st_uid == user) return file;
    if (file >= 0) close(file);
    if (status.st_uid != user) throw ForeignFile(path, status.st_uid, purpose);
    fail(error, purpose + " " + path);
}

bool closeToOthers(int descriptor) noexcept {
    struct stat status {};
    if (fstat(descriptor, &status) != 0) return false;
    if ((status.st_mode & (S_IRWXG | S_IRWXO)) == 0) return true;
    return fchmod(descriptor, S_ISDIR(status.st_mode) ? S_IRWXU : S_IRUSR | S_IWUSR) == 0;
}

namespace {

/// A folder of this user's that nobody else can exchange. Not open where there is none.
Descriptor openOwnFolder(const std::string& path, struct stat& status) {
    const std::string purpose = "cannot use the folder";
    Descriptor folder(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC | O_NOFOLLOW));
    if (!folder.isOpen() && errno == ENOENT) return folder;
    if (!folder.isOpen() || ::fstat(folder.number(), &status) != 0) fail(errno, purpose + " " + path);
    if (status.st_uid != ::geteuid()) throw ForeignFile(path, status.st_uid, purpose);
    requireSafePlace(folder, path, purpose);
    return folder;
}

}  // namespace

bool closeFolderToOthers(const std::string& path) {
    struct stat status {};
    const Descriptor folder = openOwnFolder(path, status);
    if (folder.isOpen() && !closeToOthers(folder.number())) fail(errno, "cannot protect the folder " + path);
    return folder.isOpen();
}

void makeOwnFolder(const std::string& named) {
    // A slash at the end would make it one below itself.
    const std::string path = named.substr(0, named.find_last_not_of('/') + 1);
    std::filesystem::create_directories(std::filesystem::path(path).parent_path());
    if (::mkdir(path.c_str(), S_IRWXU) != 0 && errno != EEXIST) fail(errno, "cannot make the folder " + path);
    struct stat status {};
    const Descriptor folder = openOwnFolder(path, status);
    if ((status.st_mode & (S_IRWXG | S_IRWXO)) != 0)
        throw std::runtime_error("cannot use the folder " + path +
                                 ": others may look into it; run: chmod 700 " + path +
                                 ", or name another folder");
}

std::string whoElseMayChange(const Descriptor& opened, const std::string& path) {
    struct stat status {};
    if (::fstat(opened.number(), &status) != 0) fail(errno, "cannot look at " + path);
    // Whoever owns something can write to it, whatever its mode is now.
    if (status.st_uid != 0 && status.st_uid != ::geteuid())
        return "belongs to user " + std::to_string(status.st_uid) +
               ", who could change it; run: chown root " + path;
    if ((status.st_mode & (S_IWGRP | S_IWOTH)) != 0)
        return "can be changed by others than its owner; run: chmod go-w " + path;
    return "";
}

std::string readUpTo(const Descriptor& file, std::size_t most) {
    constexpr std::size_t kPiece = 4096;
    std::string text;
    while (text.size() < most) {
        const std::size_t length = text.size();
        text.resize(std::min(most, length + kPiece));
        const ssize_t got = ::read(file.number(), text.data() + length, text.size() - length);
        if (got < 0 && errno != EINTR) fail(errno, "cannot read");
        text.resize(length + static_cast<std::size_t>(std::max<ssize_t>(got, 0)));
        if (got == 0) break;
    }
    return text;
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

void replaceFile(const std::string& path, std::string_view content, mode_t mode) {
    const std::string purpose = "cannot write " + path;
    std::string fresh = path + ".XXXXXX";
    const Descriptor file(::mkostemp(fresh.data(), O_CLOEXEC));
    if (file.number() < 0) fail(errno, purpose);
    try {
        writeAll(file.number(),
                 std::span(reinterpret_cast<const std::uint8_t*>(content.data()), content.size()), purpose);
        if (::fchmod(file.number(), mode) != 0 || ::fsync(file.number()) != 0 ||
            ::rename(fresh.c_str(), path.c_str()) != 0)
            fail(errno, purpose);
    } catch (...) {
        ::unlink(fresh.c_str());
        throw;
    }
}

void syncFolder(const std::string& path) {
    const Descriptor folder(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!folder.isOpen()) fail(errno, "cannot open the folder " + path);
    if (::fsync(folder.number()) != 0) fail(errno, "cannot bring the folder " + path + " to the medium");
}

}  // namespace os
