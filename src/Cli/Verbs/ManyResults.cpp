// SPDX-License-Identifier: Apache-2.0
#include "Cli/Verbs/ManyResults.h"

#include <algorithm>

#include "Cli/Display/Output.h"
#include "Cli/Display/Terminal.h"

namespace cli {

namespace {

std::string labelOf(const Adapter& adapter) {
    return cli::labelOf(adapter.name, adapter.backend);
}

/// The functions of a card share its flash, but one that shows other firmware does not.
void printOtherFirmware(std::ostream& out, const ManyResults& results, const SameCard& function) {
    const auto target = std::ranges::find(results.outcomes, function.target, &Outcome::adapter);
    if (target == results.outcomes.end() || target->isFailure() || target->after.empty()) return;
    if (target->ending == Ending::Installable || target->after == function.adapter.components) return;
    const std::string name = printable(function.adapter.name);
    out << name << " has other firmware than " << printable(function.target)
        << ", so it may have a flash of its own: install on it with --match '" << name << "'.\n";
}

}  // namespace

ExitStatus ManyResults::status() const {
    const auto has = [this](ExitStatus status) {
        return std::ranges::find(outcomes, status, &Outcome::status) != outcomes.end();
    };
    if (isInterrupted || has(ExitStatus::Interrupted)) return ExitStatus::Interrupted;
    if (has(ExitStatus::Unknown)) return ExitStatus::Unknown;
    if (std::ranges::any_of(outcomes, &Outcome::isFailure)) return ExitStatus::Failed;
    // Images that are for no adapter here are a mistake, as a rule.
    if (outcomes.empty() && !unused.empty()) return ExitStatus::NotFound;
    return has(ExitStatus::Done) ? ExitStatus::Done : ExitStatus::AlreadyCurrent;
}

void printAsJson(std::ostream& out, const ManyResults& results) {
    Json sameCard = Json::array();
    for (const SameCard& function : results.sameCard)
        sameCard.push_back({{"adapter", function.adapter.name},
                            {"target", function.target},
                            {"components", function.adapter.components}});
    printJson(out, {{"exitStatus", static_cast<int>(results.status())},
                    {"results", results.outcomes},
                    {"sameCard", sameCard},
                    {"notTried", results.notTried},
                    {"unused", results.unused}});
}

void printSummary(std::ostream& out, const ManyResults& results) {
    Rows rows = {{"ADAPTER", "OUTCOME", "FIRMWARE"}};
    for (const Outcome& outcome : results.outcomes) {
        const std::string would = outcome.ending == Ending::Installable ? "would have " : "";
        rows.push_back({outcome.label,
                        {outcomeText(outcome.ending), lookOf(outcome.ending)},
                        outcome.after.empty() ? "?" : would + componentsText(outcome.after)});
    }
    for (const SameCard& function : results.sameCard)
        rows.push_back({labelOf(function.adapter), "same card as " + function.target,
                        componentsText(function.adapter.components)});
    for (const std::string& adapter : results.notTried)
        rows.push_back({adapter, "not tried", "-"});
    if (rows.size() > 1) {
        out << '\n';
        printTable(out, rows);
    }
    for (const SameCard& function : results.sameCard)
        printOtherFirmware(out, results, function);
    for (const std::string& image : results.unused)
        out << printable(image) << " fits no adapter here.\n";
}

}  // namespace cli
