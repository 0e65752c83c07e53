#pragma once

#include <optional>
#include <string>

#include "Host/Authentication/Identity.h"

namespace host {

/// Knows whose password is right. Takes its time: tens of milliseconds and more. Thread-safe.
class PasswordChecker {
  public:
    PasswordChecker() = default;
    PasswordChecker(const PasswordChecker&) = delete;
    PasswordChecker& operator=(const PasswordChecker&) = delete;
    virtual ~PasswordChecker() = default;

    /// Nothing for an unknown user as for a wrong password.
    virtual std::optional<Identity> check(const Credentials& credentials, const std::string& address) = 0;

    /// Reads again what it keeps. Throws std::runtime_error, and then keeps what it had.
    virtual void reload() {}
};

}  // namespace host
