// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <new>

#include "Host/Authentication/LoginQueue.h"

namespace host {

namespace {

constexpr std::size_t kMaxRecords = 4096;
constexpr std::chrono::minutes kForgetAfter{15};

}  // namespace

FailureDelays::Clock::duration FailureDelays::delayAfter(unsigned int failures) const {
    if (failures == 0) return Clock::duration::zero();
    return std::min(m_longest, m_first * (1 << std::min(failures - 1, 10U)));
}

FailureDelays::Clock::time_point FailureDelays::nextOf(const std::string& key) const {
    const auto found = m_records.find(key);
    return found == m_records.end() ? Clock::time_point::min() : found->second.next;
}

FailureDelays::Clock::time_point FailureDelays::lastOf(const std::string& key) const {
    const auto found = m_records.find(key);
    return found == m_records.end() ? Clock::time_point::min() : found->second.last;
}

FailureDelays::Record* FailureDelays::recordOf(const std::string& key, Clock::time_point now) noexcept try {
    std::erase_if(m_records, [&](const auto& each) { return now - each.second.last > kForgetAfter; });
    // An attacker with many addresses must not cost memory; the one quiet for longest matters least.
    if (m_records.size() >= kMaxRecords && !m_records.contains(key)) {
        m_records.erase(
            std::min_element(m_records.begin(), m_records.end(),
                             [](const auto& a, const auto& b) { return a.second.last < b.second.last; }));
    }
    Record& record = m_records[key];
    record.last = now;
    return &record;
} catch (const std::bad_alloc&) {
    return nullptr;
}

void FailureDelays::admitted(const std::string& key, Clock::time_point now) noexcept {
    // Those that wait take turns, so the next one waits as if this had failed already.
    if (Record* record = recordOf(key, now)) record->next = now + delayAfter(record->failures);
}

void FailureDelays::failed(const std::string& key, Clock::time_point now) noexcept {
    Record* record = recordOf(key, now);
    if (record == nullptr) return;
    ++record->failures;
    record->next = std::max(record->next, now + delayAfter(record->failures));
}

void FailureDelays::succeeded(const std::string& key) {
    m_records.erase(key);
}

}  // namespace host
