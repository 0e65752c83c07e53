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

#include "Host/Authentication/PasswordChecker.h"

namespace host {

/// How many may do something at a time; the others wait for their turn.
using Slots = std::counting_semaphore<>;

/// One of the slots, held for the scope; false when none came free in time.
class HeldSlot {
  public:
    HeldSlot(Slots& slots, std::chrono::milliseconds patience)
        : m_slots(slots), m_isHeld(slots.try_acquire_for(patience)) {}
    ~HeldSlot() {
        if (m_isHeld) m_slots.release();
    }
    HeldSlot(const HeldSlot&) = delete;
    HeldSlot& operator=(const HeldSlot&) = delete;

    explicit operator bool() const { return m_isHeld; }

  private:
    Slots& m_slots;
    const bool m_isHeld;
};

/// Makes an address that has sent wrong passwords wait before the next one is looked at: a tenth of a second
/// after the first failure, twice that after each further one, five seconds at the most. Its attempts take
/// turns; one that would wait for more than ten seconds is not waited for. Addresses are forgotten a quarter
/// of an hour after their last failure; those of one IPv6 network of 64 bits count as one. Thread-safe.
class FailureDelays {
  public:
    using Clock = std::chrono::steady_clock;

    /// When an attempt from the address may be looked at; nothing when it has to wait too long.
    std::optional<Clock::time_point> admit(const std::string& address, Clock::time_point now = Clock::now());
    void failed(const std::string& address, Clock::time_point now = Clock::now());
    void succeeded(const std::string& address);

    /// What counts as one place: an IPv4 address, or the network of an IPv6 one.
    static std::string keyOf(const std::string& address);

  private:
    struct Record {
        unsigned int failures = 0;
        Clock::time_point next;  ///< when the next attempt may be looked at
        Clock::time_point last;  ///< the last failure
    };

    static Clock::duration delayAfter(unsigned int failures);

    utils::Mutex m_mutex;
    std::map<std::string, Record> m_records QUENX_GUARDED_BY(m_mutex);
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
/// few at a time, and attempts from an address that has sent wrong ones wait, but for credentials that were
/// right before. The wait is the calling connection's own and takes nobody else's place. Thread-safe.
class Authentication {
  public:
    Authentication(std::unique_ptr<PasswordChecker> checker, std::chrono::seconds rememberFor);

    AuthenticationResult authenticate(const std::optional<std::string>& header, const std::string& address);

    /// Reads the users again and forgets verified credentials. Throws std::runtime_error when that fails; all
    /// is then as before.
    void reload();

    /// Releases everybody who waits; if somebody would wait from now on, they are refused.
    void stop();

  private:
    bool waitForTurn(const std::string& address);
    std::optional<User> checkNow(const Credentials& credentials, const std::string& address);

    std::unique_ptr<PasswordChecker> m_checker;
    CredentialCache m_cache;
    FailureDelays m_delays;
    Slots m_checks;
    std::stop_source m_stop;
};

}  // namespace host
