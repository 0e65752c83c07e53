// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <ostream>
#include <string>

#include "Cli/Connection/Connection.h"
#include "Cli/Display/Messages.h"
#include "Cli/Display/Progress.h"
#include "Cli/Registration/Registration.h"
#include "Cli/Update/Candidate.h"
#include "Cli/Update/Jobs.h"

/// The verbs of the program. Each prints its result, as text or as one JSON document; what keeps it from its
/// work is thrown as CommandError or core::CimError.
namespace cli {

/// What every verb works with.
struct Context {
    const Connection& connection;
    std::ostream& out;    ///< results
    std::ostream& error;  ///< what went wrong
    bool json = false;    ///< results, failures included, as one JSON document
    ProgressDisplay& progress;
    Following following;
    /// Asks the user; tests put their own in.
    std::function<decltype(askOnTerminal)> ask = askOnTerminal;
};

/// Which records of the history are wanted, as the user says it.
struct HistoryOptions {
    std::string adapter;
    bool failedOnly = false;
    bool asLines = false;
    std::string since;
    std::string after;
};

/// Where indications are taken, and how many.
struct ListenOptions {
    std::string address;      ///< of this machine; empty for loopback
    std::uint16_t port = 0;   ///< 0 takes a free one
    std::uint32_t count = 0;  ///< 0 for no end
};

/// What a word is completed to.
enum class CandidateKind { None, Adapters, Identities, Jobs };
struct CandidateOptions {
    CandidateKind kind = CandidateKind::None;
    std::string prefix;  ///< only what begins so
};

/// The options and arguments of all verbs; each verb looks at its own.
struct VerbOptions {
    UpdateOptions update;            ///< install, check; of activate and rollback the target
    ManyOptions many;                ///< install, on several adapters
    std::string job;                 ///< delete: its id, the number at the end of that, or its path
    std::string className;           ///< instances
    std::string path;                ///< associators, references
    core::AssociationFilter filter;  ///< associators, references
    bool namesOnly = false;          ///< instances, associators, references
    bool pendingOnly = false;        ///< adapters
    bool mayDisrupt = false;         ///< activate
    std::string adapter;             ///< release
    RegistrationOptions registration;
    HistoryOptions history;   ///< history
    ListenOptions listening;  ///< listen
    CandidateOptions candidates;
};

using Verb = ExitStatus (*)(Context& context, const VerbOptions& options);

ExitStatus showAdapters(Context& context, const VerbOptions& options);
/// The adapters, and what can be done with them next: for who has named no verb.
ExitStatus showOverview(Context& context, const VerbOptions& options);
/// One a line, with a tab and a description. Not in the help: for the scripts of shells.
ExitStatus showCandidates(Context& context, const VerbOptions& options);
ExitStatus showIdentities(Context& context, const VerbOptions& options);

ExitStatus install(Context& context, const VerbOptions& options);
/// Installs the image that the adapter had before, by the history. Only in process.
ExitStatus rollback(Context& context, const VerbOptions& options);
/// On a server other than quenx-cimd only an image that the inventory offers, with neither types nor force.
ExitStatus check(Context& context, const VerbOptions& options);
/// Only in process.
ExitStatus activate(Context& context, const VerbOptions& options);

/// Both need a server: jobs of this program's own end with it.
ExitStatus showJobs(Context& context, const VerbOptions& options);
ExitStatus deleteJob(Context& context, const VerbOptions& options);

/// What the adapters were asked to install.
ExitStatus showHistory(Context& context, const VerbOptions& options);
/// Who holds which adapter, and how its last update ended, as far as the server tells; in process, who writes
/// to it.
ExitStatus showStatus(Context& context, const VerbOptions& options);
/// Needs a server that is quenx-cimd.
ExitStatus releaseAdapter(Context& context, const VerbOptions& options);

/// Prints what happens to jobs, as the server tells it. Needs a server, and its interop namespace.
ExitStatus listen(Context& context, const VerbOptions& options);

ExitStatus showInstances(Context& context, const VerbOptions& options);
ExitStatus showAssociators(Context& context, const VerbOptions& options);
ExitStatus showReferences(Context& context, const VerbOptions& options);
/// The classes as MOF (DSP0004 annex A) in an order that a compiler takes: the declarations of the qualifiers
/// first, then each class after its superclass and after the classes that it refers to, as far as those do
/// not refer to each other.
ExitStatus showMof(Context& context, const VerbOptions& options);

/// What another object manager has to be told to load the providers: files, or their texts one below the
/// other, and on the stream of errors what to do with them. Only in process.
ExitStatus showRegistration(Context& context, const VerbOptions& options);

/// What to do about a class that is not served.
inline constexpr const char* kAskMof = "\"quenxctl mof\" prints the classes that are served.";

}  // namespace cli
