#include "Host/Authentication/CredentialCache.h"

#include <gnutls/crypto.h>
#include <gnutls/gnutls.h>

#include <stdexcept>

namespace host {

namespace {

/// Only right credentials get in, so it takes many real users to come here.
constexpr std::size_t kMostEntries = 1024;

}  // namespace

CredentialCache::CredentialCache(std::chrono::seconds rememberFor) : m_rememberFor(rememberFor) {
    clear();
}

void CredentialCache::clear() {
    Digest key{};
    if (::gnutls_rnd(GNUTLS_RND_KEY, key.data(), key.size()) != 0) {
        throw std::runtime_error("no random numbers for a key");
    }
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_key = key;
    m_entries.clear();
}

CredentialCache::Digest CredentialCache::digestOf(const Credentials& credentials) const {
    // A user name has no NUL, so no two pairs make one text.
    const std::string text = credentials.user + '\0' + credentials.password;
    Digest digest{};
    if (::gnutls_hmac_fast(GNUTLS_MAC_SHA256, m_key.data(), m_key.size(), text.data(), text.size(),
                           digest.data()) != 0) {
        throw std::runtime_error("credentials cannot be hashed");
    }
    return digest;
}

std::optional<Identity> CredentialCache::find(const Credentials& credentials) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    const auto found = m_entries.find(digestOf(credentials));
    if (found == m_entries.end()) return std::nullopt;
    if (found->second.expires > Clock::now()) return found->second.identity;
    m_entries.erase(found);
    return std::nullopt;
}

void CredentialCache::remember(const Credentials& credentials, const Identity& identity) {
    if (m_rememberFor.count() == 0) return;
    const utils::Mutex::AutoLocker lock(m_mutex);
    const auto now = Clock::now();
    std::erase_if(m_entries, [now](const auto& each) { return each.second.expires <= now; });
    if (m_entries.size() >= kMostEntries) return;
    m_entries[digestOf(credentials)] = {identity, now + m_rememberFor};
}

}  // namespace host
