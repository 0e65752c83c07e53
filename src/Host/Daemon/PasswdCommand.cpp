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
    if (!std::getline(std::cin, line)) throw std::runtime_error("no password was given");
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
    if (ask("Again: ") != password) throw std::runtime_error("the two passwords differ");
    return password;
}

void change(const PasswdRequest& request) {
    if (!isUserName(request.user)) {
        throw std::runtime_error(
            "a user name has printable ASCII characters only, 64 at the most, no blank, colon or leading #");
    }
    UserEntries users;
    if (::access(request.usersFile.c_str(), F_OK) == 0) users = readUsersFile(request.usersFile);
    if (request.remove) {
        if (users.erase(request.user) == 0) {
            throw std::runtime_error(request.usersFile + " has no user " + request.user);
        }
    } else {
        const std::string password = newPassword();
        if (password.empty()) throw std::runtime_error("an empty password lets everybody in");
        users[request.user] = {hashPassword(password), !request.isReader};
    }
    writeUsersFile(request.usersFile, users);
    if (request.remove) {
        std::cout << "Took " << request.user << " out of " << request.usersFile << ".\n";
    } else {
        std::cout << (request.isReader ? "Reader " : "Administrator ") << request.user << " is set in "
                  << request.usersFile << ".\n";
    }
}

void adviseAfter(const PasswdRequest& request) {
    std::cout << "A running quenx-cimd takes this up by `systemctl reload quenx-cimd` (SIGHUP).\n";
    if (!request.isAsked)
        std::cout
            << "Its configuration has it ask PAM instead; set method = \"users\" in [auth], or start it with "
               "--auth-method users.\n";
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
