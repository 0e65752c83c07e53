// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/socket.h>
#include <unistd.h>

#include <string>
#include <string_view>

namespace test {

/// A TCP connection on loopback that sends what it is told, right or wrong. Waits for a minute at most, which
/// is longer than a busy machine takes.
class RawConnection {
  public:
    /// @param from  the address to come from, any of 127.0.0.0/8
    RawConnection(int port, const std::string& from);
    RawConnection(const RawConnection&) = delete;
    RawConnection& operator=(const RawConnection&) = delete;
    ~RawConnection() { ::close(m_socket); }

    /// False when the other side has gone.
    bool send(std::string_view bytes) const;
    /// No more will be sent.
    void endSending() const { ::shutdown(m_socket, SHUT_WR); }
    /// What comes until an answer is whole or the other side closes.
    std::string receive() const;
    /// Waits for the other side to close; what it sends is dropped.
    bool isClosed() const;

  private:
    const int m_socket;
};

/// "POST /cimom" with the body, by the user "admin" with that password, or with another header in its place.
std::string httpRequest(const std::string& body,
                        const std::string& authorization = "Authorization: Basic YWRtaW46YWRtaW4=");

/// The number behind "HTTP/1.1 " of an answer; 0 for none.
int statusOf(const std::string& answer);

}  // namespace test
