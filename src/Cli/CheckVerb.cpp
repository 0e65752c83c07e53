// SPDX-License-Identifier: Apache-2.0
#include "Cli/Busyness.h"
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

ExitStatus judge(Context& context, const Candidate& candidate, std::uint32_t returnValue) {
    InstallOutcome outcome(candidate);
    outcome.returnValue = returnValue;
    outcome.advice = holdAfterCheck(context.management, candidate.adapter.name);
    if (returnValue != MethodReturn::Completed) {
        outcome.end("refused", explainRefusal(context.management, returnValue, candidate));
    } else if (!candidate.force && isAlreadyCurrent(candidate)) {
        outcome.status = ExitStatus::AlreadyCurrent;
        outcome.result = "already current";
        outcome.message = alreadyCurrentText(candidate);
    } else {
        outcome.status = ExitStatus::Done;
        outcome.result = "installable";
        outcome.message = "The image can be installed on " + candidate.adapter.name + ".";
    }
    return printOutcome(context, outcome);
}

ExitStatus checkByIdentity(Context& context, Adapter adapter, const Identity& identity) {
    Management& management = context.management;
    const Candidate candidate =
        makeCandidate(std::move(adapter), identity.uri(), identity.types, false, management.sharesFiles());
    return judge(context, candidate,
                 checkIdentity(management, identity.path, candidate.adapter.path).returnValue);
}

/// A service that can verify any file does; of another one the inventory has to offer the file.
ExitStatus checkFile(Context& context, Adapter adapter, const CheckOrder& order) {
    Management& management = context.management;
    requireKnownTypes(management, order.types);
    const std::string uri = imageUri(order.file);
    const auto returnValue = checkUri(management, uri, adapter.path, {order.types, order.force});
    if (returnValue) {
        return judge(
            context,
            makeCandidate(std::move(adapter), uri, order.types, order.force, management.sharesFiles()),
            *returnValue);
    }
    if (order.force || !order.types.empty()) {
        throw Failure(ExitStatus::WrongUse, "A check on a server takes neither --types nor --force.",
                      "Leave them out, or check without --server.");
    }
    return checkByIdentity(context, std::move(adapter), findIdentityOfFile(management, order.file));
}

}  // namespace

ExitStatus check(Context& context, const CheckOrder& order) {
    Adapter adapter = findAdapter(context.management, order.target);
    if (order.identity.empty()) return checkFile(context, std::move(adapter), order);
    return checkByIdentity(context, std::move(adapter), findIdentity(context.management, order.identity));
}

}  // namespace cli
