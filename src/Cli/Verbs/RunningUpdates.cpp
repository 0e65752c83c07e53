// SPDX-License-Identifier: Apache-2.0
#include "Cli/Verbs/RunningUpdates.h"

#include <algorithm>
#include <utility>

#include "Cli/Display/Terminal.h"

namespace cli {

namespace {

void follow(Context& context, JobView& job, const Adapter& adapter) {
    context.progress.started(adapter.name, 0);
    followJob(*context.connection.operations, job, context.progress, context.following);
    job.adapter = adapter.name;
    job.backend = adapter.backend;
}

/// Another process may write to it, and a job that was deleted tells nobody of its end.
void waitWhileBusy(Context& context, const std::string& adapter) {
    constexpr int kPausesALook = 10;
    bool isTold = false;
    while (true) {
        const Adapter now = findAdapter(context.connection, adapter);
        if (!now.busy) return;
        if (!std::exchange(isTold, true))
            context.error << printable(adapter) << " is being written to by "
                          << (now.writer.empty() ? "another process" : printable(now.writer))
                          << "; waiting for the end of that." << std::endl;
        for (int i = 0; i < kPausesALook; ++i) {
            if (context.following.interrupted())
                throw CommandError(ExitStatus::Interrupted, "Interrupted.", "");
            context.following.pause();
        }
    }
}

}  // namespace

std::map<std::string, FollowedUpdate> followUpdates(Context& context, const std::string& pattern) {
    std::map<std::string, FollowedUpdate> followed;
    const Connection& connection = context.connection;
    // Those of this process have not begun yet.
    std::vector<JobView> jobs =
        connection.isInProcess ? std::vector<JobView>() : readJobs(*connection.operations);
    for (const Adapter& adapter : matchingAdapters(connection, pattern)) {
        const auto job = std::ranges::find_if(
            jobs, [&](const JobView& each) { return !each.hasEnded() && each.adapter == adapter.name; });
        if (job == jobs.end() && !adapter.busy) continue;
        FollowedUpdate& update = followed[adapter.name];
        update.before = adapter.components;
        if (job != jobs.end()) {
            follow(context, *job, adapter);
            update.job = *job;
        }
        waitWhileBusy(context, adapter.name);
    }
    return followed;
}

}  // namespace cli
