// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <exception>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "Framework/Model/CimValue.h"
#include "Framework/Requests/NotedCall.h"
#include "Framework/Requests/UpdateSink.h"
#include "Providers/SoftwareUpdate/ImageVerification.h"

class Quenx_ConcreteJob;

/// A message of utils::Exception without "SMASHv2:EInvalidUri:", which is for those who search the log.
std::string withoutNames(std::string_view text);

/// What the front's sink is told of one call that installs: collected on the call's thread, and told when the
/// update begins or the call is answered. Without a sink nothing is collected.
class UpdateReport {
  public:
    UpdateReport();
    ~UpdateReport();
    UpdateReport(const UpdateReport&) = delete;
    UpdateReport& operator=(const UpdateReport&) = delete;

    /// The method returns this, or ends in an error; tells of a refusal.
    void answered(unsigned int returnValue) noexcept;
    void failed(const char* error) noexcept;

    // What others on the way learn. Outside a call that installs, these do no more than to note it for the
    // front. What there is no memory for is left out.

    static void noteOrder(const UpdateOrder& order, const core::CimPath& target) noexcept;
    /// Why the call is refused, in words that name what is wrong; the first counts. With its row in the
    /// table, where that is not known yet: what throws an exception leaves the words to that.
    static void noteReason(std::string_view text) noexcept;
    static void noteReason(core::ReasonId id, std::string_view text) noexcept {
        core::NotedCall::noteReason(id);
        noteReason(text);
    }
    /// The key by which the image is trusted.
    static void noteKey(const std::string& key) noexcept;
    /// Looks at the bytes of an image while a scope prepares it.
    class Examination {
      public:
        explicit Examination(std::span<const std::uint8_t> file);
        /// Waits for the result.
        ~Examination();
        Examination(const Examination&) = delete;
        Examination& operator=(const Examination&) = delete;

      private:
        std::future<core::ImageFacts> m_facts;
    };
    /// The job is about to start, and gets its record, outside a call or without a sink none. False where
    /// the policy requires one that cannot be written: the job must not start.
    static bool begin(Quenx_ConcreteJob& job);
    /// Whether the policy lets an update begin: not where it requires a history that cannot be written. The
    /// log has the reason then.
    static bool mayBegin();

  private:
    void tell(unsigned int returnValue) noexcept;

    core::UpdateSink* const m_sink;
    core::UpdateAttempt m_attempt;
    const core::NotedCall m_noted;
    std::string m_reason;
    bool m_hasBegun = false;
};

/// Carries out a call that installs, and reports it.
template <class Call>
unsigned int reported(Call&& call) {
    UpdateReport report;
    try {
        const unsigned int returnValue = call();
        report.answered(returnValue);
        return returnValue;
    } catch (const std::exception& error) {
        report.failed(error.what());
        throw;
    }
}
