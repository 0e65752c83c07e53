// SPDX-License-Identifier: Apache-2.0
#include "Cmpi/EventQueue.h"

#include <new>
#include <utility>

#include "Utils/Log.h"

namespace cmpi {

namespace {

/// Some minutes of as many jobs as a machine has adapters.
constexpr std::size_t kMostWaiting = 1024;

}  // namespace

void EventQueue::listenIn(Namespaces namespaces) noexcept {
    const std::lock_guard lock(m_mutex);
    m_namespaces = std::move(namespaces);
    if (m_namespaces == nullptr) m_events.clear();
}

void EventQueue::take(const core::InstanceEvent& event) noexcept {
    const std::lock_guard lock(m_mutex);
    if (m_namespaces == nullptr) return;
    try {
        m_events.push_back(event);
    } catch (const std::bad_alloc&) {
        ++m_lost;
        return;
    }
    if (m_events.size() > kMostWaiting) {
        m_events.pop_front();
        if (m_lost++ == 0)
            QUENX_ERROR("The object manager does not take indications; the oldest are dropped from here on");
    }
    m_changed.notify_all();
}

std::optional<EventQueue::Item> EventQueue::next() noexcept {
    std::unique_lock lock(m_mutex);
    m_isAtWork = false;
    m_changed.wait(lock, [this] { return m_isClosed || !m_events.empty(); });
    if (m_isClosed) return std::nullopt;
    Item item{m_events.front(), m_namespaces, std::exchange(m_lost, 0)};
    m_events.pop_front();
    m_isAtWork = true;
    return item;
}

bool EventQueue::isAtWork() const {
    const std::lock_guard lock(m_mutex);
    return m_isAtWork;
}

void EventQueue::close() noexcept {
    const std::lock_guard lock(m_mutex);
    m_isClosed = true;
    m_events.clear();
    m_changed.notify_all();
}

void EventQueue::open() noexcept {
    const std::lock_guard lock(m_mutex);
    m_isClosed = false;
    m_isAtWork = false;
}

}  // namespace cmpi
