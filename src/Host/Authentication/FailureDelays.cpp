// SPDX-License-Identifier: Apache-2.0
#include <arpa/inet.h>

#include <algorithm>
#include <array>

#include "Host/Authentication/Authentication.h"

namespace host {

namespace {

using std::chrono::milliseconds;
using std::chrono::minutes;
using std::chrono::seconds;

constexpr std::size_t kMaxRecords = 4096;
constexpr milliseconds kFirstDelay{100};
constexpr milliseconds kLongestDelay{5000};
constexpr seconds kLongestWait{10};
constexpr minutes kForgetAfter{15};

}  // namespace

std::string FailureDelays::keyOf(const std::string& address) {
    // One host has 2^64 addresses of its network to guess from.
    std::array<char, sizeof(in6_addr)> bytes{};
    if (::inet_pton(AF_INET6, address.c_str(), bytes.data()) != 1) return address;
    return {bytes.data(), 8};
}

FailureDelays::Clock::duration FailureDelays::delayAfter(unsigned int failures) {
    return std::min(kLongestDelay, kFirstDelay * (1 << std::min(failures - 1, 10U)));
}

std::optional<FailureDelays::Clock::time_point> FailureDelays::admit(const std::string& address,
                                                                     Clock::time_point now) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    const auto found = m_records.find(keyOf(address));
    if (found == m_records.end()) return now;
    Record& record = found->second;
    const Clock::time_point turn = std::max(now, record.next);
    // Each that waits holds a connection's thread, so a queue may not grow without end.
    if (turn - now > kLongestWait) return std::nullopt;
    record.next = turn + delayAfter(record.failures);
    return turn;
}

void FailureDelays::failed(const std::string& address, Clock::time_point now) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    std::erase_if(m_records, [&](const auto& each) { return now - each.second.last > kForgetAfter; });
    // An attacker with many addresses must not cost memory; the one quiet for longest matters least.
    if (m_records.size() >= kMaxRecords) {
        m_records.erase(
            std::min_element(m_records.begin(), m_records.end(),
                             [](const auto& a, const auto& b) { return a.second.last < b.second.last; }));
    }
    Record& record = m_records[keyOf(address)];
    ++record.failures;
    record.last = now;
    record.next = std::max(record.next, now + delayAfter(record.failures));
}

void FailureDelays::succeeded(const std::string& address) {
    const utils::Mutex::AutoLocker lock(m_mutex);
    m_records.erase(keyOf(address));
}

}  // namespace host
