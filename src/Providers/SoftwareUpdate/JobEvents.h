// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>

#include "Framework/Events/EventSink.h"
#include "Framework/Events/EventSource.h"
#include "Utils/Os/Linux/Mutex.h"

class Quenx_ConcreteJob;

/// What is told of one job to those who listen: that it was created, each change of its state or progress,
/// that it was deleted. Each change is told with the job as it was told last and as it is now, so none is
/// lost between two. A listener that cannot be told for want of memory learns of it with the next change.
///
/// Nothing is told before created() and after the deletion. Thread-safe; never called under a lock of the
/// job's.
class JobEvents : private core::EventSource {
  public:
    /// @param job  owns this
    explicit JobEvents(Quenx_ConcreteJob& job);
    ~JobEvents() override;

    /// The job is listed, and starts when this returns.
    void created() noexcept;
    /// It may have another state.
    void changed() noexcept;
    /// The same for the last time.
    void ended() noexcept;

    /// Deletes the job within its scope: looks at it before, and tells of it after.
    class Deletion {
      public:
        explicit Deletion(JobEvents& events) noexcept;
        ~Deletion();
        Deletion(const Deletion&) = delete;
        Deletion& operator=(const Deletion&) = delete;

      private:
        JobEvents& m_events;
        core::InstanceSnapshot m_last;
    };

  private:
    enum class Stage { Untold, Told, Deleted };

    void beginTelling() noexcept override;
    void look() noexcept override { changed(); }

    core::EventSink* sink() const noexcept;
    /// The job as it is now; null for want of memory.
    core::InstanceSnapshot snapshot() const noexcept;

    Quenx_ConcreteJob& m_job;
    utils::Mutex m_mutex;  ///< keeps the events in their order; held while the sink takes one
    Stage m_stage QUENX_GUARDED_BY(m_mutex) = Stage::Untold;
    core::InstanceSnapshot m_told QUENX_GUARDED_BY(m_mutex);  ///< as those who listen know it; null at first
};
