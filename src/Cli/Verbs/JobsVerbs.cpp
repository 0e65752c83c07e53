// SPDX-License-Identifier: Apache-2.0
// The jobs of a server.
#include <algorithm>

#include "Cli/Display/Output.h"
#include "Cli/Verbs/Verbs.h"

namespace cli {

namespace {

/// Jobs end with the process that runs them, so only a server can have any that were started before.
core::CimOperations& requireServer(const Connection& connection) {
    if (!connection.isInProcess) return *connection.operations;
    throw CommandError(
        ExitStatus::WrongUse,
        "Jobs are kept by a server, and none was named: an update in this program ends with it.",
        "Name the server with --server. Root needs none on a machine on which quenx-cimd runs.");
}

std::string orDash(const std::string& text) {
    return text.empty() ? "-" : text;
}

/// There is a column for the users if the service names at least one.
void printJobs(std::ostream& out, const std::vector<JobView>& jobs) {
    const bool hasUsers =
        std::any_of(jobs.begin(), jobs.end(), [](const JobView& job) { return !job.user.empty(); });
    Rows rows = {{"JOB", "ADAPTER", "STATE", "PERCENT", "START"}};
    for (const JobView& job : jobs) {
        const std::optional<unsigned> percent = job.certainPercent();
        rows.push_back(
            {job.id,
             orDash(labelOf(job.adapter, job.backend)),
             {job.stateName(), job.hasEnded() && !job.hasSucceeded() ? Look::Failure : Look::Plain},
             percent ? std::to_string(*percent) : "-",
             momentText(job.start)});
    }
    for (std::size_t i = 0; i < rows.size(); ++i) {
        if (hasUsers) rows[i].push_back(i == 0 ? "USER" : orDash(jobs[i - 1].user));
        rows[i].push_back(i == 0 ? "ERROR" : jobs[i - 1].errorDescription);
    }
    printTable(out, rows);
}

bool isMeant(const JobView& job, const std::string& name) {
    // "3" must not mean job 13, so the number is compared with its mark.
    return job.id == name || job.path.toString() == name || job.id.ends_with("@Job#" + name);
}

void deleteOnServer(core::CimOperations& operations, const core::CimPath& job) try {
    operations.deleteInstance(job);
} catch (const NoAnswer& error) {
    throw CommandError(ExitStatus::Unknown, error.what() + std::string(" The job may have been deleted."),
                       "\"quenxctl jobs\" shows whether it is still there.");
}

void printDeleted(Context& context, const JobView& job) {
    if (context.json) {
        printJson(context.out, {{"deleted", job.id}, {"updateGoesOn", !job.hasEnded()}});
        return;
    }
    context.out << "Deleted " << printable(job.id) << ".\n";
    if (!job.hasEnded()) {
        context.out
            << "Its update continues, but can no longer be followed; until it ends, the server refuses "
               "other updates.\n\"quenxctl adapters\" shows the firmware afterwards.\n";
    }
}

}  // namespace

ExitStatus showJobs(Context& context, const VerbOptions&) {
    const std::vector<JobView> jobs = readJobs(requireServer(context.connection));
    if (context.json) {
        printJson(context.out, {{"jobs", jobs}});
    } else if (jobs.empty()) {
        context.out << "There are no jobs.\n";
    } else {
        printJobs(context.out, jobs);
    }
    return ExitStatus::Done;
}

ExitStatus deleteJob(Context& context, const VerbOptions& options) {
    core::CimOperations& operations = requireServer(context.connection);
    for (const JobView& job : listJobs(operations)) {
        if (!isMeant(job, options.job)) continue;
        // As it was before: afterwards nobody can ask whether it still ran.
        deleteOnServer(operations, job.path);
        printDeleted(context, job);
        return ExitStatus::Done;
    }
    throw CommandError(ExitStatus::NotFound, "There is no job \"" + options.job + "\".",
                       "\"quenxctl jobs\" lists the jobs.");
}

}  // namespace cli
