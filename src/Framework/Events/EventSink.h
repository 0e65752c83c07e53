// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

#include "Utils/Export.h"

/// How providers tell a front of what happens to their instances, while somebody listens.
namespace core {

class CimInstance;
struct InstanceValue;

/// A complete copy of an instance. Many may share it.
using InstanceSnapshot = std::shared_ptr<const InstanceValue>;

/// Copies an instance as it is now, all its properties under one lock, in the namespace that the
/// configuration names.
QUENX_EXPORT InstanceSnapshot snapshotOf(CimInstance& instance);

/// What has happened to one instance.
struct InstanceEvent {
    InstanceSnapshot before;  ///< null for an instance that has been created
    InstanceSnapshot after;   ///< null for one that has been deleted
    std::uint64_t time = 0;   ///< when it was seen, microseconds since the Unix epoch
};

/// What takes the events of this process.
class QUENX_EXPORT EventSink {
  public:
    EventSink() = default;
    EventSink(const EventSink&) = delete;
    EventSink& operator=(const EventSink&) = delete;
    virtual ~EventSink();

    /// Takes one event. Called from any thread, the events of one instance in their order and one at a time.
    /// An update waits for it, so it puts the event into a queue of its own and returns. It must not ask the
    /// model, and neither make nor end an EventInterest.
    virtual void take(const InstanceEvent& event) noexcept = 0;

    /// The sink of this process, where somebody listens to instances of this class (compared without regard
    /// to case); null otherwise, and then no event needs to be made. It outlives the providers' requests and
    /// updates.
    static EventSink* wanting(std::string_view className) noexcept;
};

/// Makes a sink the one of this process, as long as this lives.
class QUENX_EXPORT InstalledEventSink {
  public:
    /// @param sink  null for none
    explicit InstalledEventSink(std::shared_ptr<EventSink> sink);
    ~InstalledEventSink();
    InstalledEventSink(const InstalledEventSink&) = delete;
    InstalledEventSink& operator=(const InstalledEventSink&) = delete;

  private:
    const std::shared_ptr<EventSink> m_sink;
};

}  // namespace core
