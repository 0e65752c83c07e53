// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <condition_variable>
#include <deque>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "Framework/Events/EventSink.h"

namespace cmpi {

/// The events that wait for the object manager. One that does not take them costs updates nothing, and no
/// more memory than that of the newest events. Thread-safe; its lock is held for moments.
class EventQueue : public core::EventSink {
  public:
    using Namespaces = std::shared_ptr<const std::vector<std::string>>;

    /// An event, and where somebody listens when it is taken out.
    struct Item {
        core::InstanceEvent event;
        Namespaces namespaces;
        std::uint64_t lost = 0;  ///< events before it that had to make room
    };

    /// Where somebody listens from now on. With null, what waits is dropped, and nothing more is kept.
    void listenIn(Namespaces namespaces) noexcept;

    void take(const core::InstanceEvent& event) noexcept override;

    /// Waits for the next event; nothing when the queue has been closed. Whoever takes it out is at work
    /// until he asks for the next one.
    std::optional<Item> next() noexcept;
    bool isAtWork() const;

    /// Ends next(), until it is opened again. At first it is open.
    void close() noexcept;
    void open() noexcept;

  private:
    mutable std::mutex m_mutex;
    std::condition_variable m_changed;
    std::deque<core::InstanceEvent> m_events;
    Namespaces m_namespaces;
    std::uint64_t m_lost = 0;
    bool m_isAtWork = false;
    bool m_isClosed = false;
};

}  // namespace cmpi
