// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/LocalSocket.h"

#include <pwd.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <system_error>

#include "CimXml/Request.h"
#include "Host/Server/HttpServer.h"

namespace host {

namespace {

namespace fs = std::filesystem;

[[noreturn]] void refuse(const std::string& path, int error, const std::string& why = "") {
    const std::string advice = error == EACCES ? "Run as root, or set listen.socket to another path"
                               : error == EADDRINUSE
                                   ? "Stop that process, or set listen.socket to another path"
                                   : "Set listen.socket to a path in a folder of root's own, such as " +
                                         std::string(cimxml::kDefaultSocket);
    throw ListenError("Cannot make the socket " + path + ": " + (why.empty() ? std::strerror(error) : why) +
                          ". " + advice + ", or to \"\" for none.",
                      error);
}

sockaddr_un addressOf(const std::string& path) {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    constexpr std::size_t kLongest = sizeof address.sun_path - 1;
    if (path.size() > kLongest)
        refuse(path, ENAMETOOLONG,
               "a socket's path has at most " + std::to_string(kLongest) + " characters, this one has " +
                   std::to_string(path.size()));
    path.copy(address.sun_path, kLongest);
    return address;
}

/// Whoever can write there can put a socket of his own in the place of this one.
void requireOwnFolder(const std::string& path) {
    const std::string folder = fs::absolute(path).parent_path().string();
    struct stat status {};
    if (::stat(folder.c_str(), &status) != 0) refuse(path, errno);
    if (!S_ISDIR(status.st_mode)) refuse(path, ENOTDIR);
    const bool isOwn = status.st_uid == 0 || status.st_uid == ::geteuid();
    if (!isOwn || (status.st_mode & (S_IWGRP | S_IWOTH)) != 0)
        refuse(path, EPERM, "others can write to " + folder);
}

int connectTo(const std::string& path) {
    const sockaddr_un address = addressOf(path);
    const os::Descriptor probe(::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0));
    if (!probe.isOpen()) return errno;
    return ::connect(probe.number(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0
               ? 0
               : errno;
}

/// Whether there is a socket that nobody listens on. Refuses whatever else may be there: the path may be a
/// mistake, and what it names somebody else's.
bool isLeftOver(const std::string& path) {
    struct stat status {};
    if (::lstat(path.c_str(), &status) != 0) {
        if (errno != ENOENT) refuse(path, errno);
        return false;
    }
    if (!S_ISSOCK(status.st_mode)) refuse(path, EEXIST, "there is a file that is not a socket");
    const int error = connectTo(path);
    if (error == ECONNREFUSED) return true;
    if (error == 0 || error == EAGAIN) refuse(path, EADDRINUSE, "another process listens there");
    refuse(path, error);
}

/// So that of two daemons that start at the same time, neither replaces the socket of the other.
std::string lockBeside(const std::string& path) {
    LocalSocket::check(path);
    return path + ".lock";
}

int listenAt(const std::string& path, bool isFree) {
    // It is held for as long as the socket is listened on.
    if (!isFree) refuse(path, EADDRINUSE, "another process listens there");
    if (isLeftOver(path)) ::unlink(path.c_str());
    const sockaddr_un address = addressOf(path);
    const int socket = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    // The mode before the name: at no time can anybody else connect.
    if (socket < 0 || ::fchmod(socket, S_IRUSR | S_IWUSR) != 0 ||
        ::bind(socket, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 ||
        ::listen(socket, SOMAXCONN) != 0) {
        const int error = errno;
        if (socket >= 0) ::close(socket);
        refuse(path, error);
    }
    return socket;
}

ino_t fileAt(const std::string& path) {
    struct stat status {};
    return ::lstat(path.c_str(), &status) == 0 ? status.st_ino : 0;
}

std::string nameOf(uid_t user) {
    passwd entry{};
    passwd* found = nullptr;
    std::array<char, 16384> buffer{};
    ::getpwuid_r(user, &entry, buffer.data(), buffer.size(), &found);
    return found == nullptr ? "uid " + std::to_string(user) : std::string(found->pw_name);
}

}  // namespace

void LocalSocket::check(const std::string& path) {
    addressOf(path);
    requireOwnFolder(path);
    isLeftOver(path);
}

LocalSocket::LocalSocket(const std::string& path) try
    : m_path(path),
      m_lock(lockBeside(path)),
      m_listener(listenAt(path, m_lock.isHeld())),
      m_file(fileAt(path)) {
} catch (const std::system_error& error) {
    refuse(path, error.code().value());
}

LocalSocket::~LocalSocket() {
    if (m_file != 0 && fileAt(m_path) == m_file) ::unlink(m_path.c_str());
}

std::optional<User> localUserAt(int socket) {
    ucred peer{};
    socklen_t size = sizeof peer;
    if (::getsockopt(socket, SOL_SOCKET, SO_PEERCRED, &peer, &size) != 0) return std::nullopt;
    if (peer.uid != 0 && peer.uid != ::geteuid()) return std::nullopt;
    return User{nameOf(peer.uid), true, true};
}

}  // namespace host
