// SPDX-License-Identifier: Apache-2.0
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
    std::optional<ServerUrl> serverUrl;  ///< nothing: the providers run in this process
    ServerSettings server;
    bool json = false;
    bool startsUpdate = false;  ///< the verb may start one, so must not be ended half-way
    std::function<ExitStatus(Context&)> verb;
};

/// Reads the command line. Nothing when it only asked for help or the version, which has been printed then.
/// Throws Failure for wrong use.
std::optional<Arguments> readArguments(int argc, char** argv);

/// Whether errors are to be JSON: known also of a command line that cannot be read.
bool asksForJson(int argc, char** argv);

}  // namespace cli
