// SPDX-License-Identifier: Apache-2.0
#include "History/Writer.h"

#include <condition_variable>
#include <cstdint>
#include <deque>
#include <mutex>
#include <thread>

#include "Utils/Log.h"
#include "Utils/Os/Linux/SignalsBlocked.h"

namespace history {

namespace {

using Clock = std::chrono::steady_clock;

constexpr std::size_t kMostTasks = 1000;
constexpr std::chrono::seconds kPatienceAtEnd{10};
constexpr std::chrono::seconds kSecond{1};

}  // namespace

/// Shared with the thread, which may outlive the object.
struct Writer::State {
    std::function<bool()> perSecond;
    std::mutex mutex;
    std::condition_variable changed;
    std::deque<Task> tasks;
    std::uint64_t added = 0;
    std::uint64_t done = 0;
    bool isLate = false;  ///< somebody has waited in vain: until the tasks are done nobody waits again
    bool isStopping = false;
    bool hasEnded = false;
};

Writer::Writer(std::function<bool()> perSecond) : m_state(std::make_shared<State>()) {
    m_state->perSecond = std::move(perSecond);
    const utils::SignalsBlocked blocked;
    std::thread([state = m_state] { work(state); }).detach();
}

Writer::~Writer() {
    std::unique_lock lock(m_state->mutex);
    m_state->isStopping = true;
    m_state->changed.notify_all();
    m_state->changed.wait_for(lock, kPatienceAtEnd, [this] { return m_state->hasEnded; });
}

bool Writer::run(Task task, std::chrono::milliseconds patience) {
    std::unique_lock lock(m_state->mutex);
    if (m_state->tasks.size() >= kMostTasks) return false;
    m_state->tasks.push_back(std::move(task));
    const std::uint64_t number = ++m_state->added;
    m_state->changed.notify_all();
    if (m_state->isLate || patience.count() == 0) return false;
    const bool isDone = m_state->changed.wait_for(lock, patience, [&] { return m_state->done >= number; });
    m_state->isLate = !isDone;
    return isDone;
}

namespace {

/// What comes out of a task, as when memory ends, must not end the process, which may write a flash now: its
/// record is what is lost.
bool guarded(const std::function<bool()>& step) noexcept try {
    return step();
} catch (const std::exception& error) {
    QUENX_ERROR("[history] A step was given up: %s", error.what());
    return true;
}

}  // namespace

void Writer::work(const std::shared_ptr<State>& state) {
    bool isWatching = false;
    Clock::time_point next = Clock::now();
    std::unique_lock lock(state->mutex);
    while (true) {
        const auto hasWork = [&] { return state->isStopping || !state->tasks.empty(); };
        if (!isWatching) {
            state->changed.wait(lock, hasWork);
        } else if (!state->changed.wait_until(lock, next, hasWork) || Clock::now() >= next) {
            // Also while there is always a task: refusals can come without end.
            lock.unlock();
            isWatching = guarded(state->perSecond);
            next = Clock::now() + kSecond;
            lock.lock();
            continue;
        }
        if (state->tasks.empty()) break;
        const Task task = std::move(state->tasks.front());
        state->tasks.pop_front();
        lock.unlock();
        guarded([&] {
            task();
            return true;
        });
        if (!isWatching) next = Clock::now() + kSecond;
        isWatching = true;
        lock.lock();
        ++state->done;
        if (state->tasks.empty()) state->isLate = false;
        state->changed.notify_all();
    }
    // What it holds goes with the object, while somebody waits for that, and not with this thread.
    state->perSecond = nullptr;
    state->hasEnded = true;
    state->changed.notify_all();
}

}  // namespace history
