// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/Report.h"

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <iostream>

#include "Utils/Log.h"

namespace host {

namespace {

/// One write, so that lines of several threads do not mix.
void say(const std::string& text) {
    std::cerr << "quenx-cimd: " + text + "\n";
}

}  // namespace

void report(const std::string& text) {
    say(text);
    QUENX_DEBUG_TEXT(text);
}

void reportProblem(const std::string& text) {
    say(text);
    QUENX_ERROR_TEXT(text);
}

void notifyServiceManager(const std::string& state) {
    const char* path = std::getenv("NOTIFY_SOCKET");
    sockaddr_un address{};
    // A path that is too long cannot be a socket's, and there is nobody to tell that.
    if (path == nullptr || std::strlen(path) >= sizeof address.sun_path) return;
    address.sun_family = AF_UNIX;
    const std::size_t length = std::strlen(path);
    std::memcpy(address.sun_path, path, length);
    // A leading @ stands for the NUL of the abstract namespace.
    if (address.sun_path[0] == '@') address.sun_path[0] = '\0';
    // Without the library of systemd: if there is no systemd, it is missing, and two calls do the same.
    const int socket = ::socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    if (socket < 0) return;
    // A manager that has stopped reading must not stop the daemon.
    ::sendto(socket, state.data(), state.size(), MSG_NOSIGNAL | MSG_DONTWAIT,
             reinterpret_cast<const sockaddr*>(&address),
             static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + length));
    ::close(socket);
}

}  // namespace host
