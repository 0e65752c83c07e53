// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <map>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "Utils/Os/Linux/Mutex.h"

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

/// A password that could not be checked, which says nothing of whether it is right.
class CheckFailed : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// Knows whose password is right. Takes its time: tens of milliseconds and more. Thread-safe.
class PasswordChecker {
  public:
    PasswordChecker() = default;
    PasswordChecker(const PasswordChecker&) = delete;
    PasswordChecker& operator=(const PasswordChecker&) = delete;
    virtual ~PasswordChecker() = default;

    /// Nothing for an unknown user as for a wrong password. Throws CheckFailed.
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

/// A user as the users file has it. One per line: `name:hash:role`, the hash as of crypt(3), the role "admin"
/// or "reader"; empty lines and lines that begin with # are passed over.
struct UserEntry {
    std::string hash;
    bool isAdministrator = false;
};

using UserEntries = std::map<std::string, UserEntry>;

/// Reads the file. Throws std::runtime_error that says what is wrong: it cannot be read, it is open to group
/// or others, or a line (by its number) has not the form above.
UserEntries readUsersFile(const std::string& path);

/// Writes the file anew, mode 0600, in one step; makes its directory when it is missing. Throws
/// std::runtime_error.
void writeUsersFile(const std::string& path, const UserEntries& users);

/// Whether the name can stand in the file.
bool isUserName(const std::string& name);

/// A fresh hash of the password, by the strongest method of crypt(3). Throws std::runtime_error, also for one
/// with control characters.
std::string hashPassword(const std::string& password);

/// Checks passwords against a users file. An unknown user takes as long as a wrong password.
class UsersFile : public PasswordChecker {
  public:
    explicit UsersFile(std::string path);

    std::optional<User> check(const Credentials& credentials, const std::string& address) override;
    void reload() override;

  private:
    const std::string m_path;
    utils::Mutex m_mutex;
    UserEntries m_users QUENX_GUARDED_BY(m_mutex);
    std::string m_decoy QUENX_GUARDED_BY(m_mutex);  ///< a hash that no password has
};

}  // namespace host
