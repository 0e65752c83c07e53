// SPDX-License-Identifier: Apache-2.0
#include <gnutls/crypto.h>
#include <gnutls/gnutls.h>

#include <algorithm>
#include <stdexcept>

#include "Host/Authentication/Authentication.h"

namespace host {

namespace {

/// Only right credentials get in, so it takes many real users to come here.
constexpr std::size_t kMaxEntries = 1024;

}  // namespace

CredentialCache::CredentialCache(std::chrono::seconds rememberFor) : m_rememberFor(rememberFor) {
    if (::gnutls_rnd(GNUTLS_RND_KEY, m_key.data(), m_key.size()) != 0) {
        throw std::runtime_error("Cannot get random numbers for a key");
    }
}

void CredentialCache::expire() {
    const utils::Mutex::AutoLocker lock(m_mutex);
    ++m_generation;
    for (auto& [digest, entry] : m_entries)
        entry.expires = Clock::time_point::min();
}

std::uint64_t CredentialCache::generation() {
    const utils::Mutex::AutoLocker lock(m_mutex);
    return m_generation;
}

CredentialCache::Digest CredentialCache::digestOf(const Credentials& credentials,
                                                  const std::string& place) const {
    // A user name has no NUL and the place tells its length, so no two of them make one text.
    const std::string text =
        std::to_string(place.size()) + ':' + place + credentials.user + '\0' + credentials.password;
    Digest digest{};
    if (::gnutls_hmac_fast(GNUTLS_MAC_SHA256, m_key.data(), m_key.size(), text.data(), text.size(),
                           digest.data()) != 0) {
        throw std::runtime_error("Cannot hash the credentials");
    }
    return digest;
}

std::optional<CredentialCache::Known> CredentialCache::find(const Credentials& credentials,
                                                            const std::string& place) {
    // Before the lock: each request of each connection comes here.
    const Digest digest = digestOf(credentials, place);
    const utils::Mutex::AutoLocker lock(m_mutex);
    const auto found = m_entries.find(digest);
    if (found == m_entries.end()) return std::nullopt;
    return Known{found->second.user, found->second.expires > Clock::now()};
}

void CredentialCache::remember(const Credentials& credentials, const std::string& place, const User& user,
                               std::uint64_t generation) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    // The users were read again while this password was checked: it may be wrong by now.
    if (generation != m_generation) return;
    // A linear search for the oldest is rare and short; an order of its own would cost with every look-up.
    if (m_entries.size() >= kMaxEntries) {
        m_entries.erase(std::min_element(
            m_entries.begin(), m_entries.end(),
            [](const auto& a, const auto& b) { return a.second.expires < b.second.expires; }));
    }
    m_entries[digestOf(credentials, place)] = {user, Clock::now() + m_rememberFor};
}

void CredentialCache::forget(const Credentials& credentials, const std::string& place) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_entries.erase(digestOf(credentials, place));
}

}  // namespace host
