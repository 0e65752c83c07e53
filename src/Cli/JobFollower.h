// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <functional>

#include "Cli/Job.h"
#include "Cli/Management.h"
#include "Cli/UpdateObserver.h"

namespace cli {

/// How a job is followed; tests put their own in.
struct Following {
    std::function<void()> pause;        ///< between two looks at the job
    std::function<bool()> interrupted;  ///< whether the user asked to stop since the last time
};

/// Looks at the job until it has ended and tells the observer. Returns how it ended. Throws Failure when the
/// job cannot be looked at for long, or is gone.
JobView followJob(Management& management, const core::CimPath& job, UpdateObserver& observer,
                  const Following& following);

}  // namespace cli
