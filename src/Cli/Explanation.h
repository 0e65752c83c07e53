#pragma once

#include <cstdint>
#include <string>

#include "Cli/Candidate.h"
#include "Cli/Job.h"

namespace cli {

/// What happened and what to do next, each one or two sentences.
struct Explanation {
    std::string message;
    std::string advice;
};

/// Why the service refused the candidate: what its return value means, and what the program finds in the
/// file, on the adapter and among the service's jobs that explains it.
Explanation explainRefusal(Management& management, std::uint32_t returnValue, const Candidate& candidate);

/// Why a job that was started did not complete.
Explanation explainFailedJob(const JobView& job, const std::string& adapter);

}  // namespace cli
