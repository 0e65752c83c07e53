#include "Cli/Job.h"

#include <algorithm>
#include <array>

#include "Cli/Values.h"

namespace cli {

std::optional<unsigned> JobView::certainPercent() const {
    constexpr unsigned NOT_YET = 99;
    if (hasSucceeded()) return 100;
    return hasEnded() ? std::nullopt : std::optional(std::min(percent, NOT_YET));
}

JobView readJob(Management& management, const core::CimPath& path) {
    return viewOf(management.getInstance(path));
}

std::vector<JobView> readJobs(Management& management) {
    std::vector<JobView> jobs;
    for (const core::InstanceValue& job : management.enumerateInstances("Quenx_ConcreteJob"))
        jobs.push_back(viewOf(job));
    return jobs;
}

JobView viewOf(const core::InstanceValue& job) {
    JobView view;
    view.path = job.path;
    view.id = textOf(job, "InstanceID");
    view.state = static_cast<std::uint16_t>(numberOf(job, "JobState"));
    view.percent = static_cast<unsigned>(numberOf(job, "PercentComplete"));
    view.errorCode = static_cast<std::uint16_t>(numberOf(job, "ErrorCode"));
    view.errorDescription = textOf(job, "ErrorDescription");
    return view;
}

std::string jobStateName(std::uint16_t state) {
    constexpr std::array<const char*, 13> NAMES = {
        "",          "",           "New",    "Starting",  "Running", "Suspended",    "Shutting Down",
        "Completed", "Terminated", "Killed", "Exception", "Service", "Query Pending"};
    const bool known = state < NAMES.size() && *NAMES[state] != '\0';
    return known ? NAMES[state] : "State " + std::to_string(state);
}

}  // namespace cli
