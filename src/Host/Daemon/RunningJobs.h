// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Framework/Requests/CimOperations.h"

namespace host {

/// A flash that has begun.
struct RunningJob {
    std::string id;
    std::uint64_t percent = 0;
};

/// The jobs that the providers are working on: those that serve a CIM_ConcreteJob which is starting or
/// running. Empty when nobody serves jobs.
std::vector<RunningJob> runningJobs(core::CimOperations& operations);

/// "Job#1 at 42 %, Job#2 at 7 %"
std::string describe(const std::vector<RunningJob>& jobs);

}  // namespace host
