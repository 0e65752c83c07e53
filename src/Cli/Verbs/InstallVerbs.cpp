// SPDX-License-Identifier: Apache-2.0
// Installing an image, and checking whether it could be installed.
#include <algorithm>

#include "Cli/Connection/ServerControl.h"
#include "Cli/Display/Output.h"
#include "Cli/Update/Card.h"
#include "Cli/Update/PastImages.h"
#include "Cli/Update/Service.h"
#include "Cli/Verbs/ManyResults.h"
#include "Cli/Verbs/Outcome.h"
#include "Framework/Requests/NotedCall.h"

namespace cli {

namespace {

ExitStatus print(Context& context, const Outcome& outcome) {
    if (context.json)
        printJson(context.out, outcome);
    else
        printText(context, outcome);
    return outcome.status;
}

/// If the adapter still has the old versions, the update did not complete, although the service says so.
bool isInPlace(const Candidate& candidate, const std::vector<Component>& after) {
    if (!candidate.comparison || after.empty()) return true;
    const std::vector<Component>& chosen = candidate.comparison->chosen;
    return std::ranges::all_of(chosen, [&](const Component& each) {
        const Component* found = findComponent(after, each.type);
        return found != nullptr && found->flashText() == each.versionText();
    });
}

/// For an update that completed, as the service says.
void judgeCompleted(Outcome& outcome, const Candidate& candidate) {
    const std::string& name = outcome.adapter;
    if (!isInPlace(candidate, outcome.after)) {
        outcome.reason = core::ReasonId::FlashWithoutEffect;
        outcome.end(Ending::Failed,
                    {"The update of " + name + " ended without an error, but " + name + " has " +
                         componentsText(outcome.after) + ", not what the image has.",
                     "Check the system log, then install again with --force."});
    } else {
        // Of what nothing was known the versions tell afterwards.
        const bool wasCurrent =
            candidate.isAlreadyCurrent() ||
            (!outcome.before.empty() && outcome.after == outcome.before && !outcome.isResetPending());
        outcome.end(ExitStatus::Done,
                    outcome.isResetPending() ? Ending::UpdatedResetPending : Ending::Updated,
                    outcome.label + (wasCurrent ? " was rewritten with the same version." : " was updated."));
        if (outcome.after.empty() && !outcome.before.empty())
            outcome.advice = "Its versions cannot be read now; \"quenxctl adapters\" shows them later.";
        else
            outcome.advice = resetAdvice(name, outcome.resetNeeded);
    }
}

/// What the adapter carries after the update, and what it waits for. Nothing where that cannot be read: how
/// the job ended is still worth reporting.
void readBack(core::CimOperations& operations, const Candidate& candidate, Outcome& outcome) try {
    outcome.after.clear();
    outcome.after = readComponents(operations, candidate.adapter.path);
    outcome.resetNeeded = readResetNeeded(operations, candidate.adapter.path);
} catch (const std::exception&) {
    // What was read so far stays.
}

/// The update is under way, or may be, and this program no longer sees it: nor what the adapter has now.
void endAsUnknown(Outcome& outcome, const Explanation& why) {
    outcome.after.clear();
    outcome.end(Ending::Unknown, why);
}

void followUpdate(Context& context, const core::CimPath& job, const Candidate& candidate, Outcome& outcome) {
    core::CimOperations& operations = *context.connection.operations;
    context.progress.started(outcome.adapter, candidate.comparison ? candidate.comparison->bytes : 0);
    outcome.job.emplace().path = job;
    try {
        followJob(operations, *outcome.job, context.progress, context.following);
    } catch (const CommandError& error) {
        context.progress.ended();
        const bool isInterrupted = error.status() == ExitStatus::Interrupted;
        endAsUnknown(outcome, isInterrupted ? Explanation{"Interrupted. The update of " + outcome.adapter +
                                                              " goes on on the server.",
                                                          "\"quenxctl jobs\" shows how far it is.",
                                                          ExitStatus::Interrupted}
                                            : Explanation{error.what(), error.advice(), ExitStatus::Unknown});
        return;
    }
    outcome.job->adapter = outcome.adapter;
    outcome.job->backend = outcome.backend;
    readBack(operations, candidate, outcome);
    if (outcome.job->hasSucceeded()) {
        judgeCompleted(outcome, candidate);
    } else {
        outcome.reason = core::reasonOfErrorCode(outcome.job->errorCode);
        outcome.end(Ending::Failed,
                    explainFailedJob(context.connection, *outcome.job, candidate, outcome.after));
    }
}

/// Once the service was called and has returned this.
void conclude(Context& context, const core::MethodResult& result, const Candidate& candidate,
              Outcome& outcome) try {
    outcome.returnValue = result.returnValue;
    if (result.returnValue == MethodReturn::JobStarted) {
        followUpdate(context, jobOf(*context.connection.operations, result), candidate, outcome);
    } else if (result.returnValue == MethodReturn::Completed) {
        // Other services may be done by the time they answer, and then name no job.
        readBack(*context.connection.operations, candidate, outcome);
        judgeCompleted(outcome, candidate);
    } else {
        outcome.end(Ending::Refused,
                    explainRefusal(context.connection, result.returnValue, candidate, outcome.reason));
    }
    // An update in this program may still run when nobody knows how it ends.
    if (outcome.ending != Ending::Unknown) context.following.over();
} catch (const CommandError&) {
    throw;
} catch (const core::CimError&) {
    throw;
} catch (const std::exception& error) {
    // Memory may end at any time, and a script must not take that for an update that was refused.
    throw CommandError(ExitStatus::Unknown,
                       "Cannot tell how the update of " + outcome.adapter + " ends: " + error.what() + ".",
                       "\"quenxctl adapters\" shows which firmware is there. Look before you install again.");
}

/// Nothing where the service was called and did not answer; the outcome then says so.
std::optional<core::MethodResult> start(Context& context, const Candidate& candidate, Outcome& outcome) {
    try {
        return startUpdate(context.connection, candidate);
    } catch (const NoAnswer& error) {
        endAsUnknown(
            outcome,
            {error.what() + (" The update of " + outcome.adapter) + " may have begun.",
             "\"quenxctl jobs\" shows whether it runs, \"quenxctl adapters\" which firmware is there. "
             "Look before you install again.",
             error.status() == ExitStatus::Interrupted ? ExitStatus::Interrupted : ExitStatus::Unknown});
        return std::nullopt;
    }
}

/// Has the server have the image, which is a file here.
std::string uploaded(const Connection& connection, const std::string& file) {
    if (const auto uri = connection.control->upload(file)) return *uri;
    throw CommandError(ExitStatus::Failed, "This server takes no images over the network.",
                       "Copy " + file + " to its machine, and name it there without --upload.");
}

}  // namespace

Outcome installCandidate(Context& context, const Candidate& named) {
    Candidate candidate = named;
    if (!candidate.localFile.empty()) candidate.uri = uploaded(context.connection, candidate.localFile);
    Outcome outcome(candidate);
    if (context.connection.isInProcess) outcome.card = readCard(context.connection, outcome.adapter);
    if (!context.json) {
        printUnchecked(context.out, outcome);
        if (outcome.card) printCard(context.out, *outcome.card);
    }
    // The last moment to stop: once the service is called, nobody can.
    if (context.following.interrupted()) throw CommandError(ExitStatus::Interrupted, "Interrupted.", "");
    const core::NotedCall noted;
    const std::optional<core::MethodResult> result = start(context, candidate, outcome);
    outcome.reason = noted.notes().reason;
    outcome.signedBy = noted.notes().signedBy;
    if (result) conclude(context, *result, candidate, outcome);
    outcome.historyId = ownRecordOf(context.connection, candidate.adapter);
    return outcome;
}

ExitStatus install(Context& context, const VerbOptions& options) try {
    if (options.many.isAsked()) return installMany(context, options);
    const Candidate candidate = makeCandidate(context.connection, options.update);
    // Checked here: the service would write the same image again.
    if (candidate.force || !candidate.isAlreadyCurrent())
        return print(context, installCandidate(context, candidate));
    Outcome outcome(candidate);
    if (context.connection.isInProcess) outcome.card = readCard(context.connection, outcome.adapter);
    outcome.endAsCurrent(candidate);
    outcome.advice = "Use --force to write it again.";
    context.following.over();
    return print(context, outcome);
} catch (const CommandError& error) {
    if (error.status() != ExitStatus::Interrupted) throw;
    throw CommandError(ExitStatus::Interrupted, "Interrupted before the update began: nothing was changed.",
                       "");
}

namespace {

/// On a server that has no more than the model: it can check the identity that a file belongs to.
std::uint32_t checkByModel(Context& context, const UpdateOptions& options, Candidate& candidate,
                           std::string& advice) {
    const Connection& connection = context.connection;
    if (options.force || !options.types.empty())
        throw CommandError(ExitStatus::WrongUse, "This server's checks take neither --types nor --force.",
                           "Leave them out, or check without --server.");
    if (!candidate.identity.isValid())
        candidate = makeCandidate(connection, std::move(candidate.adapter),
                                  findByFile(*connection.operations, options.image), false);
    const std::string warning = warningOfHold(candidate.adapter.name);
    if (context.json)
        advice = warning;
    else
        context.error << "quenxctl: Warning: " << printable(warning) << std::endl;
    return checkIdentity(connection, candidate);
}

}  // namespace

ExitStatus check(Context& context, const VerbOptions& options) {
    const Connection& connection = context.connection;
    Candidate candidate = makeCandidate(connection, options.update);
    std::string advice;
    const core::NotedCall noted;
    std::optional<std::uint32_t> returnValue = verifyOnly(connection, candidate);
    if (!returnValue) returnValue = checkByModel(context, options.update, candidate, advice);
    Outcome outcome(candidate);
    outcome.returnValue = returnValue;
    outcome.advice = advice;
    outcome.signedBy = noted.notes().signedBy;
    if (returnValue != MethodReturn::Completed) {
        outcome.reason = noted.notes().reason;
        outcome.end(Ending::Refused, explainRefusal(connection, *returnValue, candidate, outcome.reason));
    } else if (!candidate.force && candidate.isAlreadyCurrent()) {
        outcome.endAsCurrent(candidate);
    } else {
        outcome.end(ExitStatus::Done, Ending::Installable,
                    "The image can be installed on " + outcome.label + "." + trustText(outcome.signedBy));
    }
    return print(context, outcome);
}

}  // namespace cli
