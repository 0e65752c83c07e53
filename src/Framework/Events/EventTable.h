// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "Utils/Os/Linux/Mutex.h"

namespace core {

class EventClock;
class EventSource;

/// Who listens to what, and what can change: one for the process. Thread-safe, but for start and stop.
class EventTable {
  public:
    /// Never destroyed: instances leave it until the end of the process.
    static EventTable& theOne() noexcept;

    bool isWanted(std::string_view className) const noexcept;

    /// True for the first interest in the class, and for the end of the last. Throws std::bad_alloc.
    bool addInterest(const std::string& className);
    bool dropInterest(std::string_view className) noexcept;

    // The thread that looks at the sources runs while somebody listens. One at a time.

    /// Tells the sources of classes that nobody listened to before, and starts the thread.
    void startWhereSomebodyListens();
    void stopWhereNobodyListens() noexcept;

    void add(EventSource* source);
    /// Waits for a call that the source is in.
    void remove(EventSource* source) noexcept;
    /// Looks at each source that somebody listens to; false where there is no source.
    bool lookAtAll() noexcept;

  private:
    struct Interest {
        std::string className;
        int listeners = 0;
        bool isNew = true;  ///< its sources have not been told
    };

    EventTable();
    ~EventTable();

    mutable utils::Mutex m_mutex;  ///< held for moments
    std::vector<Interest> m_interests QUENX_GUARDED_BY(m_mutex);
    utils::Mutex m_calls;  ///< held while sources are called; taken before the other
    std::vector<EventSource*> m_sources QUENX_GUARDED_BY(m_calls);
    std::unique_ptr<EventClock> m_clock QUENX_GUARDED_BY(m_calls);
    std::atomic<int> m_listeners{0};
};

}  // namespace core
