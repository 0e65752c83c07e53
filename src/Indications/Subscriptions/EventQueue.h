// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <deque>
#include <mutex>
#include <optional>
#include <stop_token>

#include "Framework/Events/EventSink.h"

namespace indications {

/// The events of this process on their way to those who are told of them: whoever has an update running puts
/// them in and goes on. Thread-safe.
class EventQueue : public core::EventSink {
  public:
    /// More than that wait only where nobody takes them any more; the oldest make room.
    static constexpr std::size_t kMost = 20'000;

    void take(const core::InstanceEvent& event) noexcept override;

    /// The oldest, as soon as there is one; nothing when there was none for so long, or stop is requested.
    std::optional<core::InstanceEvent> next(const std::stop_token& stop, std::chrono::milliseconds patience);

  private:
    std::mutex m_mutex;
    std::condition_variable_any m_arrived;
    std::deque<core::InstanceEvent> m_events;
};

}  // namespace indications
