// SPDX-License-Identifier: Apache-2.0
#include "Cli/Job.h"

#include <algorithm>
#include <array>
#include <ctime>

#include "Cli/Values.h"

namespace cli {

namespace {

/// The path that an association has at one of its ends; null when there is none.
const core::CimPath* endOf(const core::CimPath& association, std::string_view role) {
    for (const core::CimKey& key : association.getKeys()) {
        if (core::sameName(key.name, role)) return std::get_if<core::CimPath>(&key.value);
    }
    return nullptr;
}

void nameAdapters(Management& management, std::vector<JobView>& jobs) {
    const auto ports = management.enumerateInstances("Quenx_EthernetPort");
    const auto nameOf = [&ports](const core::CimPath& path) {
        const auto port = std::find_if(ports.begin(), ports.end(),
                                       [&path](const auto& one) { return one.path.isSameObjectAs(path); });
        return port == ports.end() ? std::string() : textOf(*port, "Name");
    };
    for (const core::CimPath& affected : management.enumerateInstanceNames("Quenx_AffectedJobElement")) {
        const core::CimPath* element = endOf(affected, "AffectedElement");
        const core::CimPath* affecting = endOf(affected, "AffectingElement");
        const std::string name = element == nullptr ? std::string() : nameOf(*element);
        if (name.empty() || affecting == nullptr) continue;  // a job affects the card of its port, too
        const auto job = std::find_if(jobs.begin(), jobs.end(), [affecting](const JobView& one) {
            return one.path.isSameObjectAs(*affecting);
        });
        if (job != jobs.end()) job->adapter = name;
    }
}

}  // namespace

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
    if (!jobs.empty()) nameAdapters(management, jobs);
    return jobs;
}

JobView viewOf(const core::InstanceValue& job) {
    JobView view;
    view.path = job.path;
    view.id = textOf(job, "InstanceID");
    view.start = timeOf(job, "StartTime");
    view.user = textOf(job, "Owner");
    view.state = static_cast<std::uint16_t>(numberOf(job, "JobState"));
    view.percent = static_cast<unsigned>(numberOf(job, "PercentComplete"));
    view.errorCode = static_cast<std::uint16_t>(numberOf(job, "ErrorCode"));
    view.errorDescription = textOf(job, "ErrorDescription");
    return view;
}

std::string startText(const JobView& job) {
    if (!job.start || job.start->isPeriod()) return "-";
    const auto seconds = static_cast<std::time_t>(job.start->getSeconds());
    std::tm local{};
    std::array<char, sizeof "9999-12-31 23:59:59"> text{};
    if (localtime_r(&seconds, &local) == nullptr) return "-";
    return {text.data(), std::strftime(text.data(), text.size(), "%Y-%m-%d %H:%M:%S", &local)};
}

std::string jobStateName(std::uint16_t state) {
    constexpr std::array<const char*, 13> NAMES = {
        "",          "",           "New",    "Starting",  "Running", "Suspended",    "Shutting Down",
        "Completed", "Terminated", "Killed", "Exception", "Service", "Query Pending"};
    const bool known = state < NAMES.size() && *NAMES[state] != '\0';
    return known ? NAMES[state] : "State " + std::to_string(state);
}

}  // namespace cli
