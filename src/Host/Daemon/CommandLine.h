// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>

#include "Host/Settings.h"

namespace host {

/// What `quenx-cimd passwd` is to do.
struct PasswdRequest {
    std::string usersFile;
    std::string user;
    bool isReader = false;
    bool remove = false;
    bool isAsked = false;  ///< whether the configuration has the daemon ask a users file
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

}  // namespace host
