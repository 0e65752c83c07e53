// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <memory>
#include <string>
#include <vector>

#include "Host/Settings.h"
#include "Host/Slots.h"

struct MHD_Connection;
struct MHD_Daemon;
struct MHD_Response;

namespace host {

class Authentication;
class ConnectionWatch;
class Dispatcher;
class HttpRequest;
class Listener;
class TlsIdentity;

/// Serves CIM-XML over HTTP and HTTPS. One thread per connection, and a bounded number of them: a request may
/// verify an image or ask PAM, and would stall every client of a thread that serves many. One per process,
/// since TLS asks for the certificate through a function without context. Thread-safe.
class HttpServer {
  public:
    HttpServer(const ServerLimits& limits, Dispatcher& dispatcher, Authentication& authentication);
    /// Ends all connections and waits for their threads.
    ~HttpServer();
    HttpServer(const HttpServer&) = delete;
    HttpServer& operator=(const HttpServer&) = delete;

    /// Throws std::runtime_error. TLS needs an identity first.
    void listen(Listener listener, bool tls);
    /// What connections from now on are shown.
    void setIdentity(std::shared_ptr<const TlsIdentity> identity);

    /// Takes no more connections, ends those that are idle, and has the others end after their answer.
    void stopAccepting();
    /// The requests being carried out.
    unsigned int inFlight() const { return m_inFlight.load(); }

  private:
    friend class HttpRequest;
    struct Callbacks;

    void close();

    const ServerLimits m_limits;
    Dispatcher& m_dispatcher;
    Authentication& m_authentication;
    Slots m_workers;
    std::atomic<unsigned int> m_inFlight{0};
    std::atomic<bool> m_stopping{false};
    std::vector<std::shared_ptr<const TlsIdentity>> m_identities;  ///< a handshake may still use an old one
    std::unique_ptr<ConnectionWatch> m_watch;
    std::vector<MHD_Daemon*> m_daemons;
};

}  // namespace host
