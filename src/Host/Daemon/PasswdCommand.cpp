// SPDX-License-Identifier: Apache-2.0
#include <unistd.h>

#include <filesystem>
#include <iostream>
#include <stdexcept>

#include "Host/Authentication/PasswordChecker.h"
#include "Host/Daemon/CommandLine.h"
#include "Utils/Os/Linux/EchoOff.h"
#include "Utils/Os/Linux/FileLock.h"

namespace host {

namespace {

std::string readLine() {
    std::string line;
    if (!std::getline(std::cin, line))
        throw std::runtime_error("No password was given. Type one, or write it to standard input.");
    return line;
}

std::string ask(const char* prompt) {
    const os::EchoOff hidden;  // the terminal is put right again also when Ctrl-C ends the program
    std::cerr << prompt << std::flush;
    std::string line = readLine();
    std::cerr << '\n';
    return line;
}

std::string newPassword() {
    // A script writes it once; only people mistype.
    if (::isatty(STDIN_FILENO) == 0) return readLine();
    // Asked twice, since nobody sees what he types.
    std::string password = ask("New password: ");
    if (ask("Again: ") != password)
        throw std::runtime_error("The passwords do not match, so nothing was changed. Try again.");
    return password;
}

/// None where there is no file yet.
UserEntries usersOf(const std::string& file) {
    return ::access(file.c_str(), F_OK) == 0 ? readUsersFile(file) : UserEntries();
}

void removeUser(const PasswdRequest& request, UserEntries& users) {
    if (users.erase(request.user) == 0) {
        throw std::runtime_error("There is no user \"" + request.user + "\" in " + request.usersFile +
                                 ". Check the name, and that --users names the right file.");
    }
}

UserEntry newEntry(const PasswdRequest& request) {
    const std::string password = newPassword();
    if (password.empty())
        throw std::runtime_error(
            "The password is empty, so nothing was changed. Type at least one character.");
    return {hashPassword(password), !request.isReader};
}

/// Others may change the file at the same time, so it is read and written under a lock. Returns whether the
/// user is new.
bool merge(const PasswdRequest& request, const UserEntry& entry) {
    std::error_code error;  // the lock says it better
    std::filesystem::create_directories(std::filesystem::path(request.usersFile).parent_path(), error);
    const os::FileLock lock(request.usersFile + ".lock", std::chrono::seconds(10));
    if (!lock.isHeld())
        throw std::runtime_error(lock.holder() + " is changing " + request.usersFile + ". Try again later.");
    UserEntries users = usersOf(request.usersFile);
    const bool isNew = !users.contains(request.user);
    if (request.isRemoval)
        removeUser(request, users);
    else
        users[request.user] = entry;
    writeUsersFile(request.usersFile, users);
    return isNew;
}

/// Says what it did.
void change(const PasswdRequest& request) {
    if (!isUserName(request.user)) {
        throw std::runtime_error("\"" + request.user +
                                 "\" cannot be a user name. Use 1 to 64 printable ASCII characters, without "
                                 "blanks or colons, and do not start with #.");
    }
    // The new file would take the link's place, and the one behind it keep its users.
    if (std::filesystem::is_symlink(request.usersFile))
        throw std::runtime_error(request.usersFile +
                                 " is a symbolic link. Name the file itself with --users.");
    // Read before the password is asked for, so that a broken file does not cost a password typed twice.
    usersOf(request.usersFile);
    // And asked for before the lock, which nobody may hold for as long as a person thinks.
    const UserEntry entry = request.isRemoval ? UserEntry() : newEntry(request);
    const bool isNew = merge(request, entry);
    const std::string role = request.isReader ? "reader" : "administrator";
    std::cout << (request.isRemoval ? "Removed user" : (isNew ? "Added " : "Changed ") + role) << " \""
              << request.user << "\" "
              << (request.isRemoval ? "from"
                  : isNew           ? "to"
                                    : "in")
              << " " << request.usersFile << ".\n";
}

/// Says how a daemon of this configuration comes to ask the file.
void adviseAfter(const PasswdRequest& request) {
    const auto normal = [](const std::string& path) {
        return std::filesystem::absolute(path).lexically_normal().string();
    };
    const AuthenticationSettings& configured = request.configured;
    const std::string file = normal(request.usersFile);
    std::cout << "Reload a running quenx-cimd with: systemctl reload quenx-cimd (or send it SIGHUP)\n";
    if (configured.method == "users" && file == normal(configured.usersFile)) return;
    std::cout << "This file is not used yet: auth.method is \"" << configured.method
              << "\" and auth.users_file is \"" << configured.usersFile
              << "\". Set method = \"users\" and users_file = \"" << file
              << "\" in [auth], or start quenx-cimd with --auth-method users --auth-users-file " << file
              << ".\n";
}

}  // namespace

int runPasswd(const PasswdRequest& request) {
    try {
        change(request);
        adviseAfter(request);
        return 0;
    } catch (const std::runtime_error& error) {
        std::cerr << "quenx-cimd: " << error.what() << '\n';
        return 1;
    }
}

}  // namespace host
