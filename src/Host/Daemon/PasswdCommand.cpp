// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/PasswdCommand.h"

#include <unistd.h>

#include <iostream>
#include <stdexcept>

#include "Host/Authentication/UsersFile.h"
#include "Utils/Os/Linux/EchoOff.h"

namespace host {

namespace {

std::string readLine() {
    std::string line;
    if (!std::getline(std::cin, line))
        throw std::runtime_error("No password was given. Type one, or write it to standard input.");
    return line;
}

std::string ask(const char* prompt) {
    const os::EchoOff hidden;
    std::cerr << prompt << std::flush;
    std::string line = readLine();
    std::cerr << '\n';
    return line;
}

std::string newPassword() {
    if (::isatty(STDIN_FILENO) == 0) return readLine();
    std::string password = ask("New password: ");
    if (ask("Again: ") != password)
        throw std::runtime_error("The passwords do not match, so nothing was changed. Try again.");
    return password;
}

/// Says what it did.
void change(const PasswdRequest& request) {
    if (!isUserName(request.user)) {
        throw std::runtime_error("\"" + request.user +
                                 "\" cannot be a user name. Use 1 to 64 printable ASCII characters, without "
                                 "blanks or colons, and do not start with #.");
    }
    UserEntries users;
    if (::access(request.usersFile.c_str(), F_OK) == 0) users = readUsersFile(request.usersFile);
    std::string done = "Removed user";
    std::string where = "from";
    if (request.remove) {
        if (users.erase(request.user) == 0) {
            throw std::runtime_error("There is no user \"" + request.user + "\" in " + request.usersFile +
                                     ". Check the name, and that --users names the right file.");
        }
    } else {
        const std::string password = newPassword();
        if (password.empty())
            throw std::runtime_error(
                "The password is empty, so nothing was changed. Type at least one character.");
        const bool isNew = !users.contains(request.user);
        where = isNew ? "to" : "in";
        done = std::string(isNew ? "Added " : "Changed ") + (request.isReader ? "reader" : "administrator");
        users[request.user] = {hashPassword(password), !request.isReader};
    }
    writeUsersFile(request.usersFile, users);
    std::cout << done << " \"" << request.user << "\" " << where << " " << request.usersFile << ".\n";
}

void adviseAfter(const PasswdRequest& request) {
    std::cout << "Reload a running quenx-cimd with: systemctl reload quenx-cimd (or send it SIGHUP)\n";
    if (!request.isAsked) {
        std::cout
            << "auth.method is \"pam\", so this file is not used yet. Set method = \"users\" in [auth], "
               "or start quenx-cimd with --auth-method users.\n";
    }
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
