// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <sys/time.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <string>
#include <string_view>
#include <tuple>

namespace test {

/// A TCP connection on loopback that sends what it is told, right or wrong.
class RawConnection {
  public:
    /// @param from    the address to come from, any of 127.0.0.0/8
    /// @param buffer  bytes that this side takes before it reads; 0 for the system's choice
    RawConnection(int port, const char* from, int buffer = 0)
        : m_socket(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        const timeval patience{60, 0};
        ::setsockopt(m_socket, SOL_SOCKET, SO_RCVTIMEO, &patience, sizeof patience);
        if (buffer != 0) {
            // Both: with the large packets of loopback the other side would take megabytes into its own
            // buffer.
            const int packet = 536;
            ::setsockopt(m_socket, SOL_SOCKET, SO_RCVBUF, &buffer, sizeof buffer);
            ::setsockopt(m_socket, IPPROTO_TCP, TCP_MAXSEG, &packet, sizeof packet);
        }
        sockaddr_in address{};
        address.sin_family = AF_INET;
        ::inet_pton(AF_INET, from, &address.sin_addr);
        EXPECT_EQ(::bind(m_socket, reinterpret_cast<const sockaddr*>(&address), sizeof address), 0);
        address.sin_port = htons(static_cast<std::uint16_t>(port));
        ::inet_pton(AF_INET, "127.0.0.1", &address.sin_addr);
        // A refusal shows as soon as something is sent.
        std::ignore = ::connect(m_socket, reinterpret_cast<const sockaddr*>(&address), sizeof address);
    }
    RawConnection(const RawConnection&) = delete;
    RawConnection& operator=(const RawConnection&) = delete;
    ~RawConnection() { ::close(m_socket); }

    /// False when the other side has gone.
    bool send(std::string_view bytes) const {
        while (!bytes.empty()) {
            const ssize_t sent = ::send(m_socket, bytes.data(), bytes.size(), MSG_NOSIGNAL);
            if (sent <= 0) return false;
            bytes.remove_prefix(static_cast<std::size_t>(sent));
        }
        return true;
    }
    /// No more will be sent.
    void endSending() const { ::shutdown(m_socket, SHUT_WR); }
    /// A piece of what comes; empty once the other side has closed. Expects one of them within a minute,
    /// which is longer than a busy machine takes.
    std::string receivePiece() const {
        std::array<char, 2048> bytes{};
        const ssize_t length = ::recv(m_socket, bytes.data(), bytes.size(), 0);
        EXPECT_TRUE(length >= 0 || errno == ECONNRESET) << "the connection stays open";
        return {bytes.data(), length > 0 ? static_cast<std::size_t>(length) : 0};
    }
    /// What comes until the other side closes.
    std::string receive() const {
        std::string answer;
        for (std::string piece = receivePiece(); !piece.empty(); piece = receivePiece())
            answer += piece;
        return answer;
    }

  private:
    const int m_socket;
};

/// "POST /cimom" with the body, by the user "admin" with that password, or with another header in its place.
/// The connection ends with the answer.
inline std::string httpRequest(const std::string& body,
                               const std::string& login = "Authorization: Basic YWRtaW46YWRtaW4=") {
    return "POST /cimom HTTP/1.1\r\nHost: 127.0.0.1\r\nContent-Type: application/xml\r\n"
           "CIMOperation: MethodCall\r\nConnection: close\r\n" +
           login + "\r\nContent-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body;
}

/// The number behind "HTTP/1.1 " of an answer; 0 for none.
inline int statusOf(const std::string& answer) {
    return answer.starts_with("HTTP/1.1 ") ? std::atoi(answer.c_str() + 9) : 0;
}

}  // namespace test
