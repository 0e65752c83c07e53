// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/JobRetention.h"

#include <algorithm>

#include "Framework/Requests/Audit.h"
#include "Framework/Requests/Caller.h"
#include "Host/Authentication/ClientAddress.h"
#include "Host/Repetition.h"
#include "Providers/Schema/ValueMaps.h"

namespace host {

namespace {

constexpr const char* kJobClass = "Quenx_ConcreteJob";

/// Completed or failed: the two ends of an update. Whatever else a state says, somebody may still want the
/// job.
bool hasEnded(const core::InstanceValue& job) {
    const std::uint64_t state = job.number("JobState");
    return state == JobStateCompleted || state == JobStateException;
}

}  // namespace

EndedJobs::Surplus EndedJobs::look(const std::vector<core::InstanceValue>& jobs, Clock::time_point now) {
    std::map<std::string, Clock::time_point> seen;
    std::vector<std::pair<Clock::time_point, const core::CimPath*>> ended;
    for (const core::InstanceValue& job : jobs) {
        if (!hasEnded(job)) continue;
        const std::string name = job.path.toString();
        const auto known = m_firstSeen.find(name);
        const auto since = known == m_firstSeen.end() ? now : known->second;
        seen.emplace(name, since);
        ended.emplace_back(since, &job.path);
    }
    m_firstSeen = std::move(seen);  // without those that are gone
    const auto isOlder = [](const auto& left, const auto& right) { return left.first < right.first; };
    std::stable_sort(ended.begin(), ended.end(), isOlder);
    Surplus surplus;
    std::size_t left = ended.size();
    for (const auto& [since, path] : ended) {
        if (m_settings.keep != 0 && left > m_settings.keep) {
            surplus.emplace_back(*path, "jobs.keep");
        } else if (m_settings.keepFor.count() != 0 && now - since >= m_settings.keepFor) {
            surplus.emplace_back(*path, "jobs.keep_seconds");
        }
        --left;
    }
    return surplus;
}

std::optional<std::chrono::seconds> pauseBetweenLooks(const JobSettings& settings) {
    constexpr std::chrono::seconds kLongest{10};
    if (settings.keepFor.count() != 0)
        return std::clamp(settings.keepFor / 10, std::chrono::seconds(1), kLongest);
    return settings.keep == 0 ? std::nullopt : std::optional(kLongest);
}

JobRetention::JobRetention(const JobSettings& settings, std::shared_ptr<core::CimOperations> operations)
    : m_jobs(settings), m_operations(std::move(operations)) {
    const auto pause = pauseBetweenLooks(settings);
    if (!pause) return;
    // A look fails while no provider here serves jobs.
    m_thread = std::jthread(
        [this, pause](const std::stop_token& stop) { repeat(stop, *pause, [this] { sweep(); }); });
}

void JobRetention::sweep() {
    const core::Caller itself{
        .principal = "quenx-cimd", .address = kLocalAddress, .front = "quenx-cimd", .isFront = true};
    const core::CallerScope scope(itself);
    const auto jobs = m_operations->enumerateInstances(kJobClass, {{"JobState"}});
    for (const auto& [path, setting] : m_jobs.look(jobs, EndedJobs::Clock::now())) {
        std::string outcome = "done";
        try {
            m_operations->deleteInstance(path);
        } catch (const core::CimError& error) {
            // A client deleted it meanwhile.
            if (error.status() == core::CimStatus::NotFound) continue;
            // A policy that cannot be obeyed, of which the log has a line.
            if (error.status() == core::CimStatus::AccessDenied) return;
            outcome = core::outcomeOf(error.status(), error.what());
        }
        const auto rule = core::CimValue::of(core::CimType::String, setting);
        core::audit({itself, "DeleteInstance", path.toString(), outcome}, {{"rule", rule}});
    }
}

}  // namespace host
