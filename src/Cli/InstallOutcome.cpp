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

std::string versionText(const std::vector<Component>& components, const std::string& type) {
    const auto version = versionOf(components, type);
    return version ? std::to_string(*version) : "none";
}

void printChange(std::ostream& out, const InstallOutcome& outcome) {
    std::vector<std::vector<std::string>> rows;
    for (const Component& component : outcome.after) {
        rows.push_back({"  " + component.type, versionText(outcome.before, component.type) + " -> " +
                                                   std::to_string(component.version)});
    }
    printTable(out, rows);
}

}  // namespace

ExitStatus printOutcome(Context& context, const InstallOutcome& outcome) {
    if (context.json) {
        printJson(context.out, outcomeToJson(outcome));
        return outcome.status;
    }
    const bool failed = outcome.status == ExitStatus::Failed;
    std::ostream& stream = failed ? context.error : context.out;
    stream << (failed ? "quenxctl: " : "") << printable(outcome.message) << '\n';
    if (outcome.job && !failed) printChange(stream, outcome);
    if (!outcome.advice.empty()) stream << printable(outcome.advice) << '\n';
    return outcome.status;
}

}  // namespace cli
