// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Cli/Update/Targets.h"
#include "Cli/Verbs/Outcome.h"

namespace cli {

/// What became of the adapters of an install on many.
struct ManyResults {
    std::vector<Outcome> outcomes;
    std::vector<SameCard> sameCard;     ///< with what they carry in the end
    std::vector<std::string> notTried;  ///< adapters
    std::vector<std::string> unused;    ///< images
    bool isInterrupted = false;

    /// That of the worst ending: interrupted, unknown, failed or refused, done, already current.
    ExitStatus status() const;
};

/// {"exitStatus", "results", "sameCard", "notTried", "unused"}
void printAsJson(std::ostream& out, const ManyResults& results);

/// A table of all adapters, and what is left to do where that is not plain from it.
void printSummary(std::ostream& out, const ManyResults& results);

/// Installing on many adapters of one machine, one after the other, as its service wants it.
///
/// Each adapter ends as one of Ending: what cannot be told to be on it already, or not, is "unknown" and
/// written with --force only. A failure ends the run unless it is to keep going. Adapters that were not
/// tried, and functions of a card that another one stood for, are listed apart.
///
/// The exit status is that of the worst ending: interrupted, unknown, failed or refused, done, and already
/// current when nothing had to be done.
///
/// Only in one case is the user asked anything: on a terminal, before adapters are written to that are
/// hardware, and only when neither --yes nor --backend devlink says that they are meant.
///
/// @param options  with VerbOptions::many
/// @throws CommandError  where nothing has begun: there is no adapter or no image, or nobody has confirmed it
ExitStatus installMany(Context& context, const VerbOptions& options);

}  // namespace cli
