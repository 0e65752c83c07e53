// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <functional>

#include "Cli/Candidate.h"
#include "Cli/Explanation.h"
#include "Cli/Failure.h"
#include "Cli/Identities.h"
#include "Cli/ImageUri.h"
#include "Cli/InstallOutcome.h"
#include "Cli/ReturnValues.h"
#include "Cli/ServiceCalls.h"
#include "Cli/Verbs.h"
#include "Framework/Model/CimError.h"

namespace cli {

namespace {

/// Calls the one method or the other.
using Start = std::function<core::MethodResult()>;

/// An update that says it completed and left the old versions has not.
bool isInPlace(const Candidate& candidate, const std::vector<Component>& after) {
    if (!candidate.comparison || after.empty()) return true;
    const std::vector<Component>& chosen = candidate.comparison->chosen;
    return std::all_of(chosen.begin(), chosen.end(), [&](const Component& component) {
        return std::find(after.begin(), after.end(), component) != after.end();
    });
}

void judgeJob(const Management& management, InstallOutcome& outcome, const Candidate& candidate) {
    const std::string& name = candidate.adapter.name;
    if (!outcome.job->hasSucceeded()) {
        outcome.end("failed", explainFailedJob(management, *outcome.job, candidate, outcome.after));
    } else if (!isInPlace(candidate, outcome.after)) {
        outcome.end("failed", {"The update of " + name + " ended without an error, but " + name + " has " +
                                   componentsText(outcome.after) + ", not what the image has.",
                               "Look into the system log, then install again with --force."});
    } else {
        outcome.result = "updated";
        outcome.status = ExitStatus::Done;
        outcome.message = name + (candidate.comparison && candidate.comparison->current
                                      ? " was rewritten with the same version."
                                      : " was updated.");
        if (outcome.after.empty() && !outcome.before.empty()) {
            outcome.advice = "Its versions cannot be read now; \"quenxctl adapters\" shows them later.";
        }
    }
}

/// What the adapter carries after the update. Nothing where that cannot be read: the job's end is worth
/// reporting all the same.
std::vector<Component> readBack(Management& management, const Candidate& candidate) {
    try {
        return readComponents(management, candidate.adapter.path);
    } catch (const Failure&) {
        return {};
    } catch (const core::CimError&) {
        return {};
    }
}

void followUpdate(Context& context, const core::CimPath& job, const Candidate& candidate,
                  InstallOutcome& outcome) {
    context.observer.started(candidate.adapter.name, candidate.comparison ? candidate.comparison->bytes : 0);
    outcome.job = followJob(context.management, job, context.observer, context.following);
    outcome.job->adapter = candidate.adapter.name;
    outcome.after = readBack(context.management, candidate);
    judgeJob(context.management, outcome, candidate);
}

ExitStatus runInstall(Context& context, const Candidate& candidate, const Start& start) {
    InstallOutcome outcome(candidate);
    if (!candidate.force && isAlreadyCurrent(candidate)) {
        outcome.status = ExitStatus::AlreadyCurrent;
        outcome.result = "already current";
        outcome.message = alreadyCurrentText(candidate);
        outcome.advice = "Use --force to write it again.";
        return printOutcome(context, outcome);
    }
    if (context.following.interrupted()) {
        throw Failure(ExitStatus::Failed, "Interrupted before the update began: nothing was changed.", "");
    }
    const core::MethodResult result = start();
    outcome.returnValue = result.returnValue;
    if (result.returnValue == MethodReturn::JobStarted) {
        followUpdate(context, jobOf(result), candidate, outcome);
    } else {
        outcome.end("refused", explainRefusal(context.management, result.returnValue, candidate));
    }
    return printOutcome(context, outcome);
}

ExitStatus installImage(Context& context, const InstallOrder& order, Adapter adapter) {
    requireKnownTypes(context.management, order.types);
    const Candidate candidate = makeCandidate(std::move(adapter), imageUri(order.image), order.types,
                                              order.force, context.management.sharesFiles());
    return runInstall(context, candidate, [&] {
        return installFromUri(context.management, candidate.uri, candidate.adapter.path,
                              {order.types, order.force});
    });
}

ExitStatus installIdentity(Context& context, const InstallOrder& order, Adapter adapter) {
    const Identity identity = findIdentity(context.management, order.identity);
    const Candidate candidate = makeCandidate(std::move(adapter), identity.uri(), identity.types, order.force,
                                              context.management.sharesFiles());
    return runInstall(context, candidate, [&] {
        return installFromIdentity(context.management, identity.path, candidate.adapter.path, order.force);
    });
}

}  // namespace

ExitStatus install(Context& context, const InstallOrder& order) {
    Adapter adapter = findAdapter(context.management, order.target);
    return order.identity.empty() ? installImage(context, order, std::move(adapter))
                                  : installIdentity(context, order, std::move(adapter));
}

}  // namespace cli
