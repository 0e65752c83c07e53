// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <cstdint>
#include <string>

#include "Utils/Os/Linux/Thread.h"

class Quenx_ConcreteJob;

/// The worker of one job: writes the prepared image to the adapter. A flash that has begun always runs to its
/// end.
class JobThread : public utils::Thread {
  public:
    /// The job outlives the worker. Throws the assertion for a null pointer.
    explicit JobThread(Quenx_ConcreteJob* job);
    /// Waits until a worker that has been started ends, however long its flash takes.
    ~JobThread() override;

    void execute() override;
    /// Notes the wish to stop, which nothing reads.
    virtual void stopFwUpdateExecution();

    /// Throws utils::Exception when the system refuses a thread; the worker counts as started all the same.
    void start();
    /// True once the worker is done with its job and may be destroyed.
    bool isExecuted() const { return m_executed == true; }
    /// Waits up to `timeout` ms for the worker, in steps of 50. Nothing stops a flash. With a time-out that
    /// is a multiple of 50 the result is always true, even when the worker is still running.
    bool terminate(int timeout);

    /// Executions begun since the library was loaded.
    static std::atomic<std::int32_t> executionCount;

  private:
    bool waitForEnd(int timeout) const;
    bool flash();
    void resetBootType(const std::string& adapterName);

    Quenx_ConcreteJob* m_myJob;
    utils::Atomic<bool> m_executed;
    utils::Atomic<bool> m_stopRequested;
    utils::Atomic<bool> m_started;
};
