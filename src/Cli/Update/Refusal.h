// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "Cli/Update/Candidate.h"
#include "Cli/Update/Jobs.h"

/// What the service's codes do not say: what is wrong with this image or adapter, and what to do about it.
namespace cli {

/// Why the service refused the candidate: what the program finds in the file, on the adapter and among the
/// service's jobs that explains the return value, else what the value means.
Explanation explainRefusal(const Connection& connection, std::uint32_t returnValue,
                           const Candidate& candidate);

/// Why a job that was started did not complete, in the device's words.
/// @param after  what the adapter carries now; empty when that could not be read
Explanation explainFailedJob(const Connection& connection, const JobView& job, const Candidate& candidate,
                             const std::vector<Component>& after);

/// That a check on a server may keep the adapter from everybody else; empty in process.
std::string adviceAfterCheck(const Connection& connection, const std::string& adapter);

}  // namespace cli
