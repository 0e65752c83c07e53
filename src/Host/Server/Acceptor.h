// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/socket.h>

#include <functional>
#include <stop_token>
#include <thread>

#include "Host/Server/ConnectionWatch.h"

namespace host {

/// Takes connections off a listening socket, on a thread of its own, as far as there is room for them. The
/// HTTP library would do it, too, but turns a newcomer away when there are too many, and tries without a
/// pause when there are no more descriptors.
class Acceptor {
  public:
    /// Gets the socket of a connection, which it owns from then on. Throws nothing; false when the connection
    /// cannot be served, and its socket is closed.
    using Taker = std::function<bool(int socket, const sockaddr& address, socklen_t length)>;

    /// @param listener  a blocking socket, owned from now on
    Acceptor(int listener, ConnectionWatch& watch, Taker taker);
    /// Closes the listening socket: from then on a client is refused at once, not left waiting.
    ~Acceptor();
    Acceptor(const Acceptor&) = delete;
    Acceptor& operator=(const Acceptor&) = delete;

  private:
    void run(const std::stop_token& stop);
    std::optional<std::uint64_t> admit(int socket, const sockaddr& address, const std::stop_token& stop);
    void pause(int error, const std::stop_token& stop);

    const int m_listener;
    ConnectionWatch& m_watch;
    const Taker m_taker;
    std::jthread m_thread{[this](const std::stop_token& stop) { run(stop); }};  // last: it uses the others
};

}  // namespace host
