// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>

#include "Cli/Verbs/Verbs.h"

namespace cli {

/// What the command line asked for.
struct Arguments {
    Verb verb = nullptr;
    VerbOptions options;
    bool json = false;
    bool quiet = false;
    ProviderSettings providers;
    ServerSettings server;  ///< without a URL: the providers run in this process

    /// The verb may start one, so must not be ended half-way.
    bool startsUpdate() const { return verb == install || verb == rollback || verb == activate; }
    /// Nobody has asked for the output of the verb, only for what it does.
    bool isSilent() const {
        return quiet && (startsUpdate() || verb == check || verb == deleteJob || verb == releaseAdapter);
    }
};

/// Reads the command line. Nothing when it only asked for help or the version, which has been printed then.
/// Throws CommandError for wrong use.
std::optional<Arguments> readArguments(int argc, char** argv);

/// Whether the flag is there, such as "--json": known also of a command line that cannot be read.
bool asksFor(std::string_view flag, int argc, char** argv);

}  // namespace cli
