// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "Host/Authentication/Authentication.h"
#include "Host/Server/Acceptor.h"
#include "Host/Server/UserSlots.h"
#include "Host/Settings.h"

struct MHD_Daemon;

namespace host {

class ConnectionWatch;
class Control;
class Dispatcher;
class HttpRequest;
class LocalSocket;
class ServerCertificate;
class SessionTickets;

/// An address and port that cannot be listened on. what() tells a person why, and what to do.
class ListenError : public std::runtime_error {
  public:
    ListenError(const std::string& text, int code) : std::runtime_error(text), m_code(code) {}

    /// The system's error number; EINVAL for a text that is not an address.
    int code() const { return m_code; }

  private:
    int m_code;
};

/// A listening TCP socket, close-on-exec, which the caller owns. Port 0 takes any free one. Throws
/// ListenError.
int openListener(const std::string& address, std::uint16_t port);

/// Serves CIM-XML over HTTP and HTTPS. One thread per connection, and a bounded number of them: a request may
/// verify an image or ask PAM, and would stall every client of a thread that serves many. One per process,
/// since TLS asks for the certificate through a function without context. Thread-safe.
class HttpServer {
  public:
    /// @param control  serves paths of the daemon's own; null for none. Everything outlives the server
    HttpServer(const ServerLimits& limits, Dispatcher& dispatcher, Authentication& authentication,
               Control* control = nullptr);
    /// Ends all connections and waits for their threads.
    ~HttpServer();
    HttpServer(const HttpServer&) = delete;
    HttpServer& operator=(const HttpServer&) = delete;

    /// Returns the port, also where 0 asked for any. Throws std::runtime_error. TLS needs a certificate
    /// first.
    std::uint16_t listen(const std::string& address, std::uint16_t port, bool tls);
    /// On a Unix socket. Throws std::runtime_error.
    void listenLocally(const std::string& path);
    /// What connections from now on are shown. None of them goes on with a session of before.
    void setCertificate(std::shared_ptr<const ServerCertificate> certificate);

    /// Users may have been removed: has those who are idle log in again before they count as logged in.
    void doubtLogins();

    /// Takes no more connections, ends those that are idle, and has the others end after their answer.
    void stopAccepting();
    /// The requests being carried out.
    unsigned int inFlight() const { return m_inFlight.load(); }

  private:
    friend class HttpRequest;
    struct Callbacks;

    MHD_Daemon* library(bool tls);
    void accept(int listener, Acceptor::Taker taker);

    const ServerLimits m_limits;
    Dispatcher& m_dispatcher;
    Authentication& m_authentication;
    Control* const m_control;
    UserSlots m_userSlots;
    Slots m_workers;
    Slots m_localWorkers;
    std::atomic<unsigned int> m_inFlight{0};
    std::atomic<bool> m_stopping{false};
    /// All so far: a handshake may still use an old one.
    std::vector<std::shared_ptr<const ServerCertificate>> m_certificates;
    std::unique_ptr<SessionTickets> m_tickets;
    std::unique_ptr<ConnectionWatch> m_watch;
    std::array<MHD_Daemon*, 2> m_libraries{};  ///< plain and with TLS, once they are needed
    std::unique_ptr<LocalSocket> m_localSocket;
    std::vector<std::unique_ptr<Acceptor>> m_acceptors;
};

}  // namespace host
