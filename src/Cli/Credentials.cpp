#include "Cli/Credentials.h"

#include <unistd.h>

#include <cstdlib>
#include <iostream>

#include "Cli/Failure.h"
#include "Utils/Os/Linux/EchoOff.h"

namespace cli {

std::string passwordOf(const std::string& user) {
    const char* given = std::getenv("QUENXCTL_PASSWORD");
    if (given != nullptr) return given;
    if (isatty(STDIN_FILENO) != 1) {
        throw Failure(ExitStatus::WrongUse,
                      "There is no password for " + user + ", and no terminal to ask on.",
                      "Put it into the environment variable QUENXCTL_PASSWORD.");
    }
    std::string password;
    {
        const os::EchoOff silence;
        std::cerr << "Password for " << user << ": " << std::flush;
        std::getline(std::cin, password);
    }
    std::cerr << '\n';
    return password;
}

}  // namespace cli
