// SPDX-License-Identifier: Apache-2.0
#include <algorithm>

#include "Cli/Failure.h"
#include "Cli/Job.h"
#include "Cli/Json.h"
#include "Cli/TextTable.h"
#include "Cli/Verbs.h"

namespace cli {

namespace {

/// Jobs live as long as the process that runs them: this one has none that somebody else could have started.
void requireServer(const Management& management) {
    if (!management.runsJobs()) return;
    throw Failure(ExitStatus::WrongUse,
                  "Jobs are kept by a server, and none was named: an update in this program ends with it.",
                  "Name the server with --server.");
}

std::string percentText(const JobView& job) {
    const std::optional<unsigned> percent = job.certainPercent();
    return percent ? std::to_string(*percent) : "-";
}

std::string orDash(const std::string& text) {
    return text.empty() ? "-" : text;
}

/// The users have a column where the service tells of one at least.
void printJobs(std::ostream& out, const std::vector<JobView>& jobs) {
    const bool hasUsers =
        std::any_of(jobs.begin(), jobs.end(), [](const JobView& job) { return !job.user.empty(); });
    std::vector<std::vector<std::string>> rows = {{"JOB", "ADAPTER", "STATE", "PERCENT", "START"}};
    for (const JobView& job : jobs) {
        rows.push_back(
            {job.id, orDash(job.adapter), jobStateName(job.state), percentText(job), startText(job)});
    }
    for (std::size_t i = 0; i < rows.size(); ++i) {
        if (hasUsers) rows[i].push_back(i == 0 ? "USER" : orDash(jobs[i - 1].user));
        rows[i].push_back(i == 0 ? "ERROR" : jobs[i - 1].errorDescription);
    }
    printTable(out, rows);
}

/// A job is named by its id, the number at the end of that, or its path.
bool isMeant(const JobView& job, const std::string& name) {
    return job.id == name || job.path.toString() == name || job.id.ends_with("@Job#" + name);
}

void printDeleted(Context& context, const JobView& job) {
    if (context.json) {
        printJson(context.out, {{"deleted", job.id}, {"updateGoesOn", !job.hasEnded()}});
        return;
    }
    context.out << "Deleted " << job.id << ".\n";
    if (!job.hasEnded()) {
        context.out
            << "Its update continues, but can no longer be followed; until it ends, the server refuses "
               "other updates.\n\"quenxctl adapters\" shows the firmware afterwards.\n";
    }
}

}  // namespace

ExitStatus showJobs(Context& context) {
    requireServer(context.management);
    const std::vector<JobView> jobs = readJobs(context.management);
    if (context.json) {
        Json list = Json::array();
        for (const JobView& job : jobs)
            list.push_back(toJson(job));
        printJson(context.out, {{"jobs", std::move(list)}});
        return ExitStatus::Done;
    }
    printJobs(context.out, jobs);
    return ExitStatus::Done;
}

ExitStatus deleteJob(Context& context, const std::string& id) {
    requireServer(context.management);
    for (const JobView& job : readJobs(context.management)) {
        if (!isMeant(job, id)) continue;
        context.management.deleteInstance(job.path);
        printDeleted(context, job);
        return ExitStatus::Done;
    }
    throw Failure(ExitStatus::NotFound, "There is no job \"" + id + "\".",
                  "\"quenxctl jobs\" lists the jobs.");
}

}  // namespace cli
