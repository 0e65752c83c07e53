// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <chrono>
#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <semaphore>
#include <stop_token>
#include <string>

#include "Host/Authentication/LoginQueue.h"
#include "Host/Authentication/PasswordChecker.h"
#include "Host/Operations/AuditTrail.h"

namespace host {

/// How many may do something at a time; the others wait for their turn.
using Slots = std::counting_semaphore<>;

/// One of the slots, held for the scope; false when none came free in time, or the wait was stopped.
class HeldSlot {
  public:
    HeldSlot(Slots& slots, std::chrono::milliseconds patience, const std::stop_token& stop);
    ~HeldSlot() {
        if (m_isHeld) m_slots.release();
    }
    HeldSlot(const HeldSlot&) = delete;
    HeldSlot& operator=(const HeldSlot&) = delete;

    explicit operator bool() const { return m_isHeld; }

  private:
    Slots& m_slots;
    bool m_isHeld = false;
};

/// Remembers for a short while whose credentials were right, since checking a password costs tens of
/// milliseconds and clients send it with every request; and for good which ones were, so that those need not
/// wait with the ones that somebody guesses. Both hold for the place (the address) that they came from only,
/// or one user's login would let everybody everywhere guess that user's password without delay; those at the
/// same place still can. Keeps no password: only a keyed hash (HMAC-SHA-256) under a key of this process, of
/// the thousand credentials last verified. Thread-safe.
class CredentialCache {
  public:
    explicit CredentialCache(std::chrono::seconds rememberFor);

    /// Somebody whose credentials were right once.
    struct Known {
        User user;
        bool isFresh;  ///< a short while ago, so they need not be checked again
    };

    /// Nothing when they were never right.
    std::optional<Known> find(const Credentials& credentials, const std::string& place);
    /// How often everything expired. To be asked before a check whose outcome is remembered: what was found
    /// right by users that have been read anew since is not remembered.
    std::uint64_t generation();
    void remember(const Credentials& credentials, const std::string& place, const User& user,
                  std::uint64_t generation);
    void forget(const Credentials& credentials, const std::string& place);
    /// The users were read anew: has all credentials checked once more, which does not make them unknown.
    void expire();

  private:
    using Clock = std::chrono::steady_clock;
    using Digest = std::array<unsigned char, 32>;
    struct Entry {
        User user;
        Clock::time_point expires;
    };

    Digest digestOf(const Credentials& credentials, const std::string& place) const;

    const std::chrono::seconds m_rememberFor;
    utils::Mutex m_mutex;
    std::uint64_t m_generation QUENX_GUARDED_BY(m_mutex){};
    Digest m_key{};
    std::map<Digest, Entry> m_entries QUENX_GUARDED_BY(m_mutex);
};

enum class AuthenticationOutcome {
    Accepted,
    Missing,    ///< no credentials, or none that can be read
    Wrong,      ///< unknown user or wrong password
    Forbidden,  ///< known, but not admitted
    Busy        ///< not looked at: too many attempts
};

struct AuthenticationResult {
    AuthenticationOutcome outcome = AuthenticationOutcome::Missing;
    User user;
};

/// Who sends a request. Credentials verified a short while ago are accepted at once; others are checked, a
/// few at a time and in the order of LoginQueue. The wait, and that for the answer to wrong ones, is the
/// calling connection's own and takes nobody else's place. Thread-safe.
class Authentication {
  public:
    /// @param trail  of refusals; one for all that refuse
    Authentication(std::unique_ptr<PasswordChecker> checker, std::chrono::seconds rememberFor,
                   const LoginPace& pace = {},
                   std::shared_ptr<AuditTrail> trail = std::make_shared<AuditTrail>());

    /// @param ended  the client does not wait any more, so nothing is waited for
    AuthenticationResult authenticate(const std::optional<std::string>& header, const std::string& address,
                                      const std::stop_token& ended = {});

    /// Reads the users again, and checks credentials verified before once more. Throws std::runtime_error
    /// when the users cannot be read; all is then as before.
    void reload();

  private:
    using Clock = std::chrono::steady_clock;
    struct Checked {
        std::optional<User> user;
        Clock::time_point mayBeTold;  ///< that it is wrong
    };

    std::optional<Checked> check(const Credentials& credentials, const std::string& address,
                                 const std::stop_token& ended);

    std::unique_ptr<PasswordChecker> m_checker;
    CredentialCache m_cache;
    const std::shared_ptr<AuditTrail> m_trail;
    LoginQueue m_queue;
};

}  // namespace host
