// SPDX-License-Identifier: Apache-2.0
#include "Host/Authentication/LoginQueue.h"

#include <algorithm>

namespace host {

namespace {

/// Password hashes are made to be costly, so a flood of them is kept to a part of the processors.
constexpr unsigned int kChecksAtATime = 3;
/// One is kept for those who are known, whose checks must not wait for a directory service that hangs.
constexpr unsigned int kChecksOfStrangers = 2;

}  // namespace

LoginQueue::LoginQueue(const LoginPace& pace)
    : m_pace(pace),
      m_places(pace.firstDelay, pace.longestOfPlace),
      m_users(pace.firstDelay, pace.longestOfUser) {}

LoginQueue::Clock::time_point LoginQueue::readyAt(const Attempt& attempt) const {
    if (attempt.isKnown) return Clock::time_point::min();
    return std::max(m_places.nextOf(attempt.place), m_users.nextOf(attempt.user));
}

std::vector<LoginQueue::Waiter*>::iterator LoginQueue::next(Clock::time_point now) {
    // No stranger goes before somebody known who waits: all slots are taken then, and the next one is not
    // theirs.
    const auto isBefore = [&](const Attempt& left, const Attempt& right) {
        return m_places.lastOf(left.place) < m_places.lastOf(right.place);
    };
    auto first = m_waiting.end();
    for (auto each = m_waiting.begin(); each != m_waiting.end(); ++each) {
        const Attempt& attempt = (*each)->attempt;
        const bool hasSlot = m_running < (attempt.isKnown ? kChecksAtATime : kChecksOfStrangers);
        if (!hasSlot || readyAt(attempt) > now) continue;
        if (first == m_waiting.end() || isBefore(attempt, (*first)->attempt)) first = each;
    }
    return first;
}

void LoginQueue::callNext() noexcept {
    const auto now = Clock::now();
    for (auto each = next(now); each != m_waiting.end(); each = next(now)) {
        Waiter& waiter = **each;
        m_waiting.erase(each);
        ++m_running;
        m_places.admitted(waiter.attempt.place, now);
        m_users.admitted(waiter.attempt.user, now);
        waiter.isCalled = true;
        waiter.called.notify_one();
    }
}

/// A failure delays those who could have gone, and only waited for others to be done. Nobody may come any
/// more, so one of them has to see to it that they go.
void LoginQueue::chooseTimekeeper() noexcept {
    const auto first = std::min_element(m_waiting.begin(), m_waiting.end(), [&](auto left, auto right) {
        return readyAt(left->attempt) < readyAt(right->attempt);
    });
    if (first == m_waiting.end()) return;
    (*first)->keepsTime = true;
    (*first)->called.notify_one();
}

bool LoginQueue::enter(const Attempt& attempt, const std::stop_token& stop) {
    std::unique_lock lock(m_mutex);
    Waiter me{attempt};
    m_waiting.push_back(&me);
    callNext();
    const auto givesUp = Clock::now() + m_pace.patience;
    while (!me.isCalled && !stop.stop_requested() && Clock::now() < givesUp) {
        // One that may go and is not called waits for others, who call it when they are done.
        const auto ready = readyAt(attempt);
        const auto until = ready > Clock::now() ? std::min(ready, givesUp) : givesUp;
        me.called.wait_until(lock, stop, until, [&] { return me.isCalled || me.keepsTime; });
        me.keepsTime = false;
        callNext();
    }
    if (!me.isCalled) std::erase(m_waiting, &me);
    chooseTimekeeper();
    return me.isCalled;
}

void LoginQueue::leave() {
    const std::lock_guard lock(m_mutex);
    --m_running;
    callNext();
    chooseTimekeeper();
}

void LoginQueue::succeeded(const Attempt& attempt) {
    // One who did not have to wait says nothing about the others there.
    if (attempt.isKnown) return;
    const std::lock_guard lock(m_mutex);
    m_places.succeeded(attempt.place);
    m_users.succeeded(attempt.user);
}

void LoginQueue::failed(const Attempt& attempt) {
    const std::lock_guard lock(m_mutex);
    const auto now = Clock::now();
    m_places.failed(attempt.place, now);
    m_users.failed(attempt.user, now);
}

LoginQueue::Clock::duration LoginQueue::answerAfter(Clock::duration took) {
    const std::lock_guard lock(m_mutex);
    // A machine that is slow, or under load, needs more than the least: else its known users would stand out.
    constexpr int kMost = 8;
    m_slowest = std::max(m_slowest, took);
    const Clock::duration least = m_pace.leastAnswer;
    return std::clamp(2 * m_slowest, least, kMost * least);
}

}  // namespace host
