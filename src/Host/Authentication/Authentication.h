// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <optional>
#include <stop_token>
#include <string>

#include "Host/Authentication/CredentialCache.h"
#include "Host/Authentication/FailureDelays.h"
#include "Host/Authentication/PasswordChecker.h"
#include "Host/Slots.h"

namespace host {

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

    /// Lets go of everybody who waits, and refuses whoever would.
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
