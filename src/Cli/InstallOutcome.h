// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Cli/Candidate.h"
#include "Cli/Context.h"
#include "Cli/ExitStatus.h"
#include "Cli/Failure.h"
#include "Cli/Job.h"

namespace cli {

/// How an install, or a check of one, ended: the same facts for a person and for a script.
struct InstallOutcome {
    explicit InstallOutcome(const Candidate& candidate);
    /// Sets what an update or a check ended with that did not go well.
    void end(const std::string& how, const Explanation& why);

    ExitStatus status = ExitStatus::Failed;
    std::string
        result;  ///< one word or two: "updated", "installable", "already current", "refused", "failed"
    std::string message;  ///< what happened
    std::string advice;   ///< what to do next; may be empty
    std::string adapter;
    std::string uri;
    std::optional<std::uint32_t> returnValue;  ///< of the method, when it was called
    std::optional<JobView> job;                ///< when one was started
    std::vector<Component> before;
    std::vector<Component> after;  ///< empty when that could not be read
};

/// Prints the outcome and returns its status.
ExitStatus printOutcome(Context& context, const InstallOutcome& outcome);

}  // namespace cli
