// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <map>
#include <string>
#include <thread>
#include <vector>

#include "Framework/Requests/Audit.h"
#include "Utils/Os/Linux/Mutex.h"
#include "Utils/Os/Linux/Thread.h"

namespace host {

/// What users who are known may not do, in the audit trail: twenty lines a minute for each, the rest as their
/// number, which a thread of its own writes when the minute is over. A refusal costs nothing, and thousands
/// of them would drown what others do: log services drop what comes too fast, whosever it is. Thread-safe.
class AuditTrail {
  public:
    using Clock = std::chrono::steady_clock;

    explicit AuditTrail(Clock::duration minute = std::chrono::minutes(1)) : m_minute(minute) {}
    AuditTrail(const AuditTrail&) = delete;
    AuditTrail& operator=(const AuditTrail&) = delete;
    /// Writes the numbers that are still owed.
    ~AuditTrail();

    /// Writes the refusal, or counts it.
    /// @throws std::bad_alloc
    void refused(const core::AuditEvent& event, const std::vector<core::Argument>& arguments,
                 Clock::time_point now = Clock::now());
    /// Writes the numbers of the minutes that are over.
    /// @throws std::bad_alloc
    void writeNumbers(Clock::time_point now = Clock::now());

  private:
    struct Minute {
        Clock::time_point end;
        core::AuditEvent last;
        unsigned int refusals = 0;
    };

    void startWriter() QUENX_REQUIRES(m_mutex);

    const Clock::duration m_minute;
    utils::Mutex m_mutex;
    std::map<std::string, Minute> m_minutes QUENX_GUARDED_BY(m_mutex);  ///< by user
    std::jthread m_writer QUENX_GUARDED_BY(m_mutex);                    // last: it uses the others
};

}  // namespace host
