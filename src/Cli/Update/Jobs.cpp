// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/Jobs.h"

#include <algorithm>
#include <array>
#include <ctime>
#include <limits>
#include <unordered_map>

#include "Cli/Display/Messages.h"
#include "Cli/Display/Output.h"
#include "Cli/Update/Inventory.h"

namespace cli {

namespace {

/// The path that an association has at one of its ends; null when there is none.
const core::CimPath* endOf(const core::CimPath& association, std::string_view role) {
    const core::CimKey* key = core::findByName(association.getKeys(), role);
    return key == nullptr ? nullptr : std::get_if<core::CimPath>(&key->value);
}

/// The same for every spelling of a path in the answers of one server, which may leave out host and
/// namespace.
std::string keyOf(const core::CimPath& path) {
    return core::CimPath(core::foldName(path.getClassName()), path.getKeys()).toString();
}

/// A job does not tell its adapter; an association does.
void nameAdapters(core::CimOperations& operations, std::vector<JobView>& jobs) {
    // By key, since a server may have thousands of jobs and more associations than that.
    std::unordered_map<std::string, JobView*> byPath;
    for (JobView& job : jobs)
        byPath.emplace(keyOf(job.path), &job);
    struct Named {
        std::string adapter;
        std::string backend;
    };
    std::unordered_map<std::string, Named> ports;
    for (const core::InstanceValue& port : operations.enumerateInstances("Quenx_EthernetPort"))
        ports.emplace(keyOf(port.path), Named{port.text("Name"), backendOf(port)});
    // Three enumerations in all: asking for the associators of each job would be a request for each.
    for (const core::CimPath& affected : operations.enumerateInstanceNames("Quenx_AffectedJobElement")) {
        const core::CimPath* element = endOf(affected, "AffectedElement");
        const core::CimPath* affecting = endOf(affected, "AffectingElement");
        if (element == nullptr || affecting == nullptr) continue;
        const auto port = ports.find(keyOf(*element));
        const auto job = byPath.find(keyOf(*affecting));
        // A job affects the card of its port, too; only the port is an adapter.
        if (port == ports.end() || job == byPath.end()) continue;
        job->second->adapter = port->second.adapter;
        job->second->backend = port->second.backend;
    }
}

/// The number as the type holds it. One that is too large becomes the largest, which means nothing, and not
/// some other number, which may.
template <class Held>
Held numberOf(const core::InstanceValue& job, std::string_view name) {
    return static_cast<Held>(std::min<std::uint64_t>(job.number(name), std::numeric_limits<Held>::max()));
}

JobView viewOf(const core::InstanceValue& job) {
    return {job.path,
            job.text("InstanceID"),
            "",
            job.get<utils::Time>("StartTime"),
            job.text("Owner"),
            numberOf<std::uint16_t>(job, "JobState"),
            numberOf<unsigned>(job, "PercentComplete"),
            numberOf<std::uint16_t>(job, "ErrorCode"),
            job.text("ErrorDescription")};
}

CommandError jobIsGone() {
    return {ExitStatus::Unknown,
            "The server no longer knows the job: it was deleted, or the server was restarted. How the update "
            "ends cannot be seen here.",
            "\"quenxctl adapters\" shows which firmware is there."};
}

/// A server that was restarted counts its jobs from 1 again, so the id alone may be that of somebody else's.
bool isAnotherJob(const JobView& before, const JobView& now) {
    return before.start && now.start && core::datetimeText(*before.start) != core::datetimeText(*now.start);
}

JobView lookAt(core::CimOperations& operations, const core::CimPath& job, const Following& following) {
    // The update survives a broken connection, so give up only after this many failures in a row.
    constexpr unsigned kMaxFailures = 20;
    std::string reason;
    const auto giveUp = [&] {
        return CommandError(ExitStatus::Unknown, reason,
                            "The update may still be running: \"quenxctl jobs\" shows it. If the server was "
                            "restarted, \"quenxctl adapters\" shows which firmware is there.");
    };
    for (unsigned failures = 0; failures < kMaxFailures; ++failures) {
        if (failures > 0) following.pause();
        try {
            const core::InstanceValue instance = operations.getInstance(job);
            const auto state = instance.get<std::uint64_t>("JobState");
            if (state && *state <= std::numeric_limits<std::uint16_t>::max()) return viewOf(instance);
            reason = "The job has no state that can be read.";
        } catch (const LoginRefused& error) {
            reason = error.what();
            throw giveUp();
        } catch (const CommandError& error) {
            if (error.status() == ExitStatus::Interrupted) throw;
            reason = error.what();
        } catch (const core::CimError& error) {
            if (error.status() == core::CimStatus::NotFound) throw jobIsGone();
            reason = std::string("The job cannot be read: ") + error.what() + ".";
        }
    }
    throw giveUp();
}

}  // namespace

std::optional<unsigned> JobView::certainPercent() const {
    constexpr unsigned kNotYet = 99;
    if (hasSucceeded()) return 100;
    return hasEnded() ? std::nullopt : std::optional(std::min(percent, kNotYet));
}

std::string JobView::stateName() const {
    // The Values of JobState (DSP1103); a server may use those reserved for vendors.
    constexpr std::array<const char*, 13> kNames = {
        "",          "",           "New",    "Starting",  "Running", "Suspended",    "Shutting Down",
        "Completed", "Terminated", "Killed", "Exception", "Service", "Query Pending"};
    const bool isKnown = state < kNames.size() && *kNames[state] != '\0';
    return isKnown ? kNames[state] : "State " + std::to_string(state);
}

void to_json(Json& json, const JobView& job) {
    const auto orNull = [](const std::string& text) { return text.empty() ? Json() : Json(text); };
    json = {{"path", job.path},
            {"id", job.id},
            {"adapter", orNull(job.adapter)},
            {"backend", orNull(job.backend)},
            {"startTime", job.start ? Json(core::datetimeText(*job.start)) : Json()},
            {"user", orNull(job.user)},
            {"state", job.state},
            {"stateName", job.stateName()},
            {"percentComplete", job.percent},
            {"errorCode", job.errorCode},
            {"errorDescription", job.errorDescription}};
}

std::string momentText(const std::optional<utils::Time>& moment) {
    if (!moment || moment->isPeriod()) return "-";  // an interval, not a moment
    const auto seconds = static_cast<std::time_t>(moment->getSeconds());
    std::tm local{};
    std::array<char, sizeof "9999-12-31 23:59:59"> text{};
    if (localtime_r(&seconds, &local) == nullptr) return "-";
    return {text.data(), std::strftime(text.data(), text.size(), "%Y-%m-%d %H:%M:%S", &local)};
}

std::vector<JobView> listJobs(core::CimOperations& operations) {
    std::vector<JobView> jobs;
    // What viewOf() reads, and no more: of thousands of jobs the rest would be most of the answer.
    const core::PropertyFilter shown{
        {"InstanceID", "StartTime", "Owner", "JobState", "PercentComplete", "ErrorCode", "ErrorDescription"}};
    for (const core::InstanceValue& job : operations.enumerateInstances("Quenx_ConcreteJob", shown))
        jobs.push_back(viewOf(job));
    return jobs;
}

std::vector<JobView> readJobs(core::CimOperations& operations) {
    std::vector<JobView> jobs = listJobs(operations);
    if (!jobs.empty()) nameAdapters(operations, jobs);
    return jobs;
}

void followJob(core::CimOperations& operations, JobView& job, ProgressDisplay& progress,
               const Following& following) {
    unsigned shown = 0;
    while (true) {
        JobView seen = lookAt(operations, core::CimPath(job.path), following);
        if (isAnotherJob(job, seen)) throw jobIsGone();
        job = std::move(seen);
        if (const auto percent = job.certainPercent()) {
            // Progress that goes back, as after a retry on the device, would only puzzle.
            shown = std::max(shown, *percent);
            progress.progressed(shown);
        }
        if (job.hasEnded()) return progress.ended();
        if (following.interrupted()) {
            if (!following.untilTheEnd) throw CommandError(ExitStatus::Interrupted, "Interrupted.", "");
            progress.interrupted();
        }
        following.pause();
    }
}

}  // namespace cli
