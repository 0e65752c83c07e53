// SPDX-License-Identifier: Apache-2.0
#include "Cli/Verbs/Outcome.h"

#include <algorithm>

#include "Cli/Display/Output.h"
#include "Cli/Display/Terminal.h"
#include "Cli/Update/Card.h"

namespace cli {

namespace {

/// The words of the endings and their colour. Scripts know both words: "result" is the older one.
struct EndingWords {
    Ending ending;
    const char* outcome;
    const char* result;
    Look look;
};
constexpr EndingWords kEndings[] = {
    {Ending::Current, "current", "already current", Look::Plain},
    {Ending::Updated, "updated", "updated", Look::Success},
    {Ending::UpdatedResetPending, "updated-reset-pending", "updated", Look::Success},
    {Ending::Refused, "refused", "refused", Look::Failure},
    {Ending::Failed, "failed", "failed", Look::Failure},
    {Ending::Unknown, "unknown", "unknown", Look::Failure},
    {Ending::Installable, "installable", "installable", Look::Success},
};

const EndingWords& wordsOf(Ending ending) {
    return *std::ranges::find(kEndings, ending, &EndingWords::ending);
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

}  // namespace

const char* outcomeText(Ending ending) {
    return wordsOf(ending).outcome;
}

Look lookOf(Ending ending) {
    return wordsOf(ending).look;
}

Outcome::Outcome(const Candidate& candidate)
    : adapter(candidate.adapter.name),
      label(labelOf(candidate.adapter.name, candidate.adapter.backend)),
      backend(candidate.adapter.backend),
      uri(candidate.uri),
      unchecked(candidate.verdict ? candidate.verdict->unchecked : std::vector<std::string>()),
      resetNeeded(candidate.adapter.resetNeeded),
      before(candidate.adapter.components),
      after(before) {}

void Outcome::endAsCurrent(const Candidate& candidate) {
    end(ExitStatus::AlreadyCurrent, Ending::Current,
        label + " is already current: it has " + componentsText(candidate.brought()) + ".");
}

void to_json(Json& json, const Outcome& outcome) {
    json = {{"result", wordsOf(outcome.ending).result},
            {"outcome", outcomeText(outcome.ending)},
            {"exitStatus", static_cast<int>(outcome.status)},
            {"message", outcome.message},
            {"advice", outcome.advice},
            {"adapter", outcome.adapter},
            {"backend", outcome.backend},
            {"uri", outcome.uri},
            {"returnValue", nullptr},
            {"reasonId", nullptr},
            {"job", nullptr},
            {"historyId", nullptr},
            {"unchecked", outcome.unchecked},
            {"resetNeeded", outcome.resetNeeded},
            {"resetPending", outcome.isResetPending()},
            {"before", outcome.before},
            {"after", outcome.after}};
    if (outcome.returnValue) json["returnValue"] = *outcome.returnValue;
    if (outcome.reason != core::ReasonId::None) json["reasonId"] = core::reasonCode(outcome.reason);
    if (!outcome.signedBy.empty()) json["signedBy"] = outcome.signedBy;
    if (outcome.job) json["job"] = *outcome.job;
    if (outcome.historyId != 0) json["historyId"] = outcome.historyId;
    if (outcome.card) json["card"] = cardJson(*outcome.card);
}

void printChange(std::ostream& out, const Outcome& outcome) {
    Rows rows;
    for (const Component& component : outcome.after) {
        rows.push_back(
            {"  " + component.type, changeText(findComponent(outcome.before, component.type), &component)});
    }
    for (const Component& component : outcome.before) {
        if (outcome.after.empty() || findComponent(outcome.after, component.type) != nullptr) continue;
        rows.push_back({"  " + component.type, changeText(&component, nullptr)});
    }
    printPairs(out, rows);
}

void printUnchecked(std::ostream& out, const Outcome& outcome) {
    if (outcome.unchecked.empty()) return;
    out << "It could not be checked " << printable(joined(outcome.unchecked, "; "))
        << ". The adapter judges that when the image is written.\n";
}

void printText(Context& context, const Outcome& outcome) {
    std::ostream& stream = outcome.isFailure() ? context.error : context.out;
    if (outcome.isFailure())
        printFailure(stream, outcome.message, {});
    else
        stream << coloured(stream, lookOf(outcome.ending), printable(outcome.message)) << '\n';
    // After a failure the explanation says what the adapter has now.
    if (outcome.isUpdated()) printChange(stream, outcome);
    if (outcome.ending == Ending::Installable) printUnchecked(stream, outcome);
    printHint(stream, outcome.advice);
}

}  // namespace cli
