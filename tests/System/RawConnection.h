#pragma once

#include <chrono>
#include <string>
#include <string_view>

namespace test {

/// A TCP connection on loopback that sends what it is told, right or wrong.
class RawConnection {
  public:
    /// @param from  the address to come from, any of 127.0.0.0/8
    RawConnection(int port, const std::string& from);
    ~RawConnection();
    RawConnection(RawConnection&& other) noexcept;
    RawConnection& operator=(RawConnection&&) = delete;

    bool isOpen() const { return m_socket >= 0; }
    /// False when the other side has gone.
    bool send(std::string_view bytes) const;
    /// No more will be sent.
    void endSending() const;
    /// What comes until the other side closes, an answer is whole, or nothing has come for so long.
    std::string receive(std::chrono::milliseconds patience) const;
    /// Whether the other side closes within the time; what it sends is dropped.
    bool isClosedWithin(std::chrono::milliseconds time) const;

  private:
    int m_socket;
};

/// "POST /cimom" with the body, as the user, whose name is the password; without credentials for none.
std::string httpRequest(const std::string& body, const std::string& user = "admin");

/// The number behind "HTTP/1.1 " of an answer; 0 for none.
int statusOf(const std::string& answer);

std::string base64(const std::string& bytes);

}  // namespace test
