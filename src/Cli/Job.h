// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Cli/Management.h"
#include "Providers/Schema/ValueMaps.h"
#include "Utils/Time.h"

namespace cli {

/// A job as it was when it was read.
struct JobView {
    core::CimPath path;
    std::string id;
    std::string adapter;               ///< name of the port that it updates; empty when that is not shown
    std::optional<utils::Time> start;  ///< nothing when that is not shown
    std::string user;                  ///< who started it; empty when that is not shown
    std::uint16_t state = 0;
    unsigned percent = 0;
    std::uint16_t errorCode = 0;
    std::string errorDescription;

    /// No further change will come.
    bool hasEnded() const { return state >= JobStateCompleted && state <= JobStateException; }
    bool hasSucceeded() const { return state == JobStateCompleted; }
    /// What is done for certain. A job that failed reports 100 % and tells nothing; one that runs is not
    /// done.
    std::optional<unsigned> certainPercent() const;
};

/// Without the adapter, which the job itself does not tell.
JobView viewOf(const core::InstanceValue& job);
JobView readJob(Management& management, const core::CimPath& path);
/// All jobs that the service knows, with their adapters.
std::vector<JobView> readJobs(Management& management);

/// "2026-11-21 20:10:33" in the local time zone; "-" for none.
std::string startText(const JobView& job);
/// The state's name: "Running", "Completed".
std::string jobStateName(std::uint16_t state);

}  // namespace cli
