// SPDX-License-Identifier: Apache-2.0
// Installing an image, and checking whether it could be installed.
#include <algorithm>

#include "Cli/Display/Output.h"
#include "Cli/Update/Card.h"
#include "Cli/Update/Service.h"
#include "Cli/Verbs/Verbs.h"

namespace cli {

namespace {

/// How an install, or a check of one, ended: the same facts for a person and for a script.
struct Outcome {
    explicit Outcome(const Candidate& candidate)
        : adapter(candidate.adapter.name),
          label(labelOf(candidate.adapter.name, candidate.adapter.backend)),
          backend(candidate.adapter.backend),
          uri(candidate.uri),
          unchecked(candidate.verdict ? candidate.verdict->unchecked : std::vector<std::string>()),
          resetNeeded(candidate.adapter.resetNeeded),
          before(candidate.adapter.components),
          after(before) {}

    void end(ExitStatus with, const std::string& how, const std::string& what) {
        status = with;
        result = how;
        message = what;
    }
    void end(const std::string& how, const Explanation& why) {
        end(why.status, how, why.message);
        advice = why.advice;
    }
    /// For a person: if the adapter is already current, nothing has failed.
    bool isFailure() const { return status != ExitStatus::Done && status != ExitStatus::AlreadyCurrent; }

    ExitStatus status = ExitStatus::Failed;
    std::string result;   ///< "updated", "installable", "already current", "refused", "failed", "unknown"
    std::string message;  ///< what happened
    std::string advice;   ///< what to do next; may be empty
    std::string adapter;
    std::string label;  ///< the adapter's, for results
    std::string backend;
    std::string uri;
    std::optional<std::uint32_t> returnValue;  ///< of the method, when it was called
    std::optional<JobView> job;                ///< when one was started
    std::vector<std::string> unchecked;        ///< what only the write can show
    std::string resetNeeded;                   ///< by what was written, as the model tells it
    std::optional<ma::CardUse> card;           ///< looked at before an install in process
    std::vector<Component> before;
    std::vector<Component> after;  ///< as before until something is written; empty if it cannot be read
};

void to_json(Json& json, const Outcome& outcome) {
    json = {{"result", outcome.result},
            {"exitStatus", static_cast<int>(outcome.status)},
            {"message", outcome.message},
            {"advice", outcome.advice},
            {"adapter", outcome.adapter},
            {"backend", outcome.backend},
            {"uri", outcome.uri},
            {"returnValue", nullptr},
            {"job", nullptr},
            {"unchecked", outcome.unchecked},
            {"resetNeeded", outcome.resetNeeded},
            {"before", outcome.before},
            {"after", outcome.after}};
    if (outcome.returnValue) json["returnValue"] = *outcome.returnValue;
    if (outcome.job) json["job"] = *outcome.job;
    if (outcome.card) json["card"] = cardJson(*outcome.card);
}

/// "1 -> 2", "1 (unchanged)", "1.2 -> 1.3 after a reset"
std::string changeText(const Component* before, const Component* after) {
    const auto text = [](const Component* component) {
        return component == nullptr ? std::string("none") : component->versionText();
    };
    if (after != nullptr && !after->stored.empty())
        return text(after) + " -> " + after->stored + " after a reset";
    return text(before) == text(after) ? text(after) + " (unchanged)" : text(before) + " -> " + text(after);
}

void printChange(std::ostream& out, const Outcome& outcome) {
    std::vector<std::vector<std::string>> rows;
    for (const Component& component : outcome.after) {
        rows.push_back(
            {"  " + component.type, changeText(findComponent(outcome.before, component.type), &component)});
    }
    for (const Component& component : outcome.before) {
        if (outcome.after.empty() || findComponent(outcome.after, component.type) != nullptr) continue;
        rows.push_back({"  " + component.type, changeText(&component, nullptr)});
    }
    printTable(out, rows);
}

void printUnchecked(std::ostream& out, const Outcome& outcome) {
    if (outcome.unchecked.empty()) return;
    out << "It could not be checked " << printable(joined(outcome.unchecked, "; "))
        << ". The adapter judges that when the image is written.\n";
}

ExitStatus print(Context& context, const Outcome& outcome) {
    if (context.json) {
        printJson(context.out, outcome);
        return outcome.status;
    }
    std::ostream& stream = outcome.isFailure() ? context.error : context.out;
    stream << (outcome.isFailure() ? "quenxctl: " : "") << printable(outcome.message) << '\n';
    // After a failure the explanation says what the adapter has now.
    if (outcome.result == "updated") printChange(stream, outcome);
    if (outcome.result == "installable") printUnchecked(stream, outcome);
    if (!outcome.advice.empty()) stream << printable(outcome.advice) << '\n';
    return outcome.status;
}

void endAsCurrent(Outcome& outcome, const Candidate& candidate) {
    outcome.end(
        ExitStatus::AlreadyCurrent, "already current",
        outcome.label + " is already current: it has " + componentsText(candidate.comparison->chosen) + ".");
}

/// If the adapter still has the old versions, the update did not complete, although the service says so.
bool isInPlace(const Candidate& candidate, const std::vector<Component>& after) {
    if (!candidate.comparison || after.empty()) return true;
    const std::vector<Component>& chosen = candidate.comparison->chosen;
    return std::ranges::all_of(
        chosen, [&](const Component& each) { return std::ranges::find(after, each) != after.end(); });
}

/// For an update that completed, as the service says.
void judgeCompleted(Outcome& outcome, const Candidate& candidate) {
    const std::string& name = outcome.adapter;
    if (!isInPlace(candidate, outcome.after)) {
        outcome.end("failed", {"The update of " + name + " ended without an error, but " + name + " has " +
                                   componentsText(outcome.after) + ", not what the image has.",
                               "Check the system log, then install again with --force."});
    } else {
        const bool wasCurrent = candidate.comparison && candidate.comparison->current;
        outcome.end(ExitStatus::Done, "updated",
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
    outcome.end("unknown", why);
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
        outcome.end("failed", explainFailedJob(context.connection, *outcome.job, candidate, outcome.after));
    }
}

/// Once the service was called and has returned this.
ExitStatus conclude(Context& context, const core::MethodResult& result, const Candidate& candidate,
                    Outcome& outcome) try {
    outcome.returnValue = result.returnValue;
    if (result.returnValue == MethodReturn::JobStarted) {
        followUpdate(context, jobOf(*context.connection.operations, result), candidate, outcome);
    } else if (result.returnValue == MethodReturn::Completed) {
        // Other services may be done by the time they answer, and then name no job.
        readBack(*context.connection.operations, candidate, outcome);
        judgeCompleted(outcome, candidate);
    } else {
        outcome.end("refused", explainRefusal(context.connection, result.returnValue, candidate));
    }
    // An update in this program may still run when nobody knows how it ends.
    if (outcome.result != "unknown") context.following.over();
    return print(context, outcome);
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

/// Throws CommandError with ExitStatus::Interrupted only while nothing has been started.
ExitStatus installUnlessInterrupted(Context& context, const UpdateOptions& options) {
    const Candidate candidate = makeCandidate(context.connection, options);
    Outcome outcome(candidate);
    if (context.connection.isInProcess) outcome.card = readCard(context.connection, outcome.adapter);
    // Checked here: the service would write the same image again.
    if (!candidate.force && candidate.isAlreadyCurrent()) {
        endAsCurrent(outcome, candidate);
        outcome.advice = "Use --force to write it again.";
        context.following.over();
        return print(context, outcome);
    }
    if (!context.json) {
        printUnchecked(context.out, outcome);
        if (outcome.card) printCard(context.out, *outcome.card);
    }
    // The last moment to stop: once the service is called, nobody can.
    if (context.following.interrupted()) throw CommandError(ExitStatus::Interrupted, "Interrupted.", "");
    const std::optional<core::MethodResult> result = start(context, candidate, outcome);
    return result ? conclude(context, *result, candidate, outcome) : print(context, outcome);
}

}  // namespace

ExitStatus install(Context& context, const VerbOptions& options) {
    try {
        return installUnlessInterrupted(context, options.update);
    } catch (const CommandError& error) {
        if (error.status() != ExitStatus::Interrupted) throw;
        throw CommandError(ExitStatus::Interrupted,
                           "Interrupted before the update began: nothing was changed.", "");
    }
}

ExitStatus check(Context& context, const VerbOptions& options) {
    const Connection& connection = context.connection;
    Candidate candidate = makeCandidate(connection, options.update);
    std::optional<std::uint32_t> returnValue = verifyOnly(connection, candidate);
    // If a server cannot check a file, it can check the identity that the file belongs to.
    if (!returnValue) {
        if (options.update.force || !options.update.types.empty()) {
            throw CommandError(ExitStatus::WrongUse, "A check on a server takes neither --types nor --force.",
                               "Leave them out, or check without --server.");
        }
        candidate = makeCandidate(connection, std::move(candidate.adapter),
                                  findByFile(*connection.operations, options.update.image), false);
        returnValue = verifyOnly(connection, candidate);
    }
    Outcome outcome(candidate);
    outcome.returnValue = returnValue;
    outcome.advice = adviceAfterCheck(connection, outcome.adapter);
    if (returnValue != MethodReturn::Completed) {
        outcome.end("refused", explainRefusal(connection, *returnValue, candidate));
    } else if (!candidate.force && candidate.isAlreadyCurrent()) {
        endAsCurrent(outcome, candidate);
    } else {
        outcome.end(ExitStatus::Done, "installable", "The image can be installed on " + outcome.label + ".");
    }
    return print(context, outcome);
}

}  // namespace cli
