// SPDX-License-Identifier: Apache-2.0
#include "Cli/Credentials.h"

#include <unistd.h>

#include <cstdlib>
#include <iostream>

#include "Cli/Failure.h"
#include "Utils/Os/Linux/EchoOff.h"

namespace cli {

namespace {

/// The line that the user answers with. Throws Failure with these texts where nobody can answer.
std::string ask(const std::string& prompt, const std::string& missing, const std::string& advice) {
    std::string line;
    if (isatty(STDIN_FILENO) == 1) {
        std::cerr << prompt << std::flush;
        if (std::getline(std::cin, line) && !line.empty()) return line;
        std::cerr << '\n';
    }
    throw Failure(ExitStatus::WrongUse, missing, advice);
}

}  // namespace

std::string userName() {
    const char* given = std::getenv("QUENXCTL_USER");
    if (given != nullptr && *given != '\0') return given;
    return ask("User: ", "No user name was given.",
               "Name the user with --user or the environment variable QUENXCTL_USER.");
}

std::string passwordOf(const std::string& user) {
    const char* given = std::getenv("QUENXCTL_PASSWORD");
    if (given != nullptr) return given;
    const os::EchoOff silence;
    std::string password =
        ask("Password for " + user + ": ", "No password was given for " + user + ".",
            "Put it into the environment variable QUENXCTL_PASSWORD, or type it on a terminal.");
    std::cerr << '\n';
    return password;
}

}  // namespace cli
