// SPDX-License-Identifier: Apache-2.0
#include "Indications/Delivery/Queue.h"

#include <limits>

namespace indications {

std::deque<Message>::iterator Queue::firstWaiting() {
    return m_messages.begin() + (m_isUnderWay ? 1 : 0);
}

void Queue::erase(std::deque<Message>::iterator message) {
    m_bytes -= message->body.size();
    m_messages.erase(message);
}

bool Queue::dropOldest() {
    if (firstWaiting() == m_messages.end()) return false;
    erase(firstWaiting());
    ++m_counters.overflow;
    return true;
}

void Queue::add(std::uint64_t tag, const std::function<std::string(const Sequence&)>& body,
                const DeliverySettings& settings) {
    Message message{tag, m_next, body({m_context, m_next}), 0};
    m_bytes += message.body.size();
    m_messages.push_back(std::move(message));
    m_next = m_next == std::numeric_limits<std::int64_t>::max() ? 0 : m_next + 1;
    while ((m_messages.size() > settings.mostWaiting || m_bytes > settings.mostBytes) && dropOldest()) {
    }
}

void Queue::drop(std::uint64_t tag) {
    for (std::size_t i = m_messages.size(); i > (m_isUnderWay ? 1U : 0U); --i) {
        const auto message = m_messages.begin() + static_cast<std::ptrdiff_t>(i - 1);
        if (message->tag == tag) erase(message);
    }
}

std::optional<Clock::time_point> Queue::due() const {
    if (m_messages.empty() || m_isUnderWay) return std::nullopt;
    return m_notBefore;
}

const Message* Queue::begin(Clock::time_point now) {
    const auto time = due();
    if (!time || *time > now) return nullptr;
    m_isUnderWay = true;
    ++m_messages.front().tries;
    return &m_messages.front();
}

void Queue::end(Outcome outcome, const DeliverySettings& settings, Clock::time_point now) {
    m_isUnderWay = false;
    m_isReliable = outcome == Outcome::Taken;
    if (outcome == Outcome::Taken) {
        ++m_counters.delivered;
        m_counters.isFailing = false;
        m_counters.failingFor = {};
        m_notBefore = {};
        erase(m_messages.begin());
        return;
    }
    if (outcome == Outcome::Failed) m_notBefore = now + settings.retryPause;
    // Of a listener that has missed one already, the rest is tried once each: it would hold them up for
    // minutes, one after the other.
    const int tries = m_counters.isFailing ? 1 : settings.retries + 1;
    if (outcome == Outcome::Failed && m_messages.front().tries < tries) return;
    ++m_counters.givenUp;
    if (!m_counters.isFailing) m_failingSince = now;
    m_counters.isFailing = true;
    m_counters.failingFor = now - m_failingSince;
    erase(m_messages.begin());
}

DeliveryCounters Queue::counters() const {
    DeliveryCounters counters = m_counters;
    counters.waiting = m_messages.size();
    return counters;
}

}  // namespace indications
