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

namespace cli {

namespace {

/// Calls the one method or the other.
using Start = std::function<core::MethodResult()>;

void requireKnownTypes(Management& management, const std::vector<std::string>& types) {
    const std::vector<std::string> known = supportedTypes(management);
    if (known.empty()) return;
    for (const std::string& type : types) {
        if (type.empty() || std::find(known.begin(), known.end(), type) != known.end()) continue;
        std::string names;
        for (const std::string& name : known)
            names += (names.empty() ? "" : ", ") + name;
        throw Failure(ExitStatus::WrongUse, "\"" + type + "\" is no image type.",
                      "The service knows " + names + ", written just so.");
    }
}

/// An update that says it completed and left the old versions has not.
bool isInPlace(const Candidate& candidate, const std::vector<Component>& after) {
    if (!candidate.comparison || after.empty()) return true;
    const std::vector<Component>& chosen = candidate.comparison->chosen;
    return std::all_of(chosen.begin(), chosen.end(), [&](const Component& component) {
        return std::find(after.begin(), after.end(), component) != after.end();
    });
}

void judgeJob(InstallOutcome& outcome, const Candidate& candidate) {
    const std::string& name = candidate.adapter.name;
    if (!outcome.job->hasSucceeded()) {
        outcome.result = "failed";
        const Explanation why = explainFailedJob(*outcome.job, name);
        outcome.message = why.message;
        outcome.advice = why.advice;
    } else if (!isInPlace(candidate, outcome.after)) {
        outcome.result = "failed";
        outcome.message = "The update of " + name + " completed, yet the adapter has " +
                          componentsText(outcome.after) + " and not what the image holds.";
        outcome.advice = "Look into the system log, then install again with --force.";
    } else {
        outcome.result = "updated";
        outcome.status = ExitStatus::Done;
        outcome.message = name + " is updated.";
    }
}

void followUpdate(Context& context, const core::CimPath& job, const Candidate& candidate,
                  InstallOutcome& outcome) {
    context.observer.started(candidate.adapter.name, candidate.comparison ? candidate.comparison->bytes : 0);
    outcome.job = followJob(context.management, job, context.observer, context.following);
    outcome.job->adapter = candidate.adapter.name;
    outcome.after = readComponents(context.management, candidate.adapter.path);
    judgeJob(outcome, candidate);
}

ExitStatus runInstall(Context& context, const Candidate& candidate, bool force, const Start& start) {
    InstallOutcome outcome;
    outcome.adapter = candidate.adapter.name;
    outcome.uri = candidate.uri;
    outcome.before = candidate.adapter.components;
    outcome.after = outcome.before;
    if (!force && isAlreadyCurrent(candidate)) {
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
    if (result.returnValue == RETURN_JOB_STARTED) {
        followUpdate(context, jobOf(result), candidate, outcome);
    } else {
        outcome.result = "refused";
        const Explanation why = explainRefusal(context.management, result.returnValue, candidate);
        outcome.message = why.message;
        outcome.advice = why.advice;
    }
    return printOutcome(context, outcome);
}

ExitStatus installImage(Context& context, const InstallOrder& order, Adapter adapter) {
    requireKnownTypes(context.management, order.types);
    const Candidate candidate = makeCandidate(std::move(adapter), imageUri(order.image), order.types,
                                              context.management.sharesFiles());
    return runInstall(context, candidate, order.force, [&] {
        return installFromUri(context.management, candidate.uri, candidate.adapter.path,
                              {order.types, order.force});
    });
}

ExitStatus installIdentity(Context& context, const InstallOrder& order, Adapter adapter) {
    const Identity identity = findIdentity(context.management, order.identity);
    const Candidate candidate =
        makeCandidate(std::move(adapter), identity.uri(), identity.types, context.management.sharesFiles());
    return runInstall(context, candidate, order.force, [&] {
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
