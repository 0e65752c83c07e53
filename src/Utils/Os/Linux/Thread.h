// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <pthread.h>

#include <memory>

#include "Utils/Export.h"
#include "Utils/Os/Linux/Mutex.h"

namespace utils {

/// The private state of one thread.
struct IntThreadData {
    pthread_t handle{};
    Atomic<bool> inExecute;      ///< true while execute() runs
    Atomic<bool> stopRequested;  ///< true once the thread shall end
    Atomic<bool> started;        ///< true once there is a thread to join
    unsigned int forks = 0;      ///< os::forkCount() where it was started
};

/// The base of a thread. The derived class supplies execute(), which polls isStopRequested() if it can end
/// early. Every class that overrides execute() calls shutdown() as the last statement of its destructor: only
/// so does the body end before the fields that it uses.
class QUENX_EXPORT Thread {
  public:
    Thread();
    virtual ~Thread();
    Thread(const Thread&) = delete;
    Thread& operator=(const Thread&) = delete;

    /// The body, on the new thread. An exception that leaves it is logged and ends the thread.
    virtual void execute() = 0;

    /// Starts the thread, once. @throws Exception "Could not start thread %p. Error %d" with an errno value
    void start();

    /// Sleeps for so many milliseconds, signals or not.
    static void msleep(unsigned int milliseconds);

    /// Says for a scope that the calling thread waits until other threads have destroyed some objects. At the
    /// end of a process that thread may itself be one whose object is destroyed: then nobody joins it.
    class QUENX_EXPORT Waiting {
      public:
        Waiting() noexcept;
        ~Waiting();
        Waiting(const Waiting&) = delete;
        Waiting& operator=(const Waiting&) = delete;
    };

  protected:
    /// False in a child of the process that started the thread: a fork takes the calling thread alone.
    bool isInThisProcess() const noexcept;

    /// Sets the stop flag. A thread whose flag is set before it begins never calls execute().
    void requestStop() noexcept;
    bool isStopRequested() const noexcept;

    /// The end of the thread, done once: sets the stop flag, gives a body that still runs up to 300 ms, then
    /// joins it however long it takes. The destructor calls it for a class that did not.
    void shutdown() noexcept;

  private:
    friend QUENX_EXPORT void* thread_entry(void* thread);

    void join() noexcept;

    // Shared with the running thread alone, so that its last step never touches freed memory.
    std::shared_ptr<IntThreadData> m_data;
};

/// The start routine of every Thread, which is its argument. Returns null.
QUENX_EXPORT void* thread_entry(void* thread);

}  // namespace utils
