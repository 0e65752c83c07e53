#pragma once

#include <functional>
#include <optional>
#include <string>

#include "Cli/HttpClient.h"
#include "Cli/LocalManagement.h"
#include "Cli/Verbs.h"

namespace cli {

/// What the command line asked for.
struct Arguments {
    LocalSettings local;
    ServerSettings server;  ///< with a URL: that server, and not this process
    bool json = false;
    bool startsUpdate = false;  ///< the verb may start one, so must not be ended half-way
    std::function<ExitStatus(Context&)> verb;
};

/// Reads the command line. Nothing when it is done with already (help, version, wrong use): then `status` is
/// set and what there was to say has been printed.
std::optional<Arguments> readArguments(int argc, char** argv, ExitStatus& status);

}  // namespace cli
