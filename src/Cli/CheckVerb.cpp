#include "Cli/Busyness.h"
#include "Cli/Candidate.h"
#include "Cli/Explanation.h"
#include "Cli/Identities.h"
#include "Cli/InstallOutcome.h"
#include "Cli/ReturnValues.h"
#include "Cli/ServiceCalls.h"
#include "Cli/Verbs.h"

namespace cli {

namespace {

void judge(InstallOutcome& outcome, Management& management, std::uint32_t returnValue,
           const Candidate& candidate) {
    outcome.returnValue = returnValue;
    if (returnValue == RETURN_COMPLETED) outcome.advice = holdAfterCheck(management, candidate.adapter.name);
    if (returnValue != RETURN_COMPLETED) {
        const Explanation why = explainRefusal(management, returnValue, candidate);
        outcome.result = "refused";
        outcome.message = why.message;
        outcome.advice = why.advice;
    } else if (isAlreadyCurrent(candidate)) {
        outcome.status = ExitStatus::AlreadyCurrent;
        outcome.result = "already current";
        outcome.message = alreadyCurrentText(candidate);
    } else {
        outcome.status = ExitStatus::Done;
        outcome.result = "installable";
        outcome.message = "The image can be installed on " + candidate.adapter.name + ".";
    }
}

}  // namespace

ExitStatus check(Context& context, const CheckOrder& order) {
    Adapter adapter = findAdapter(context.management, order.target);
    const Identity identity = order.identity.empty() ? findIdentityOfFile(context.management, order.file)
                                                     : findIdentity(context.management, order.identity);
    const Candidate candidate =
        makeCandidate(std::move(adapter), identity.uri(), identity.types, context.management.sharesFiles());
    const core::MethodResult result =
        checkIdentity(context.management, identity.path, candidate.adapter.path);

    InstallOutcome outcome;
    outcome.adapter = candidate.adapter.name;
    outcome.uri = candidate.uri;
    outcome.before = candidate.adapter.components;
    outcome.after = outcome.before;
    judge(outcome, context.management, result.returnValue, candidate);
    return printOutcome(context, outcome);
}

}  // namespace cli
