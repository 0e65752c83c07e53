// SPDX-License-Identifier: Apache-2.0

#include <algorithm>
#include <utility>

#include "Cli/Update/PastImages.h"
#include "Cli/Update/Service.h"
#include "Cli/Verbs/ManyResults.h"
#include "Cli/Verbs/RunningUpdates.h"
#include "Framework/Requests/NotedCall.h"

namespace cli {

namespace {

using Answer = Candidate::Answer;
using Followed = std::map<std::string, FollowedUpdate>;

/// The versions that there would be.
std::vector<Component> versionsAfter(const Candidate& candidate) {
    std::vector<Component> components = candidate.adapter.components;
    for (const Component& brought : candidate.brought()) {
        const auto old = std::ranges::find(components, brought.type, &Component::type);
        if (old == components.end())
            components.push_back(brought);
        else
            *old = brought;
    }
    return components;
}

/// What the service says; nothing where it cannot be asked, as by somebody on a server who may only read.
std::optional<std::uint32_t> askService(const Connection& connection, const Candidate& candidate) try {
    return verifyOnly(connection, candidate);
} catch (const core::CimError& error) {
    if (connection.isInProcess || error.status() != core::CimStatus::AccessDenied) throw;
    return std::nullopt;
}

/// What would become of a candidate that is to be written.
Outcome judge(const Connection& connection, const Candidate& candidate) {
    Outcome outcome(candidate);
    const core::NotedCall noted;
    // A file that would be sent is not where the server could look at it.
    if (candidate.localFile.empty()) outcome.returnValue = askService(connection, candidate);
    outcome.reason = noted.notes().reason;
    outcome.signedBy = noted.notes().signedBy;
    if (outcome.returnValue.value_or(MethodReturn::Completed) != MethodReturn::Completed) {
        outcome.end(Ending::Refused,
                    explainRefusal(connection, *outcome.returnValue, candidate, outcome.reason));
        return outcome;
    }
    outcome.end(ExitStatus::Done, Ending::Installable,
                "The image would be installed on " + outcome.label + ".");
    outcome.after = versionsAfter(candidate);
    return outcome;
}

/// What is known without asking the service. Nothing for a candidate that is to be written.
/// @param isFit  the adapter is named by nobody, so the image has to be for it
std::optional<Outcome> settle(const Connection& connection, const Candidate& candidate, bool isFit) {
    if (candidate.force) return std::nullopt;
    Outcome outcome(candidate);
    const Answer isCurrent = candidate.isInFlash();
    const bool mayBeForOther = isFit && candidate.fits() == Answer::Unknown;
    if (isCurrent == Answer::Yes)
        outcome.endAsCurrent(candidate);
    else if (isLastWritten(connection, candidate))
        outcome.end(ExitStatus::AlreadyCurrent, Ending::Current,
                    outcome.label + " is already current: this image was the last that was written to it.");
    else if (isCurrent == Answer::No && !mayBeForOther)
        return std::nullopt;
    else
        outcome.end(Ending::Unknown,
                    {"Nothing was written to " + outcome.label + ": quenxctl cannot tell whether " +
                         candidate.uri + (mayBeForOther ? " is for it, or" : " is") + " there already.",
                     "Use --force to write it.", ExitStatus::Unknown});
    return outcome;
}

/// A script must not begin by accident what a person would have thought about.
void requireConfirmation(Context& context, const ManyOptions& many,
                         const std::vector<Candidate>& candidates) {
    std::vector<std::string> names;
    for (const Candidate& candidate : candidates)
        if (candidate.adapter.backend != ma::kSimulatorBackend &&
            !settle(context.connection, candidate, many.isFit))
            names.push_back(candidate.adapter.name);
    if (names.empty()) return;
    const std::optional<std::string> answer =
        context.ask("Write to " + joined(names) + "? [y/N] ", context.following.interrupted);
    if (answer && (*answer == "y" || *answer == "yes")) return;
    throw CommandError(ExitStatus::WrongUse,
                       "Nothing was written: these adapters are hardware, and nobody has confirmed that they "
                       "are meant: " +
                           joined(names) + ".",
                       "Use --yes or, without --server, --backend devlink.");
}

bool isSameInFlash(const std::vector<Component>& some, const std::vector<Component>& others) {
    return std::ranges::equal(some, others, [](const Component& one, const Component& other) {
        return one.type == other.type && one.flashText() == other.flashText();
    });
}

/// One adapter after the other.
class Run {
  public:
    /// @param followed  updates whose end this run has waited for
    Run(Context& context, const VerbOptions& options, Followed followed)
        : m_context(context), m_each(context), m_options(options), m_followed(std::move(followed)) {
        // Whoever interrupts an update wants no other one to begin; only after the last may the program end.
        m_each.following.interrupted = [this] {
            const bool isAsked = m_context.following.interrupted();
            m_results.isInterrupted = m_results.isInterrupted || isAsked;
            return isAsked;
        };
        m_each.following.over = [] {};
    }

    ManyResults all(Targets targets) {
        m_results.sameCard = std::move(targets.sameCard);
        m_results.unused = std::move(targets.unused);
        for (const Candidate& candidate : targets.candidates)
            take(candidate);
        lookAtOtherFunctions();
        m_context.following.over();
        return std::move(m_results);
    }

  private:
    void take(const Candidate& candidate) try {
        const bool isStopped = m_results.isInterrupted || (m_hasFailed && !m_options.many.keepsGoing);
        if (isStopped) return m_results.notTried.push_back(candidate.adapter.name);
        const Outcome& outcome = m_results.outcomes.emplace_back(one(candidate));
        m_hasFailed = m_hasFailed || outcome.isFailure();
        if (!m_context.json) printText(m_context, outcome);
    } catch (const CommandError& error) {
        // Nothing had begun.
        if (error.status() != ExitStatus::Interrupted) throw;
        m_results.isInterrupted = true;
        m_results.notTried.push_back(candidate.adapter.name);
    }

    Outcome one(const Candidate& candidate) {
        const core::NotedCall noted;
        Outcome outcome = tried(candidate);
        // What throws has no outcome to note it in.
        if (outcome.ending == Ending::Refused) outcome.reason = noted.notes().reason;
        return outcome;
    }

    Outcome tried(const Candidate& candidate) try {
        if (std::optional<Outcome> outcome = settle(m_context.connection, candidate, m_options.many.isFit)) {
            if (outcome->ending == Ending::Current) creditFollowed(*outcome);
            return *std::move(outcome);
        }
        if (m_options.many.isDryRun) return judge(m_context.connection, candidate);
        return installCandidate(m_each, candidate);
    } catch (const CommandError& error) {
        if (error.status() == ExitStatus::Interrupted) throw;
        return failed(candidate, error.status() == ExitStatus::Unknown ? Ending::Unknown : Ending::Failed,
                      {error.what(), error.advice(), error.status()});
    } catch (const core::CimError& error) {
        return failed(candidate,
                      error.status() == core::CimStatus::AccessDenied ? Ending::Refused : Ending::Failed,
                      {sentence(error.what()), kAskLog});
    }

    static Outcome failed(const Candidate& candidate, Ending ending, const Explanation& why) {
        Outcome outcome(candidate);
        outcome.end(ending, why);
        return outcome;
    }

    /// What this run has waited for has not been there before.
    void creditFollowed(Outcome& outcome) const {
        const auto found = m_followed.find(outcome.adapter);
        if (found == m_followed.end() || isSameInFlash(found->second.before, outcome.after)) return;
        outcome.end(ExitStatus::Done,
                    outcome.isResetPending() ? Ending::UpdatedResetPending : Ending::Updated,
                    outcome.label + " was updated by an update that ran already.");
        outcome.before = found->second.before;
        outcome.job = found->second.job;
    }

    void lookAtOtherFunctions() try {
        if (m_results.sameCard.empty()) return;
        for (const Adapter& now : readAdapters(*m_context.connection.operations))
            for (SameCard& function : m_results.sameCard)
                if (function.adapter.path.isSameObjectAs(now.path)) function.adapter = now;
    } catch (const std::exception&) {
        // What was known before is shown.
    }

    Context& m_context;
    Context m_each;  ///< for the work on one adapter
    const VerbOptions& m_options;
    const Followed m_followed;
    ManyResults m_results;
    bool m_hasFailed = false;
};

}  // namespace

ExitStatus installMany(Context& context, const VerbOptions& options) {
    const ManyOptions& many = options.many;
    // First of all: a card that is written to does not tell what fits it.
    Followed followed = many.follows ? followUpdates(context, many.match) : Followed();
    Targets targets = chooseTargets(context.connection, many, options.update);
    if (!many.isDryRun && !many.isConfirmed) requireConfirmation(context, many, targets.candidates);
    const ManyResults results = Run(context, options, std::move(followed)).all(std::move(targets));
    if (context.json)
        printAsJson(context.out, results);
    else
        printSummary(context.out, results);
    return results.status();
}

}  // namespace cli
