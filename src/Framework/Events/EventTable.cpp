// SPDX-License-Identifier: Apache-2.0
#include "Framework/Events/EventTable.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <mutex>
#include <new>

#include "Framework/Events/EventSource.h"
#include "Framework/Model/CimType.h"
#include "Utils/Os/Linux/Thread.h"

namespace core {

/// Has the sources looked at each second, and sleeps while there are none.
class EventClock : public utils::Thread {
  public:
    explicit EventClock(EventTable& table) : m_table(table) {}
    ~EventClock() override {
        requestStop();
        wake();
        shutdown();
    }

    /// There may be a source.
    void wake() noexcept {
        const std::lock_guard lock(m_mutex);
        m_hasSources = true;
        m_changed.notify_all();
    }

    void execute() override {
        std::unique_lock lock(m_mutex);
        while (true) {
            m_changed.wait(lock, [this] { return m_hasSources || isStopRequested(); });
            m_changed.wait_for(lock, std::chrono::seconds(1), [this] { return isStopRequested(); });
            if (isStopRequested()) return;
            m_hasSources = false;  // until one was seen, or comes while the others are looked at
            lock.unlock();
            const bool hasSources = m_table.lookAtAll();
            lock.lock();
            m_hasSources = m_hasSources || hasSources;
        }
    }

  private:
    EventTable& m_table;
    std::mutex m_mutex;
    std::condition_variable m_changed;
    bool m_hasSources = true;
};

EventSource::~EventSource() = default;

void EventSource::join() {
    EventTable::theOne().add(this);
}

void EventSource::leave() noexcept {
    EventTable::theOne().remove(this);
}

EventTable::EventTable() = default;

EventTable::~EventTable() = default;

EventTable& EventTable::theOne() noexcept {
    // Not from the heap: instances leave the table where there is no memory, too.
    alignas(EventTable) static std::array<std::byte, sizeof(EventTable)> place;
    static auto* const table = new (place.data()) EventTable;
    return *table;
}

bool EventTable::isWanted(std::string_view className) const noexcept {
    if (m_listeners == 0) return false;
    const utils::Mutex::AutoLocker lock(m_mutex);
    return std::ranges::any_of(m_interests,
                               [&](const Interest& each) { return sameName(each.className, className); });
}

bool EventTable::addInterest(const std::string& className) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    for (Interest& each : m_interests) {
        if (!sameName(each.className, className)) continue;
        ++each.listeners;
        ++m_listeners;
        return false;
    }
    m_interests.push_back({className, 1});
    ++m_listeners;
    return true;
}

bool EventTable::dropInterest(std::string_view className) noexcept {
    const utils::Mutex::AutoLocker lock(m_mutex);
    const auto found = std::ranges::find_if(
        m_interests, [&](const Interest& each) { return sameName(each.className, className); });
    if (found == m_interests.end()) return false;
    --m_listeners;
    if (--found->listeners > 0) return false;
    m_interests.erase(found);
    return true;
}

void EventTable::startWhereSomebodyListens() {
    const utils::Mutex::AutoLocker calls(m_calls);
    std::vector<std::string> begun;
    {
        const utils::Mutex::AutoLocker lock(m_mutex);
        for (Interest& each : m_interests) {
            if (each.isNew) begun.push_back(each.className);
            each.isNew = false;
        }
    }
    for (EventSource* source : m_sources) {
        const bool isBegun = std::ranges::any_of(
            begun, [&](const std::string& name) { return sameName(name, source->className()); });
        if (isBegun) source->beginTelling();
    }
    if (m_clock != nullptr) return;
    auto clock = std::make_unique<EventClock>(*this);
    clock->start();
    m_clock = std::move(clock);
}

void EventTable::stopWhereNobodyListens() noexcept {
    if (m_listeners != 0) return;
    std::unique_ptr<EventClock> stopped;  // ended outside the lock, which its thread may be waiting for
    const utils::Mutex::AutoLocker calls(m_calls);
    stopped.swap(m_clock);
}

void EventTable::add(EventSource* source) {
    const utils::Mutex::AutoLocker calls(m_calls);
    m_sources.push_back(source);
    if (m_clock != nullptr) m_clock->wake();
}

void EventTable::remove(EventSource* source) noexcept {
    const utils::Mutex::AutoLocker calls(m_calls);
    std::erase(m_sources, source);
}

bool EventTable::lookAtAll() noexcept {
    const utils::Mutex::AutoLocker calls(m_calls);
    for (EventSource* source : m_sources)
        if (isWanted(source->className())) source->look();
    return !m_sources.empty();
}

}  // namespace core
