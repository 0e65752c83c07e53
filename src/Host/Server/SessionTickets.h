// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gnutls/gnutls.h>

#include <chrono>

#include "Utils/Os/Linux/Mutex.h"
#include "Utils/Os/Linux/Thread.h"

namespace host {

/// Spares clients that connect again the signature and the certificate: TLS hands them a ticket that only
/// this process can read (RFC 5077, RFC 8446 2.2), and keeps nothing for them. Thread-safe.
class SessionTickets {
  public:
    SessionTickets() = default;
    ~SessionTickets();
    SessionTickets(const SessionTickets&) = delete;
    SessionTickets& operator=(const SessionTickets&) = delete;

    /// Before the session's handshake: takes a ticket from the client, and gives it one. Where no key can be
    /// made, as when memory is short, the handshake is a whole one.
    void offer(gnutls_session_t session);

    /// No ticket given so far is taken any more.
    void forget();

  private:
    using Clock = std::chrono::steady_clock;

    void dropKey() QUENX_REQUIRES(m_mutex);

    utils::Mutex m_mutex;
    gnutls_datum_t m_key QUENX_GUARDED_BY(m_mutex) = {};
    Clock::time_point m_made QUENX_GUARDED_BY(m_mutex);
};

}  // namespace host
