// SPDX-License-Identifier: Apache-2.0
#include "Cli/JobFollower.h"

#include <algorithm>

#include "Cli/Failure.h"
#include "Framework/Model/CimError.h"

namespace cli {

namespace {

/// So many looks in a row may fail: a connection can break, and the update goes on all the same.
constexpr unsigned MOST_FAILURES = 20;

JobView lookAt(Management& management, const core::CimPath& job, const Following& following) {
    for (unsigned failures = 1;; ++failures) {
        try {
            return readJob(management, job);
        } catch (const Failure& failure) {
            if (failures == MOST_FAILURES) {
                throw Failure(
                    failure.status(), failure.what(),
                    "The update may still be running: \"quenxctl jobs\" shows it. If the server was "
                    "restarted, \"quenxctl adapters\" shows which firmware is there.");
            }
        } catch (const core::CimError& error) {
            if (error.status() != core::CimStatus::NotFound) throw;
            throw Failure(ExitStatus::Failed,
                          "The server no longer knows the job: it was deleted, or the server was restarted. "
                          "How the update ends cannot be seen here.",
                          "\"quenxctl adapters\" shows which firmware is there.");
        }
        following.pause();
    }
}

}  // namespace

JobView followJob(Management& management, const core::CimPath& job, UpdateObserver& observer,
                  const Following& following) {
    unsigned shown = 0;
    while (true) {
        JobView view = lookAt(management, job, following);
        if (const auto percent = view.certainPercent()) {
            shown = std::max(shown, *percent);
            observer.progressed(shown);
        }
        if (view.hasEnded()) {
            observer.ended(view);
            return view;
        }
        if (following.interrupted()) observer.interrupted();
        following.pause();
    }
}

}  // namespace cli
