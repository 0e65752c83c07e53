// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <cstdint>

namespace test {

/// The bytes that operator new has handed out, to any thread and any library, and not got back.
std::int64_t liveBytes();

/// Lets one allocation by operator new fail: the n-th from here on, of this thread or of all others.
class AllocationFailure {
  public:
    enum class On { ThisThread, OtherThreads };

    AllocationFailure(On on, std::uint64_t n);
    ~AllocationFailure();
    AllocationFailure(const AllocationFailure&) = delete;
    AllocationFailure& operator=(const AllocationFailure&) = delete;

    /// False when fewer than n allocations were asked for.
    bool hasStruck() const;
};

/// Added to the time of day, in seconds.
extern std::atomic<std::int64_t> clockOffset;

/// While it is set, every new thread of the process is refused with EAGAIN.
extern std::atomic<bool> refusesThreads;

}  // namespace test
