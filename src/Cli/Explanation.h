// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "Cli/Candidate.h"
#include "Cli/Failure.h"
#include "Cli/Job.h"

namespace cli {

/// Why the service refused the candidate: what the program finds in the file, on the adapter and among the
/// service's jobs that explains the return value, else what the value means.
Explanation explainRefusal(Management& management, std::uint32_t returnValue, const Candidate& candidate);

/// Why a job that was started did not complete, in the device's words.
/// @param after  what the adapter carries now; empty when that could not be read
Explanation explainFailedJob(const Management& management, const JobView& job, const Candidate& candidate,
                             const std::vector<Component>& after);

}  // namespace cli
