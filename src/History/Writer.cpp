// SPDX-License-Identifier: Apache-2.0
#include "History/Writer.h"

#include <algorithm>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <mutex>
#include <optional>
#include <thread>

#include "Utils/Log.h"
#include "Utils/Os/Linux/SignalsBlocked.h"

namespace history {

namespace {

using Clock = std::chrono::steady_clock;

constexpr std::size_t kMostTasks = 1000;
constexpr std::chrono::seconds kPatienceAtEnd{10};
constexpr std::chrono::seconds kSecond{1};
// One change of the file costs about the same for one record and for many.
constexpr std::chrono::milliseconds kGathering{20};

}  // namespace

/// Shared with the thread, which may outlive the object.
struct Writer::State {
    std::function<bool()> perSecond;
    Task gathered;
    std::mutex mutex;
    std::condition_variable changed;
    std::deque<Task> tasks;
    std::optional<Clock::time_point> gatheredAt;  ///< when that is to run; none when nobody has asked
    std::uint64_t added = 0;
    std::uint64_t done = 0;
    bool isLate = false;  ///< somebody has waited in vain: until the tasks are done nobody waits again
    bool isStopping = false;
    bool hasEnded = false;
};

Writer::Writer(std::function<bool()> perSecond, Task gathered) : m_state(std::make_shared<State>()) {
    m_state->perSecond = std::move(perSecond);
    m_state->gathered = std::move(gathered);
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

void Writer::gather() {
    const std::lock_guard lock(m_state->mutex);
    if (m_state->gatheredAt) return;
    m_state->gatheredAt = Clock::now() + kGathering;
    m_state->changed.notify_all();
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
    constexpr auto kNever = Clock::time_point::max();
    Clock::time_point watchAt = kNever;
    std::unique_lock lock(state->mutex);
    const auto perform = [&](const std::function<bool()>& step) {
        lock.unlock();
        const bool result = guarded(step);
        lock.lock();
        return result;
    };
    const auto performTask = [&](const Task& task) {
        perform([&] {
            task();
            return true;
        });
        watchAt = std::min(watchAt, Clock::now() + kSecond);
    };
    while (true) {
        const Clock::time_point now = Clock::now();
        const Clock::time_point gatherAt = state->gatheredAt.value_or(kNever);
        if (watchAt <= now) {
            // Also while there is always a task: refusals can come without end.
            watchAt = perform(state->perSecond) ? Clock::now() + kSecond : kNever;
        } else if (gatherAt <= now) {
            state->gatheredAt.reset();
            performTask(state->gathered);
            // What came meanwhile waits for the next time, so that tasks have their turn in between.
            if (state->gatheredAt) state->gatheredAt = Clock::now() + kGathering;
        } else if (!state->tasks.empty()) {
            const Task task = std::move(state->tasks.front());
            state->tasks.pop_front();
            performTask(task);
            ++state->done;
            if (state->tasks.empty()) state->isLate = false;
            state->changed.notify_all();
        } else if (state->isStopping) {
            break;
        } else if (const auto next = std::min(watchAt, gatherAt); next == kNever) {
            state->changed.wait(lock);
        } else {
            state->changed.wait_until(lock, next);
        }
    }
    // What they hold goes with the object, while somebody waits for that, and not with this thread.
    state->perSecond = nullptr;
    state->gathered = nullptr;
    state->hasEnded = true;
    state->changed.notify_all();
}

}  // namespace history
