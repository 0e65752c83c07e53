// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <functional>
#include <memory>

namespace history {

/// Runs tasks on a thread of its own, one after the other, so that a disk that does not answer holds up
/// nobody else. Thread-safe. Tasks let no exception out.
class Writer {
  public:
    using Task = std::function<void()>;

    /// @param perSecond  run about once a second while there is something to watch; says whether there still
    ///                   is
    /// @param gathered   run some time after gather()
    Writer(std::function<bool()> perSecond, Task gathered);
    /// Waits for the tasks, but not for one that hangs: the thread is then left to itself, with what the
    /// tasks share.
    ~Writer();
    Writer(const Writer&) = delete;
    Writer& operator=(const Writer&) = delete;

    /// Runs the task, and waits for its end, at most so long. A task that is not waited for runs
    /// later all the same, unless too many have piled up behind one that hangs.
    /// @return whether it has ended
    bool run(Task task, std::chrono::milliseconds patience);
    /// Runs what is gathered, once for all who ask within a few milliseconds. Waits for nothing. What is
    /// asked for shortly before the end may not run any more.
    void gather();

  private:
    struct State;
    static void work(const std::shared_ptr<State>& state);

    const std::shared_ptr<State> m_state;
};

}  // namespace history
