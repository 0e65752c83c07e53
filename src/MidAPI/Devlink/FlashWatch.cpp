// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/FlashWatch.h"

#include <linux/devlink.h>

#include <algorithm>
#include <exception>

#include "Utils/Log.h"
#include "Utils/Os/Linux/SignalsBlocked.h"

namespace ma::devlink {
namespace {

constexpr std::uint64_t kMaxBeforeEnd = 99;  // a driver may yet fail after its last byte

}  // namespace

void FlashProgress::report(const FlashStatus& status) {
    std::uint64_t total = status.total;
    std::uint64_t done = std::min(status.done, total);
    if (total > UINT64_MAX / kMaxBeforeEnd) {
        constexpr std::uint64_t kScale = 128;  // what is left fits into 64 bits when multiplied
        total /= kScale;
        done /= kScale;
    }
    if (total > 0) advance(kMaxBeforeEnd * done / total);
}

void FlashProgress::partDone() {
    ++m_done;
    advance(0);
}

void FlashProgress::advance(std::uint64_t percentOfPart) {
    constexpr std::uint64_t kWhole = 100;
    m_progress.advance(static_cast<std::uint16_t>((kWhole * m_done + percentOfPart) / m_parts));
}

FlashWatch::FlashWatch(Machine& machine, const Family& family, std::string address,
                       std::function<void(const FlashStatus&)> onStatus)
    : m_notifications(machine, family), m_address(std::move(address)), m_onStatus(std::move(onStatus)) {
    const utils::SignalsBlocked blocked;
    m_thread = std::thread([this] { run(); });
}

void FlashWatch::finish() {
    m_isAnswered = true;
    if (m_thread.joinable()) m_thread.join();
}

void FlashWatch::run() noexcept {
    try {
        while (readOn()) {
        }
    } catch (const std::exception& error) {
        // The flash goes on; only nobody sees how far it is.
        QUENX_ERROR("adapter %s: the progress of the update cannot be read: %s", m_address.c_str(),
                    error.what());
    }
}

bool FlashWatch::readOn() {
    using Clock = std::chrono::steady_clock;
    constexpr std::chrono::milliseconds kSilence{200};
    constexpr std::chrono::seconds kLongest{1};  // others may have more to tell than this flash
    // Looked at first: what was told before the answer is then waited for, although it comes by another way.
    const bool isAnswered = m_isAnswered;
    if (isAnswered && !m_end) m_end = Clock::now() + kLongest;
    const auto batch = m_notifications.next(kSilence);
    if (isAnswered && (!batch || Clock::now() > *m_end)) return false;
    if (!batch) return true;
    for (const Notification& message : batch->messages) {
        if (message.device != m_address) continue;
        if (message.command == DEVLINK_CMD_FLASH_UPDATE) m_isEnded = false;
        if (message.command == DEVLINK_CMD_FLASH_UPDATE_END) m_isEnded = true;
        if (message.command != DEVLINK_CMD_FLASH_UPDATE_STATUS) continue;
        if (!message.status.text.empty()) m_lastText = message.status.text;
        m_onStatus(message.status);
    }
    return !(m_isEnded && m_isAnswered);
}

}  // namespace ma::devlink
