// SPDX-License-Identifier: Apache-2.0
#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "Host/Server/HttpServer.h"

namespace host {

namespace {

struct SocketAddress {
    sockaddr_storage storage{};
    socklen_t length = 0;
};

SocketAddress addressOf(const std::string& text, std::uint16_t port) {
    SocketAddress address;
    auto* four = reinterpret_cast<sockaddr_in*>(&address.storage);
    auto* six = reinterpret_cast<sockaddr_in6*>(&address.storage);
    if (::inet_pton(AF_INET, text.c_str(), &four->sin_addr) == 1) {
        four->sin_family = AF_INET;
        four->sin_port = htons(port);
        address.length = sizeof *four;
    } else if (::inet_pton(AF_INET6, text.c_str(), &six->sin6_addr) == 1) {
        six->sin6_family = AF_INET6;
        six->sin6_port = htons(port);
        address.length = sizeof *six;
    } else {
        throw ListenError(
            "listen.address is \"" + text +
                "\". It must be an IPv4 or IPv6 address such as 127.0.0.1, or 0.0.0.0 or :: for all.",
            EINVAL);
    }
    return address;
}

const char* adviceFor(int error) {
    switch (error) {
        case EADDRINUSE:
            return "Stop the program that listens there, or set listen.https_port or listen.http_port.";
        case EACCES:
            return "Ports below 1024 need root or CAP_NET_BIND_SERVICE. Set another port, or run with one.";
        case EADDRNOTAVAIL:
            return "Set listen.address to an address of this machine, or to 0.0.0.0 or :: for all.";
        default:
            return "Check listen.address and the ports.";
    }
}

}  // namespace

int openListener(const std::string& address, std::uint16_t port) {
    const SocketAddress place = addressOf(address, port);
    const int socket = ::socket(place.storage.ss_family, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
    const int yes = 1;
    // Without it a restart would fail as long as connections of the last run are in the state TIME_WAIT.
    if (socket >= 0) ::setsockopt(socket, SOL_SOCKET, SO_REUSEADDR, &yes, sizeof yes);
    if (socket < 0 || ::bind(socket, reinterpret_cast<const sockaddr*>(&place.storage), place.length) != 0 ||
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
