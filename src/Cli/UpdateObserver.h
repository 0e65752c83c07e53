// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>

#include "Cli/Job.h"

namespace cli {

/// Told of what happens to an update while it is followed: the first of the three layers of the progress
/// display.
class UpdateObserver {
  public:
    UpdateObserver() = default;
    UpdateObserver(const UpdateObserver&) = delete;
    UpdateObserver& operator=(const UpdateObserver&) = delete;
    virtual ~UpdateObserver() = default;

    /// @param bytes  size of what is written; 0 when that is not known
    virtual void started(const std::string& adapter, std::uint64_t bytes) = 0;
    /// At every look at the job that shows how far it is; never less than before, and 100 only when the job
    /// completed.
    virtual void progressed(unsigned percent) = 0;
    /// The user wants to stop, which an update cannot.
    virtual void interrupted() = 0;
    virtual void ended(const JobView& job) = 0;
};

}  // namespace cli
