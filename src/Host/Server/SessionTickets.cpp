// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/SessionTickets.h"

namespace host {

namespace {

// Whoever comes by a key can read what was recorded of TLS 1.2 sessions that were resumed with it. So it
// lives an hour, in no file; what that costs is one whole handshake an hour for each client.
constexpr std::chrono::hours kLifetime{1};

}  // namespace

SessionTickets::~SessionTickets() {
    forget();
}

void SessionTickets::dropKey() {
    if (m_key.data == nullptr) return;
    // Freed memory keeps what was in it, and may end up in a core file.
    ::gnutls_memset(m_key.data, 0, m_key.size);
    ::gnutls_free(m_key.data);
    m_key = {};
}

void SessionTickets::forget() {
    const utils::Mutex::AutoLocker lock(m_mutex);
    dropKey();
}

void SessionTickets::offer(gnutls_session_t session) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    const auto now = Clock::now();
    if (now - m_made >= kLifetime) dropKey();
    if (m_key.data == nullptr) {
        if (::gnutls_session_ticket_key_generate(&m_key) != GNUTLS_E_SUCCESS) m_key = {};
        m_made = now;
    }
    // The session copies the key.
    if (m_key.data != nullptr) ::gnutls_session_ticket_enable_server(session, &m_key);
}

}  // namespace host
