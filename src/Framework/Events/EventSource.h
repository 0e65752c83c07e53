// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <utility>

#include "Utils/Export.h"

namespace core {

/// An instance that makes events, while it can change. While somebody listens to its class it is looked at
/// each second, for what changes without telling.
class QUENX_EXPORT EventSource {
  public:
    explicit EventSource(std::string className) : m_className(std::move(className)) {}
    EventSource(const EventSource&) = delete;
    EventSource& operator=(const EventSource&) = delete;
    virtual ~EventSource();

    const std::string& className() const { return m_className; }

    // Called one at a time, on a thread of the framework's or that of whoever begins to listen.

    /// Somebody has begun to listen, where nobody did: changes are told from what is true now.
    virtual void beginTelling() noexcept = 0;
    /// Tells what has changed.
    virtual void look() noexcept = 0;

  protected:
    /// It can change from here on. Throws std::bad_alloc.
    void join();
    /// It does not change any more. Waits for a call of the above that is under way, so it must not be made
    /// from within, nor under a lock that they take. The most derived destructor calls it at the latest.
    void leave() noexcept;

  private:
    const std::string m_className;
};

}  // namespace core
