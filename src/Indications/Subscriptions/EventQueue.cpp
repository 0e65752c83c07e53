// SPDX-License-Identifier: Apache-2.0
#include "Indications/Subscriptions/EventQueue.h"

#include <new>

namespace indications {

void EventQueue::take(const core::InstanceEvent& event) noexcept {
    try {
        const std::lock_guard lock(m_mutex);
        if (m_events.size() >= kMost) m_events.pop_front();
        m_events.push_back(event);
    } catch (const std::bad_alloc&) {
        // An update must not fail because nobody can be told of it.
    }
    m_arrived.notify_one();
}

std::optional<core::InstanceEvent> EventQueue::next(const std::stop_token& stop,
                                                    std::chrono::milliseconds patience) {
    std::unique_lock lock(m_mutex);
    if (!m_arrived.wait_for(lock, stop, patience, [&] { return !m_events.empty(); })) return std::nullopt;
    core::InstanceEvent event = std::move(m_events.front());
    m_events.pop_front();
    return event;
}

}  // namespace indications
