// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/ServiceManager.h"

#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <string_view>

namespace host {

namespace {

void notify(const std::string& message) {
    const char* path = std::getenv("NOTIFY_SOCKET");
    sockaddr_un address{};
    if (path == nullptr || std::strlen(path) >= sizeof address.sun_path) return;
    address.sun_family = AF_UNIX;
    const std::size_t length = std::strlen(path);
    std::memcpy(address.sun_path, path, length);
    // A leading @ stands for the NUL of the abstract namespace.
    if (address.sun_path[0] == '@') address.sun_path[0] = '\0';
    const int socket = ::socket(AF_UNIX, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    if (socket < 0) return;
    ::sendto(socket, message.data(), message.size(), MSG_NOSIGNAL,
             reinterpret_cast<const sockaddr*>(&address),
             static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + length));
    ::close(socket);
}

}  // namespace

void ServiceManager::ready(const std::string& status) {
    notify("READY=1\nSTATUS=" + status);
}

void ServiceManager::reloading() {
    notify("RELOADING=1");
}

void ServiceManager::stopping(const std::string& status) {
    notify("STOPPING=1\nSTATUS=" + status);
}

void ServiceManager::stillStopping(const std::string& status, unsigned int seconds) {
    notify("EXTEND_TIMEOUT_USEC=" + std::to_string(seconds) + "000000\nSTATUS=" + status);
}

}  // namespace host
