// SPDX-License-Identifier: Apache-2.0
#include "System/RawConnection.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/time.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <tuple>

namespace test {

namespace {

sockaddr_in addressOf(const std::string& text, int port) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(static_cast<std::uint16_t>(port));
    ::inet_pton(AF_INET, text.c_str(), &address.sin_addr);
    return address;
}

/// Whether the text holds a head and as much body as it announces.
bool isWhole(const std::string& answer) {
    const std::size_t end = answer.find("\r\n\r\n");
    const std::size_t length = answer.find("Content-Length: ");
    if (end == std::string::npos || length > end) return false;
    return answer.size() - end - 4 >= std::strtoul(answer.c_str() + length + 16, nullptr, 10);
}

}  // namespace

RawConnection::RawConnection(int port, const std::string& from)
    : m_socket(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    const timeval patience{60, 0};
    ::setsockopt(m_socket, SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience);
    const sockaddr_in here = addressOf(from, 0);
    const sockaddr_in there = addressOf("127.0.0.1", port);
    // What fails here shows as soon as something is sent.
    if (::bind(m_socket, reinterpret_cast<const sockaddr*>(&here), sizeof here) == 0)
        std::ignore = ::connect(m_socket, reinterpret_cast<const sockaddr*>(&there), sizeof there);
}

bool RawConnection::send(std::string_view bytes) const {
    while (!bytes.empty()) {
        const ssize_t sent = ::send(m_socket, bytes.data(), bytes.size(), MSG_NOSIGNAL);
        if (sent <= 0) return false;
        bytes.remove_prefix(static_cast<std::size_t>(sent));
    }
    return true;
}

std::string RawConnection::receive() const {
    std::string answer;
    std::array<char, 4096> bytes{};
    while (!isWhole(answer)) {
        const ssize_t length = ::recv(m_socket, bytes.data(), bytes.size(), 0);
        if (length <= 0) break;
        answer.append(bytes.data(), static_cast<std::size_t>(length));
    }
    return answer;
}

bool RawConnection::isClosed() const {
    std::array<char, 4096> bytes{};
    ssize_t length = 0;
    while ((length = ::recv(m_socket, bytes.data(), bytes.size(), 0)) > 0) {
    }
    return length == 0 || errno == ECONNRESET;
}

std::string httpRequest(const std::string& body, const std::string& authorization) {
    return "POST /cimom HTTP/1.1\r\nHost: 127.0.0.1\r\nContent-Type: application/xml\r\n"
           "CIMOperation: MethodCall\r\n" +
           authorization + "\r\nContent-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body;
}

int statusOf(const std::string& answer) {
    return answer.starts_with("HTTP/1.1 ") ? std::atoi(answer.c_str() + 9) : 0;
}

}  // namespace test
