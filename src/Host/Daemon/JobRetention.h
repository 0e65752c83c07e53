// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <condition_variable>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "Framework/Requests/CimOperations.h"
#include "Host/Settings.h"

namespace host {

/// The jobs that have ended, as somebody sees them who looks from time to time, and which of them are beyond
/// the bounds. The time since the end is that since it was first seen: a clock that is set does not age jobs.
class EndedJobs {
  public:
    using Clock = std::chrono::steady_clock;
    /// A job, and the setting that it is beyond.
    using Surplus = std::vector<std::pair<core::CimPath, std::string>>;

    explicit EndedJobs(const JobSettings& settings) : m_settings(settings) {}

    /// @param jobs  all that there are, the oldest first, with their JobState
    Surplus look(const std::vector<core::InstanceValue>& jobs, Clock::time_point now);

  private:
    const JobSettings m_settings;
    std::map<std::string, Clock::time_point> m_firstSeen;  ///< by path
};

/// The time between two looks for those: ten seconds, or a tenth of the age that jobs may reach where that is
/// less, but at least one second. Nothing without a bound.
std::optional<std::chrono::seconds> pauseBetweenLooks(const JobSettings& settings);

/// Deletes the jobs that have ended, completed or failed, and are beyond the bounds, as a client does by
/// DeleteInstance, and leaves an audit line for each. Looks on a thread of its own.
class JobRetention {
  public:
    JobRetention(const JobSettings& settings, std::shared_ptr<core::CimOperations> operations);
    JobRetention(const JobRetention&) = delete;
    JobRetention& operator=(const JobRetention&) = delete;

  private:
    void sweep();

    EndedJobs m_jobs;
    const std::shared_ptr<core::CimOperations> m_operations;
    std::jthread m_thread;  // last: it uses the others
};

}  // namespace host
