// SPDX-License-Identifier: Apache-2.0
#include "Cli/Connection/RefusalSink.h"

#include <new>

namespace cli {

std::future<core::ImageFacts> RefusalSink::examine(std::span<const std::uint8_t> file) noexcept {
    return m_next == nullptr ? std::future<core::ImageFacts>() : m_next->examine(file);
}

void RefusalSink::refused(const core::UpdateAttempt& attempt, unsigned int returnValue, core::ReasonId reason,
                          const std::string& text) noexcept {
    if (m_next != nullptr) m_next->refused(attempt, returnValue, reason, text);
    try {
        m_lastReason = text;
    } catch (const std::bad_alloc&) {
        m_lastReason.clear();
    }
}

std::string RefusalSink::problem() {
    return m_next == nullptr ? "QUENX_HISTORY is off" : m_next->problem();
}

std::shared_ptr<core::UpdateRecord> RefusalSink::begin(const core::UpdateAttempt& attempt) noexcept {
    return m_next == nullptr ? nullptr : m_next->begin(attempt);
}

}  // namespace cli
