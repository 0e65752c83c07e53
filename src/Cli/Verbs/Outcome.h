// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <nlohmann/json_fwd.hpp>
#include <optional>
#include <string>
#include <vector>

#include "Cli/Display/Colour.h"
#include "Cli/Update/Candidate.h"
#include "Cli/Update/Jobs.h"
#include "Cli/Verbs/Verbs.h"
#include "Framework/Requests/Reasons.h"
#include "MidAPI/Activation.h"

namespace cli {

/// How an install, or a check of one, can end. docs/operations.md says what to do about each.
enum class Ending { Current, Updated, UpdatedResetPending, Refused, Failed, Unknown, Installable };

/// The word of an ending in tables and in the JSON member "outcome".
const char* outcomeText(Ending ending);
/// How that word looks on a terminal.
Look lookOf(Ending ending);

/// What follows a sentence on an image that is trusted by a key; nothing without one.
inline std::string trustText(const std::string& key) {
    return key.empty() ? "" : " It is trusted by " + key + ".";
}

/// How an install, or a check of one, ended: the same facts for a person and for a script.
struct Outcome {
    explicit Outcome(const Candidate& candidate);

    void end(ExitStatus with, Ending how, const std::string& what) {
        status = with;
        ending = how;
        message = what;
    }
    void end(Ending how, const Explanation& why) {
        end(why.status, how, why.message);
        advice = why.advice;
    }
    /// For a person: if the adapter is already current, nothing has failed.
    bool isFailure() const { return status != ExitStatus::Done && status != ExitStatus::AlreadyCurrent; }
    bool isUpdated() const { return ending == Ending::Updated || ending == Ending::UpdatedResetPending; }
    /// The adapter has firmware, of this image or of an earlier one, that does not run yet.
    bool isResetPending() const { return waitsForReset(after, resetNeeded); }
    /// By the image, which is on the adapter already.
    void endAsCurrent(const Candidate& candidate);

    ExitStatus status = ExitStatus::Failed;
    Ending ending = Ending::Unknown;
    std::string message;  ///< what happened
    std::string advice;   ///< what to do next; may be empty
    std::string adapter;
    std::string label;  ///< the adapter's, for results
    std::string backend;
    std::string uri;
    std::optional<std::uint32_t> returnValue;      ///< of the method, when it was called
    core::ReasonId reason = core::ReasonId::None;  ///< why it was refused, or failed; none where nobody tells
    std::string signedBy;                          ///< the key by which the image is trusted; empty for none
    std::optional<JobView> job;                    ///< when one was started
    std::int64_t historyId = 0;                    ///< its record in this machine's history; 0 for none
    std::vector<std::string> unchecked;            ///< what only the write can show
    std::string resetNeeded;                       ///< by what was written, as the model tells it
    std::optional<ma::CardUse> card;               ///< looked at before an install in process
    std::vector<Component> before;
    std::vector<Component> after;  ///< as before until something is written; empty if it cannot be read
};
void to_json(nlohmann::ordered_json& json, const Outcome& outcome);

/// One line for each component: "1 -> 2", "1 (unchanged)".
void printChange(std::ostream& out, const Outcome& outcome);

/// What could not be checked; nothing where there is no such thing.
void printUnchecked(std::ostream& out, const Outcome& outcome);

/// Prints the outcome as text, on the stream that it belongs to.
void printText(Context& context, const Outcome& outcome);

/// Calls the service, follows the update to its end, and looks at what it has left. Neither asks whether the
/// adapter is current, nor prints the outcome. Throws CommandError with ExitStatus::Interrupted while nothing
/// has begun; once the service was called, with ExitStatus::Unknown.
Outcome installCandidate(Context& context, const Candidate& candidate);

}  // namespace cli
