#include "Cli/Busyness.h"

#include <algorithm>

#include "Cli/Job.h"
#include "Cli/ReturnValues.h"

namespace cli {

namespace {

constexpr const char* WAIT_OR_RESTART =
    "An update ends by itself: try again in a while. What a check holds stays until quenx-cimd is restarted; "
    "with \"ReleaseClaimAfterCheck=1\" in the configuration file of its providers a check holds nothing.";

std::optional<JobView> runningJob(Management& management) {
    const std::vector<JobView> jobs = readJobs(management);
    const auto running =
        std::find_if(jobs.begin(), jobs.end(), [](const JobView& job) { return !job.hasEnded(); });
    return running == jobs.end() ? std::nullopt : std::optional(*running);
}

/// The service holds an adapter, and no job says why.
Explanation explainUnseen(std::uint32_t returnValue, const Candidate& candidate) {
    constexpr const char* HOLDER = " for an earlier check, or for an update whose job was deleted.";
    const std::string& name = candidate.adapter.name;
    if (returnValue == RETURN_TARGET_IN_USE) {
        return {"No job is running, yet the server holds " + name + HOLDER, WAIT_OR_RESTART};
    }
    if (candidate.image && !candidate.image->isIntact()) return {};
    return {
        "The server could not read or prepare the image, or it holds another adapter than " + name + HOLDER,
        WAIT_OR_RESTART};
}

}  // namespace

Explanation explainBusyness(Management& management, std::uint32_t returnValue, const Candidate& candidate) {
    const bool mayBeBusy = returnValue == RETURN_TARGET_IN_USE || returnValue == RETURN_UNSPECIFIED;
    if (!mayBeBusy || management.runsJobs()) return {};
    const std::optional<JobView> job = runningJob(management);
    if (!job) return explainUnseen(returnValue, candidate);
    return {(job->adapter.empty() ? "An adapter" : job->adapter) + " is being updated: " + job->id + ", " +
                std::to_string(job->certainPercent().value_or(0)) +
                " % done. The server updates one adapter at a time.",
            "Wait for that update to end and try again; \"quenxctl jobs\" shows how far it is."};
}

std::string holdAfterCheck(const Management& management, const std::string& adapter) {
    if (management.runsJobs()) return {};
    return "The server now holds " + adapter +
           ": it refuses further checks and installs until quenx-cimd is restarted, unless the configuration "
           "file "
           "of its providers has \"ReleaseClaimAfterCheck=1\".";
}

}  // namespace cli
