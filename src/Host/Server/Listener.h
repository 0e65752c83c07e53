// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>

namespace host {

/// A listening TCP socket, close-on-exec. Owns it until release().
class Listener {
  public:
    /// Throws std::runtime_error for a text that is no address to listen on.
    static void checkAddress(const std::string& address);

    /// Port 0 takes any free one. Throws std::runtime_error that names address and port.
    Listener(const std::string& address, std::uint16_t port);
    ~Listener();
    Listener(Listener&& other) noexcept;
    Listener& operator=(Listener&&) = delete;

    std::uint16_t port() const { return m_port; }
    /// The socket, which the caller owns from now on.
    int release();

  private:
    int m_socket = -1;
    std::uint16_t m_port = 0;
};

}  // namespace host
