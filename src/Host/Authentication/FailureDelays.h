// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <map>
#include <optional>
#include <string>

#include "Utils/Os/Linux/Thread.h"
#include "Utils/ThreadAnnotations.h"

namespace host {

/// Makes an address that has sent wrong passwords wait before the next one is looked at: a tenth of a second
/// after the first failure, twice that after each further one, five seconds at the most. Its attempts take
/// turns; one that would wait for more than ten seconds is not waited for. Addresses are forgotten a quarter
/// of an hour after their last failure; those of one IPv6 network of 64 bits count as one. Thread-safe.
class FailureDelays {
  public:
    using Clock = std::chrono::steady_clock;

    /// When an attempt from the address may be looked at; nothing when it has to wait too long.
    std::optional<Clock::time_point> admit(const std::string& address, Clock::time_point now = Clock::now());
    void failed(const std::string& address, Clock::time_point now = Clock::now());
    void succeeded(const std::string& address);

    /// What counts as one place: an IPv4 address, or the network of an IPv6 one.
    static std::string keyOf(const std::string& address);

  private:
    struct Record {
        unsigned int failures = 0;
        Clock::time_point next;  ///< when the next attempt may be looked at
        Clock::time_point last;  ///< the last failure
    };

    static Clock::duration delayAfter(unsigned int failures);

    utils::Mutex m_mutex;
    std::map<std::string, Record> m_records QUENX_GUARDED_BY(m_mutex);
};

}  // namespace host
