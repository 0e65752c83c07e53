#include "Cli/Failure.h"
#include "Cli/Job.h"
#include "Cli/Json.h"
#include "Cli/TextTable.h"
#include "Cli/Values.h"
#include "Cli/Verbs.h"

namespace cli {

namespace {

/// Jobs live as long as the process that runs them: this one has none that somebody else could have started.
void requireServer(const Management& management) {
    if (!management.runsJobs()) return;
    throw Failure(ExitStatus::WrongUse,
                  "Jobs are kept by a server; an update of this program's own ends with it.",
                  "Name the server with --server.");
}

std::string percentText(const JobView& job) {
    const std::optional<unsigned> percent = job.certainPercent();
    return percent ? std::to_string(*percent) : "-";
}

void printDeleted(Context& context, const JobView& job) {
    if (context.json) {
        printJson(context.out, {{"deleted", job.id}, {"updateGoesOn", !job.hasEnded()}});
        return;
    }
    context.out << "Deleted " << job.id << ".\n";
    if (!job.hasEnded()) {
        context.out
            << "The update goes on to its end and can no longer be followed; other updates are refused "
               "until then.\n\"quenxctl adapters\" shows the version afterwards.\n";
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
    std::vector<std::vector<std::string>> rows = {{"JOB", "STATE", "PERCENT", "ERROR"}};
    for (const JobView& job : jobs) {
        rows.push_back({job.id, jobStateName(job.state), percentText(job), job.errorDescription});
    }
    printTable(context.out, rows);
    return ExitStatus::Done;
}

ExitStatus deleteJob(Context& context, const std::string& id) {
    requireServer(context.management);
    for (const JobView& job : readJobs(context.management)) {
        if (job.id != id && job.path.toString() != id) continue;
        context.management.deleteInstance(job.path);
        printDeleted(context, job);
        return ExitStatus::Done;
    }
    throw Failure(ExitStatus::Failed, "There is no job \"" + id + "\".", "\"quenxctl jobs\" lists the jobs.");
}

}  // namespace cli
