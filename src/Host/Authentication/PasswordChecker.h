// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>
#include <vector>

namespace host {

/// A name and a password, as the client sent them.
struct Credentials {
    std::string user;
    std::string password;
};

/// Somebody whose password was right.
struct User {
    std::string name;
    bool isAdministrator = false;
    bool mayRead = false;  ///< false: known, but not admitted
};

/// Knows whose password is right. Takes its time: tens of milliseconds and more. Thread-safe.
class PasswordChecker {
  public:
    PasswordChecker() = default;
    PasswordChecker(const PasswordChecker&) = delete;
    PasswordChecker& operator=(const PasswordChecker&) = delete;
    virtual ~PasswordChecker() = default;

    /// Nothing for an unknown user as for a wrong password.
    virtual std::optional<User> check(const Credentials& credentials, const std::string& address) = 0;

    /// Reads again what it keeps. Throws std::runtime_error, and then keeps what it had.
    virtual void reload() {}
};

/// Asks PAM, service "quenx-cimd". Administrators are root and the members of the group "quenx-admin".
class PamChecker : public PasswordChecker {
  public:
    /// Who else may read: user names, "@group", or "*" for everybody.
    explicit PamChecker(std::vector<std::string> readers) : m_readers(std::move(readers)) {}

    std::optional<User> check(const Credentials& credentials, const std::string& address) override;

  private:
    const std::vector<std::string> m_readers;
};

/// What a user of the system may do. An unknown one may do nothing.
User systemUser(const std::string& name, const std::vector<std::string>& readers);

}  // namespace host
