// SPDX-License-Identifier: Apache-2.0
#include <crypt.h>
#include <fcntl.h>
#include <gnutls/crypto.h>
#include <gnutls/gnutls.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <span>
#include <sstream>
#include <stdexcept>
#include <system_error>

#include "Host/Authentication/PasswordChecker.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace host {

namespace {

[[noreturn]] void fail(const std::string& path, const std::string& why) {
    throw std::runtime_error(path + ": " + why);
}

[[noreturn]] void failToWrite(const std::string& path, int error) {
    const char* advice = ::geteuid() == 0 ? ". Mend that" : ". Run as root";
    throw std::runtime_error("Cannot write " + path + ": " + std::strerror(error) + advice +
                             ", or name another file with --users.");
}

/// Equal without telling by the time it takes where the difference is.
bool sameHash(std::string_view left, std::string_view right) {
    return left.size() == right.size() && ::gnutls_memcmp(left.data(), right.data(), left.size()) == 0;
}

std::string crypted(const std::string& password, const std::string& setting) {
    const auto data = std::make_unique<crypt_data>();  // 32 KiB: too much for the stack of a thread
    const char* hash = ::crypt_r(password.c_str(), setting.c_str(), data.get());
    const bool isFailure = hash == nullptr || *hash == '*';
    // Some methods take megabytes, and say EINVAL as well as ENOMEM where there are none. The right password
    // would be called wrong; only one that is too long is.
    if (isFailure && errno != ERANGE)
        throw CheckFailed(std::string("cannot hash it, most likely for want of memory: ") +
                          std::strerror(errno));
    // A failure token begins with an asterisk and equals no hash.
    return isFailure ? "*" : hash;
}

UserEntry readEntry(const std::string& path, std::size_t number, const std::string& line, std::string& name) {
    const std::string where = path + ":" + std::to_string(number);
    std::istringstream fields(line);
    UserEntry entry;
    std::string role;
    std::getline(fields, name, ':');
    std::getline(fields, entry.hash, ':');
    std::getline(fields, role);
    if (!isUserName(name)) fail(where, "expected name:hash:role, but there is no valid name.");
    if (!entry.hash.starts_with('$'))
        fail(where, "there is no password hash. Set a password with: quenx-cimd passwd " + name);
    if (role != "admin" && role != "reader") fail(where, "the role must be admin or reader.");
    entry.isAdministrator = role == "admin";
    return entry;
}

/// Whoever can write the file can make himself an administrator, and whoever can read it can guess passwords
/// without being slowed down.
void checkMode(const std::string& path) {
    struct stat status {};
    if (::stat(path.c_str(), &status) != 0) {
        const int error = errno;
        throw std::runtime_error("Cannot read the users file " + path + ": " + std::strerror(error) +
                                 (error == ENOENT
                                      ? ". Add a user with: quenx-cimd passwd --users " + path + " NAME"
                                      : ". Check auth.users_file."));
    }
    if (!S_ISREG(status.st_mode)) fail(path, "not a regular file. Check auth.users_file.");
    if ((status.st_mode & 077U) != 0) fail(path, "others may read or change it. Run: chmod 600 " + path);
    if (status.st_uid != 0 && status.st_uid != ::geteuid()) {
        fail(path, "it belongs to neither root nor the user that runs quenx-cimd. Run: chown root " + path);
    }
}

[[noreturn]] void failForHash(const std::string& path, const std::string& user) {
    fail(path, "this system cannot check the password hash of " + user +
                   ". Set a password with: quenx-cimd passwd --users " + path + " " + user);
}

/// What cannot be meant, and would keep out who should come in.
void requireUsable(const std::string& path, const UserEntries& users) {
    for (const auto& [name, entry] : users) {
        const int method = ::crypt_checksalt(entry.hash.c_str());
        if (method == CRYPT_SALT_INVALID || method == CRYPT_SALT_METHOD_DISABLED) failForHash(path, name);
    }
    if (!users.empty()) return;
    // One that the last user was deleted from still has its first line.
    std::string word;
    if (!(std::ifstream(path) >> word)) {
        fail(path,
             "it is empty, as a full disk may leave it. Restore it, or add a user with: quenx-cimd "
             "passwd --users " +
                 path + " NAME");
    }
    QUENX_ERROR("%s names no user: nobody can log in over the network", path.c_str());
}

}  // namespace

bool isUserName(const std::string& name) {
    return !name.empty() && name.size() <= 64 && name.find(':') == std::string::npos && name[0] != '#' &&
           std::all_of(name.begin(), name.end(), [](unsigned char c) { return c > ' ' && c != 0x7F; });
}

UserEntries readUsersFile(const std::string& path) {
    checkMode(path);
    std::ifstream file(path);
    if (!file) fail(path, "cannot be read. Run as root, or check auth.users_file.");
    UserEntries users;
    std::string line;
    for (std::size_t number = 1; std::getline(file, line); ++number) {
        if (line.ends_with('\r')) line.pop_back();  // of an editor elsewhere
        if (line.empty() || line[0] == '#') continue;
        std::string name;
        UserEntry entry = readEntry(path, number, line, name);
        if (!users.emplace(name, std::move(entry)).second) {
            fail(path + ":" + std::to_string(number),
                 "user \"" + name + "\" is listed twice. Remove one of the lines.");
        }
    }
    return users;
}

void writeUsersFile(const std::string& path, const UserEntries& users) {
    std::string text = "# name:hash:role, written by `quenx-cimd passwd`\n";
    for (const auto& [name, entry] : users) {
        text += name + ":" + entry.hash + ":" + (entry.isAdministrator ? "admin" : "reader") + "\n";
    }
    std::error_code error;
    std::filesystem::create_directories(std::filesystem::path(path).parent_path(), error);
    try {
        os::replaceFile(path, text, 0600);
    } catch (const std::system_error& failure) {
        failToWrite(path, failure.code().value());
    }
}

std::string hashPassword(const std::string& password) {
    // crypt(3) would take a NUL for the end, and a client can send no control character (RFC 7617 2).
    if (std::ranges::any_of(password, utils::isControl)) {
        throw std::runtime_error(
            "The password holds a control character, so nothing was changed. Give it as one line of UTF-8, "
            "with neither NUL bytes nor carriage returns.");
    }
    char setting[CRYPT_GENSALT_OUTPUT_SIZE];
    if (::crypt_gensalt_rn(nullptr, 0, nullptr, 0, setting, sizeof setting) == nullptr) {
        throw std::runtime_error(std::string("Cannot make a salt for the password: ") + std::strerror(errno));
    }
    std::string hash = crypted(password, setting);
    if (hash.starts_with('*')) throw std::runtime_error("Cannot hash the password. Use a shorter one.");
    return hash;
}

UsersFile::UsersFile(std::string path) : m_path(std::move(path)) {
    UsersFile::reload();
}

void UsersFile::reload() {
    UserEntries users = readUsersFile(m_path);
    requireUsable(m_path, users);
    // By the method of the file's own hashes, so that an unknown user costs what a known one does.
    std::string decoy = users.empty() ? hashPassword("") : users.begin()->second.hash;
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_users = std::move(users);
    m_decoy = std::move(decoy);
}

std::optional<User> UsersFile::check(const Credentials& credentials, const std::string&) {
    bool isKnown{};
    UserEntry entry;
    {
        const utils::Mutex::AutoLocker lock(m_mutex);
        const auto found = m_users.find(credentials.user);
        isKnown = found != m_users.end();
        entry = isKnown ? found->second : UserEntry{m_decoy};
    }
    // The hash of an unknown user is checked as well: a fast answer would tell who exists.
    const bool isRight = sameHash(crypted(credentials.password, entry.hash), entry.hash);
    if (!isKnown || !isRight) return std::nullopt;
    return User{credentials.user, entry.isAdministrator, true};
}

}  // namespace host
