// SPDX-License-Identifier: Apache-2.0
#include "Cli/Busyness.h"

#include <algorithm>

#include "Cli/Job.h"
#include "Cli/ReturnValues.h"

namespace cli {

namespace {

constexpr const char* WAIT_OR_RESTART =
    "If an update is running, try again later. If a check holds the adapter, restart the server; with "
    "\"ReleaseClaimAfterCheck=1\" in the configuration file of its providers, checks hold nothing.";

std::optional<JobView> runningJob(Management& management) {
    const std::vector<JobView> jobs = readJobs(management);
    const auto running =
        std::find_if(jobs.begin(), jobs.end(), [](const JobView& job) { return !job.hasEnded(); });
    return running == jobs.end() ? std::nullopt : std::optional(*running);
}

/// The service holds an adapter, and no job says why.
Explanation explainUnseen(std::uint32_t returnValue, const Candidate& candidate) {
    constexpr const char* HOLDER = ": an earlier check may hold it, or an update whose job was deleted.";
    const std::string& name = candidate.adapter.name;
    if (returnValue == MethodReturn::InUse) {
        return {"The server refuses " + name + ", although no job is running" + HOLDER, WAIT_OR_RESTART};
    }
    if (candidate.image && !candidate.image->isIntact()) return {};
    return {"The server could not read or prepare the image, or another adapter than " + name + " is in use" +
                HOLDER,
            WAIT_OR_RESTART};
}

}  // namespace

Explanation explainBusyness(Management& management, std::uint32_t returnValue, const Candidate& candidate) {
    const bool mayBeBusy =
        returnValue == MethodReturn::InUse || returnValue == MethodReturn::UnspecifiedError;
    if (!mayBeBusy || management.runsJobs()) return {};
    const std::optional<JobView> job = runningJob(management);
    if (!job) return explainUnseen(returnValue, candidate);
    return {(job->adapter.empty() ? "An adapter" : job->adapter) + " is being updated (" + job->id + ", " +
                std::to_string(job->certainPercent().value_or(0)) +
                " % done). The server updates one adapter at a time.",
            "Try again when that update has ended; \"quenxctl jobs\" shows its progress."};
}

std::string holdAfterCheck(const Management& management, const std::string& adapter) {
    if (management.runsJobs()) return {};
    return "The server may now hold " + adapter +
           " and refuse further checks and installs until it is restarted. To prevent that, put "
           "\"ReleaseClaimAfterCheck=1\" into the configuration file of its providers.";
}

}  // namespace cli
