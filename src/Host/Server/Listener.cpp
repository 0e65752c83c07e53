// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/Listener.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <utility>

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
        throw std::runtime_error(
            "listen.address is \"" + text +
            "\". It must be an IPv4 or IPv6 address such as 127.0.0.1, or 0.0.0.0 or :: for all.");
    }
    return address;
}

std::uint16_t portOf(int socket) {
    SocketAddress address;
    address.length = sizeof address.storage;
    ::getsockname(socket, reinterpret_cast<sockaddr*>(&address.storage), &address.length);
    // The port is at the same place in both families.
    return ntohs(reinterpret_cast<const sockaddr_in*>(&address.storage)->sin_port);
}

}  // namespace

void Listener::checkAddress(const std::string& address) {
    addressOf(address, 0);
}

Listener::Listener(const std::string& address, std::uint16_t port) {
    const SocketAddress place = addressOf(address, port);
    m_socket = ::socket(place.storage.ss_family, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
    const int yes = 1;
    if (m_socket >= 0) ::setsockopt(m_socket, SOL_SOCKET, SO_REUSEADDR, &yes, sizeof yes);
    if (m_socket < 0 ||
        ::bind(m_socket, reinterpret_cast<const sockaddr*>(&place.storage), place.length) != 0 ||
        ::listen(m_socket, SOMAXCONN) != 0) {
        const int error = errno;
        if (m_socket >= 0) ::close(m_socket);
        throw std::runtime_error("Cannot listen on " + address + " port " + std::to_string(port) + ": " +
                                 std::strerror(error) + ". Check listen.address and the ports.");
    }
    m_port = portOf(m_socket);
}

Listener::Listener(Listener&& other) noexcept
    : m_socket(std::exchange(other.m_socket, -1)), m_port(other.m_port) {}

Listener::~Listener() {
    if (m_socket >= 0) ::close(m_socket);
}

int Listener::release() {
    return std::exchange(m_socket, -1);
}

}  // namespace host
