// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>

#include "Host/Settings.h"

namespace host {

/// What `quenx-cimd passwd` is to do.
struct PasswdRequest {
    std::string user;
    std::string usersFile;
    bool isReader = false;
    bool isRemoval = false;
    AuthenticationSettings configured;  ///< what a daemon with the same configuration asks
};

/// What the command line asks for.
struct CommandLine {
    Settings settings;
    bool checkOnly = false;
    std::optional<PasswdRequest> passwd;
    std::optional<int> exitStatus;  ///< after --help, or a mistake: end with this
};

/// Reads the options over the configuration file over the defaults. Prints help and mistakes itself.
CommandLine readCommandLine(int argc, const char* const* argv);

/// `quenx-cimd --check-config`: looks at everything that a start would need, without starting. Says each
/// thing that is wrong; returns the exit status, 0 or 2.
int checkConfiguration(const Settings& settings);

/// `quenx-cimd passwd`: asks for a password on the terminal, or reads a line where there is none, and writes
/// the users file. Returns the exit status, having said what went wrong.
int runPasswd(const PasswdRequest& request);

}  // namespace host
