// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "Cmpi/Cmpi.h"
#include "Framework/Events/EventInterest.h"
#include "Framework/Events/EventSink.h"

namespace cmpi {

class Deliverer;
class EventQueue;

/// A filter of the object manager's, as far as it matters here: which indications it lets through is the
/// object manager's affair.
struct FilterPlace {
    std::string nameSpace;  ///< of the classes; empty for the providers' own
    std::string className;  ///< of the indications
};

/// What the object manager has told of those who listen. Events are made while indications are enabled and
/// there is a filter; one thread, which begins with the first of them, delivers them. Thread-safe; never
/// destroyed, as the front.
class Listening {
  public:
    static Listening& theOne();

    // The calls of the object manager, each for every class that it has registered. What ends something never
    // waits for an indication that is on its way: the object manager may take it only after the call.

    /// Both need an open session. @throws core::CimError, and then nothing has changed
    void activate(const Context* context, const FilterPlace& filter);
    void enable(const Context* context);
    /// @param isLast  of those with this class and namespace
    void deactivate(const FilterPlace& filter, bool isLast);
    void disable();

    /// Where events go; for a session that begins.
    std::shared_ptr<core::EventSink> sink();
    /// Somebody listens, or the object manager has not come back from an indication.
    bool isBusy();

    /// Nobody listens any more, and the thread ends. Where the object manager does not come back to it within
    /// two seconds, the thread and this library stay to the end of the process.
    void end() noexcept;
    /// The same before the session ends.
    /// @param isLast  nobody can begin to listen afterwards
    void endWithSession(bool isLast) noexcept;

  private:
    struct ActiveFilters {
        FilterPlace place;
        int count = 0;
    };

    std::vector<ActiveFilters>::iterator find(const FilterPlace& place);
    /// Follows the filters and the enabling. Nothing is begun where it throws.
    void update(const Context* context);
    void stop() noexcept;
    void startThread(const Context* context);
    void endThread() noexcept;

    std::mutex m_mutex;
    // Guarded by it; nothing on the heap while there is no session, since nobody would free it.
    std::shared_ptr<EventQueue> m_queue;
    std::vector<ActiveFilters> m_filters;
    int m_enabled = 0;
    std::optional<core::EventInterest> m_interest;
    std::unique_ptr<Deliverer> m_deliverer;
    bool m_isOver = false;
};

}  // namespace cmpi
