// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/DeniedUpdates.h"

#include <algorithm>
#include <limits>
#include <string_view>

#include "Framework/Model/CimError.h"
#include "Framework/Requests/PolicyDecision.h"
#include "Framework/Requests/UpdateSink.h"
#include "Utils/Os/Linux/Mutex.h"
#include "Utils/Os/Linux/linux.h"

namespace core {

namespace {

/// Of CIM_SoftwareInstallationService (DSP1025, clause 8).
constexpr std::string_view kInstalling[] = {"InstallFromSoftwareIdentity", "InstallFromURI"};

/// Leave to tell, which grows again with time.
class Allowance {
  public:
    bool take() {
        constexpr std::uint64_t kMinute = 60'000'000;
        const utils::Mutex::AutoLocker lock(m_mutex);
        const std::uint64_t now = os::getMonotonicuSeconds();
        const std::uint64_t grown = (now - m_since) / kMinute;
        m_left = std::min(kAtOnce, m_left + grown);
        m_since += grown * kMinute;
        if (m_left == 0) return false;
        --m_left;
        return true;
    }

  private:
    static constexpr std::uint64_t kAtOnce = 10;

    utils::Mutex m_mutex;
    std::uint64_t m_left QUENX_GUARDED_BY(m_mutex) = kAtOnce;
    std::uint64_t m_since QUENX_GUARDED_BY(m_mutex) = os::getMonotonicuSeconds();
};

std::string textOf(const std::vector<Argument>& arguments, std::string_view name) {
    const Argument* const found = findByName(arguments, name);
    constexpr std::size_t kMost = 2000;
    return found == nullptr || found->value.isNull() ? "" : valueText(found->value, kMost);
}

UpdateAttempt attemptOf(const std::vector<Argument>& arguments) {
    UpdateAttempt attempt;
    attempt.caller = CallerScope::current();
    attempt.time = os::getuSecondsSinceEpoch();
    attempt.monotonic = os::getMonotonicuSeconds();
    attempt.uri = textOf(arguments, "URI");
    attempt.target = textOf(arguments, "Target");
    return attempt;
}

}  // namespace

void tellOfDenied(const std::string& method, const std::vector<Argument>& arguments, ReasonId reason,
                  const std::string& text) noexcept try {
    UpdateSink* const sink = UpdateSink::installed();
    const bool installs =
        std::ranges::any_of(kInstalling, [&](std::string_view each) { return sameName(each, method); });
    if (sink == nullptr || !installs) return;
    UpdateAttempt attempt = attemptOf(arguments);
    try {
        const PolicyDecision looked(PolicyDecision::Aim::Look);
        if (PolicyDecision::policy().history == utils::HistoryRule::Off) return;
        attempt.mostRecords = PolicyDecision::policy().historyRecords;
    } catch (const CimError&) {
        // Of a policy that cannot be obeyed nothing is known, so the record is kept, and removes no other.
        attempt.mostRecords = std::numeric_limits<std::int64_t>::max();
    }
    // Those who may only read must not use up what is there for administrators.
    static Allowance ofReaders;
    static Allowance ofOthers;
    Allowance& allowance = attempt.caller.isAdministrator ? ofOthers : ofReaders;
    if (allowance.take()) sink->refused(attempt, 0, reason, text);
} catch (const std::exception&) {
    // What there is no memory for is left out, and nobody's answer depends on a record.
}

}  // namespace core
