// SPDX-License-Identifier: Apache-2.0
#include <netdb.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "Host/Server/HttpServer.h"

namespace host {

namespace {

struct Free {
    void operator()(addrinfo* list) const { ::freeaddrinfo(list); }
};

std::unique_ptr<addrinfo, Free> addressOf(const std::string& text, std::uint16_t port) {
    addrinfo hints{};
    // Names are not looked up: which of a name's addresses would be listened on is nothing to guess.
    hints.ai_flags = AI_NUMERICHOST | AI_NUMERICSERV;
    hints.ai_socktype = SOCK_STREAM;
    addrinfo* found = nullptr;
    if (::getaddrinfo(text.c_str(), std::to_string(port).c_str(), &hints, &found) == 0)
        return std::unique_ptr<addrinfo, Free>(found);
    throw ListenError(
        "listen.address is \"" + text +
            "\". It must be an IPv4 or IPv6 address such as 127.0.0.1, or 0.0.0.0 or :: for all.",
        EINVAL);
}

const char* adviceFor(int error) {
    switch (error) {
        case EADDRINUSE:
            return "Stop the program that listens there, or set listen.https_port or listen.http_port.";
        case EACCES:
            return "Ports below 1024 need CAP_NET_BIND_SERVICE, which root has outside of the service. Set "
                   "another "
                   "port, or grant it.";
        case EADDRNOTAVAIL:
            return "Set listen.address to an address of this machine, or to 0.0.0.0 or :: for all.";
        default:
            return "Check listen.address and the ports.";
    }
}

}  // namespace

int openListener(const std::string& address, std::uint16_t port) {
    const auto place = addressOf(address, port);
    const int socket = ::socket(place->ai_family, SOCK_STREAM | SOCK_CLOEXEC, 0);
    const int yes = 1;
    // Without it a restart would fail as long as connections of the last run are in the state TIME_WAIT.
    if (socket >= 0) ::setsockopt(socket, SOL_SOCKET, SO_REUSEADDR, &yes, sizeof yes);
    if (socket < 0 || ::bind(socket, place->ai_addr, place->ai_addrlen) != 0 ||
        ::listen(socket, SOMAXCONN) != 0) {
        const int error = errno;
        if (socket >= 0) ::close(socket);
        throw ListenError("Cannot listen on " + address + " port " + std::to_string(port) + ": " +
                              std::strerror(error) + ". " + adviceFor(error),
                          error);
    }
    return socket;
}

}  // namespace host
