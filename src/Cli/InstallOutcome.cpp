// SPDX-License-Identifier: Apache-2.0
#include "Cli/InstallOutcome.h"

#include "Cli/Json.h"
#include "Cli/Terminal.h"
#include "Cli/TextTable.h"

namespace cli {

namespace {

Json outcomeToJson(const InstallOutcome& outcome) {
    Json json = {{"result", outcome.result},         {"exitStatus", static_cast<int>(outcome.status)},
                 {"message", outcome.message},       {"advice", outcome.advice},
                 {"adapter", outcome.adapter},       {"uri", outcome.uri},
                 {"returnValue", nullptr},           {"job", nullptr},
                 {"before", toJson(outcome.before)}, {"after", toJson(outcome.after)}};
    if (outcome.returnValue) json["returnValue"] = *outcome.returnValue;
    if (outcome.job) json["job"] = toJson(*outcome.job);
    return json;
}

/// "1 -> 2", "1 (unchanged)"
std::string changeText(std::optional<std::uint32_t> before, std::optional<std::uint32_t> after) {
    const auto text = [](std::optional<std::uint32_t> version) {
        return version ? std::to_string(*version) : std::string("none");
    };
    return before == after ? text(after) + " (unchanged)" : text(before) + " -> " + text(after);
}

void printChange(std::ostream& out, const InstallOutcome& outcome) {
    std::vector<std::vector<std::string>> rows;
    for (const Component& component : outcome.after) {
        rows.push_back({"  " + component.type,
                        changeText(versionOf(outcome.before, component.type), component.version)});
    }
    for (const Component& component : outcome.before) {
        if (outcome.after.empty() || versionOf(outcome.after, component.type)) continue;
        rows.push_back({"  " + component.type, changeText(component.version, std::nullopt)});
    }
    printTable(out, rows);
}

}  // namespace

InstallOutcome::InstallOutcome(const Candidate& candidate)
    : adapter(candidate.adapter.name),
      uri(candidate.uri),
      before(candidate.adapter.components),
      after(candidate.adapter.components) {}

void InstallOutcome::end(const std::string& how, const Explanation& why) {
    status = why.status;
    result = how;
    message = why.message;
    advice = why.advice;
}

ExitStatus printOutcome(Context& context, const InstallOutcome& outcome) {
    if (context.json) {
        printJson(context.out, outcomeToJson(outcome));
        return outcome.status;
    }
    const bool failed = outcome.status == ExitStatus::Failed || outcome.status == ExitStatus::NotFound;
    std::ostream& stream = failed ? context.error : context.out;
    stream << (failed ? "quenxctl: " : "") << printable(outcome.message) << '\n';
    if (outcome.job && !failed) printChange(stream, outcome);
    if (!outcome.advice.empty()) stream << printable(outcome.advice) << '\n';
    return outcome.status;
}

}  // namespace cli
