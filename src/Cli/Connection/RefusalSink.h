// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>
#include <utility>

#include "Framework/Requests/UpdateSink.h"

namespace cli {

/// Passes on what the providers of this process tell of updates, and remembers why the last one was refused.
/// For the one thread that asks them.
class RefusalSink : public core::UpdateSink {
  public:
    /// @param next  who keeps it; null for nobody
    explicit RefusalSink(std::shared_ptr<core::UpdateSink> next) : m_next(std::move(next)) {}

    std::future<core::ImageFacts> examine(std::span<const std::uint8_t> file) noexcept override;
    void refused(const core::UpdateAttempt& attempt, unsigned int returnValue, core::ReasonId reason,
                 const std::string& text) noexcept override;
    std::string problem() override;
    std::shared_ptr<core::UpdateRecord> begin(const core::UpdateAttempt& attempt) noexcept override;

    /// In the provider's words; empty where nothing was refused.
    const std::string& lastReason() const { return m_lastReason; }

  private:
    const std::shared_ptr<core::UpdateSink> m_next;
    std::string m_lastReason;
};

}  // namespace cli
