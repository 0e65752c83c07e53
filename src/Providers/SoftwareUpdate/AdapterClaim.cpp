// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/AdapterClaim.h"

#include "Framework/Requests/NotedCall.h"
#include "Framework/Requests/PolicyDecision.h"
#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Utils.h"

namespace {

using Id = core::ReasonId;

/// What is known of the newest claim. It may be over: that the adapter is serviced, only its name says.
struct Note {
    utils::Mutex mutex;
    update::Claim claim QUENX_GUARDED_BY(mutex);
    std::uint64_t number QUENX_GUARDED_BY(mutex) = 0;
};
// As early and as late as the name of the adapter.
__attribute__((init_priority(1000))) Note newest;

/// Frees the adapter unless another one is serviced, and forgets who had it.
bool freeAdapter(AdapterClaim::Serviced& serviced, const std::string& adapterName)
    QUENX_REQUIRES(newest.mutex) {
    std::string holder;
    if (!serviced.compareAndSet(adapterName, std::string(), holder)) return false;
    const update::Claim ended = std::exchange(newest.claim, {});
    return true;
}

bool givesBackAfterCheck() {
    const utils::Policy& policy = core::PolicyDecision::policy();
    if (policy.releaseClaimAfterCheck) return *policy.releaseClaimAfterCheck;
    return utils::AutoSingleton<utils::SMASHv2Config>::getInstance()->getReleaseClaimAfterCheck();
}

}  // namespace

void AdapterClaim::take(std::string adapterName) {
    bool isLeft = false;
    update::Claim claim{adapterName, core::CallerScope::current().principal, {}, {}, true};
    std::string holder;
    {
        // Whoever looks meanwhile sees the adapter together with who has it.
        const utils::Mutex::AutoLocker lock(newest.mutex);
        // One step, so that of two requests that arrive together only one finds the adapter free.
        if (m_serviced->compareAndSet(std::string(), adapterName, holder)) {
            std::swap(newest.claim, claim);
            m_number = ++newest.number;
            m_adapterName = std::move(adapterName);
            return;
        }
        isLeft = newest.claim.adapter == holder && !newest.claim.isAtWork;
    }
    if (holder == adapterName) {
        core::NotedCall::noteReason(isLeft ? Id::AdapterHeldByCheck : Id::AdapterUpdating);
        throw ETargetInUse(
            utils::formatStr("Firmware update for %s is currently in progress", adapterName.c_str()));
    }
    core::NotedCall::noteReason(isLeft ? Id::OtherAdapterHeldByCheck : Id::OtherAdapterUpdating);
    throw EJobIsRunning(utils::formatStr("Other job for %s is running at this moment", holder.c_str()));
}

void AdapterClaim::passTo(std::string job) noexcept {
    const utils::Mutex::AutoLocker lock(newest.mutex);
    if (newest.number == m_number) newest.claim.job.swap(job);
}

void AdapterClaim::leave() noexcept {
    if (m_adapterName.empty()) return;
    m_adapterName.clear();
    const utils::Mutex::AutoLocker lock(newest.mutex);
    if (newest.number == m_number) newest.claim.isAtWork = false;
}

void AdapterClaim::release() noexcept {
    *m_serviced = std::string();
    m_adapterName.clear();
    const utils::Mutex::AutoLocker lock(newest.mutex);
    // The next one may have come by already.
    if (newest.number != m_number) return;
    const update::Claim ended = std::exchange(newest.claim, {});
}

void AdapterClaim::releaseIfConfigured() noexcept {
    // Once released, another request may have taken the same adapter.
    if (!m_adapterName.empty()) releaseIfConfigured(*m_serviced, m_adapterName);
    leave();
}

void AdapterClaim::releaseIfConfigured(Serviced& serviced, const std::string& adapterName) noexcept {
    try {
        if (!givesBackAfterCheck()) return;
        const utils::Mutex::AutoLocker lock(newest.mutex);
        freeAdapter(serviced, adapterName);
    } catch (...) {
        // The claim stays, as it does without the setting.
    }
}

update::Claim AdapterClaim::current(const Serviced& serviced) {
    const utils::Mutex::AutoLocker lock(newest.mutex);
    const std::string adapter = serviced.get();
    if (adapter == newest.claim.adapter) return newest.claim;
    // Free, or taken by a test.
    return {.adapter = adapter};
}

update::ClaimRelease AdapterClaim::releaseLeft(Serviced& serviced, const std::string& adapterName) {
    const utils::Mutex::AutoLocker lock(newest.mutex);
    if (newest.claim.adapter == adapterName && newest.claim.isAtWork && serviced == adapterName)
        return update::ClaimRelease::AtWork;
    return !adapterName.empty() && freeAdapter(serviced, adapterName) ? update::ClaimRelease::Freed
                                                                      : update::ClaimRelease::NotHeld;
}
