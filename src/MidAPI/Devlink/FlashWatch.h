// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <thread>

#include "MidAPI/Devlink/DevlinkConnection.h"
#include "MidAPI/Devlink/Machine.h"
#include "MidAPI/Progress.h"
#include "Utils/Export.h"

namespace ma::devlink {

/// Makes one percentage of what a driver tells during the flashes of an update. Drivers count each of their
/// steps from 0; the percentage never goes back, and is below 100 until the update is done. One thread at a
/// time.
class QUENX_EXPORT FlashProgress {
  public:
    /// @param parts  how many flashes the update has, each an equal part of the whole
    FlashProgress(Progress& progress, std::size_t parts) : m_progress(progress), m_parts(parts) {}

    void report(const FlashStatus& status);
    void partDone();

  private:
    void advance(std::uint64_t percentOfPart);

    Progress& m_progress;
    const std::size_t m_parts;
    std::size_t m_done = 0;
};

/// Follows one flash by what the kernel tells everybody, on a thread of its own, since the request for the
/// flash blocks until it is over. What it reads is for people alone: how a flash ended is told by the answer
/// to the request.
class QUENX_EXPORT FlashWatch {
  public:
    /// Listens from now on. @throws std::system_error when it cannot
    /// @param onStatus  called on the watch's thread; must not throw
    FlashWatch(Machine& machine, const Family& family, std::string address,
               std::function<void(const FlashStatus&)> onStatus);
    FlashWatch(const FlashWatch&) = delete;
    FlashWatch& operator=(const FlashWatch&) = delete;
    ~FlashWatch() { finish(); }

    /// The request was answered: returns when all that was told of the flash is read, which takes a second at
    /// most where its end was not told.
    void finish();

    /// After finish(): the driver's last words; empty when it had none.
    const std::string& lastText() const { return m_lastText; }

  private:
    void run() noexcept;
    bool readOn();

    Notifications m_notifications;
    const std::string m_address;
    const std::function<void(const FlashStatus&)> m_onStatus;
    std::string m_lastText;
    std::atomic<bool> m_isAnswered{false};
    bool m_isEnded = false;
    std::optional<std::chrono::steady_clock::time_point> m_end;  ///< when to give up; once it is answered
    std::thread m_thread;
};

}  // namespace ma::devlink
