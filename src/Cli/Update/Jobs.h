// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <functional>
#include <nlohmann/json_fwd.hpp>
#include <optional>
#include <string>
#include <vector>

#include "Cli/Display/Progress.h"
#include "Framework/Requests/CimOperations.h"
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
    std::string backend = {};  ///< that reaches the adapter; empty when that is not shown

    /// No further change will come.
    bool hasEnded() const { return state >= JobStateCompleted && state <= JobStateException; }
    bool hasSucceeded() const { return state == JobStateCompleted; }
    /// What is done for certain. A job that failed reports 100 % and tells nothing; one that runs is not
    /// done.
    std::optional<unsigned> certainPercent() const;
    /// The state's name: "Running", "Completed".
    std::string stateName() const;
};
void to_json(nlohmann::ordered_json& json, const JobView& job);

/// "2026-11-21 20:10:33" in the local time zone; "-" for none.
std::string momentText(const std::optional<utils::Time>& moment);

/// All jobs that the service knows, without their adapters.
std::vector<JobView> listJobs(core::CimOperations& operations);
/// The same with their adapters.
std::vector<JobView> readJobs(core::CimOperations& operations);

/// How a job is followed; tests put their own in.
struct Following {
    std::function<void()> pause;        ///< between two looks at the job
    std::function<bool()> interrupted;  ///< whether the user asked to stop since the last time
    /// If the update would end with this program, an interruption does not end the following.
    bool untilTheEnd = true;
    /// The update has ended, or none began: from here on an interruption may end the program.
    std::function<void()> over = [] {};
};

/// Looks at the job until it has ended and shows its progress.
/// @param job  with the path; the rest is what the last look saw, without the adapter
/// @throws CommandError  ExitStatus::Unknown when the job is gone or cannot be looked at for long, and
///                       ExitStatus::Interrupted
void followJob(core::CimOperations& operations, JobView& job, ProgressDisplay& progress,
               const Following& following);

}  // namespace cli
