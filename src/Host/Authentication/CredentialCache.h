// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <chrono>
#include <cstdint>
#include <map>
#include <optional>

#include "Host/Authentication/PasswordChecker.h"
#include "Utils/Os/Linux/Thread.h"
#include "Utils/ThreadAnnotations.h"

namespace host {

/// Remembers for a short while whose credentials were right, since checking a password costs tens of
/// milliseconds and clients send it with every request; and for good which ones were, so that those need not
/// wait with the ones that somebody guesses. Both hold for the place (the address) that they came from only,
/// or one user's login would let everybody everywhere guess that user's password without delay; those at the
/// same place still can. Keeps no password: only a keyed hash (HMAC-SHA-256) under a key of this process, of
/// the thousand credentials last verified. Thread-safe.
class CredentialCache {
  public:
    explicit CredentialCache(std::chrono::seconds rememberFor);

    /// Nothing when they were never right, or too long ago.
    std::optional<User> find(const Credentials& credentials, const std::string& place);
    /// Whether they were right once.
    bool knows(const Credentials& credentials, const std::string& place);
    /// How often everything was forgotten. To be asked before a check whose outcome is remembered: what was
    /// found right by users that have been read anew since is not remembered.
    std::uint64_t generation();
    void remember(const Credentials& credentials, const std::string& place, const User& user,
                  std::uint64_t generation);
    void forget(const Credentials& credentials, const std::string& place);
    /// Forgets everything and takes a new key.
    void clear();

  private:
    using Clock = std::chrono::steady_clock;
    using Digest = std::array<unsigned char, 32>;
    struct Entry {
        User user;
        Clock::time_point expires;
    };

    Digest digestOf(const Credentials& credentials, const std::string& place) const QUENX_REQUIRES(m_mutex);

    const std::chrono::seconds m_rememberFor;
    utils::Mutex m_mutex;
    std::uint64_t m_generation QUENX_GUARDED_BY(m_mutex) = 0;
    Digest m_key QUENX_GUARDED_BY(m_mutex);
    std::map<Digest, Entry> m_entries QUENX_GUARDED_BY(m_mutex);
};

}  // namespace host
