// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/AdapterClaim.h"

#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Utils.h"

void AdapterClaim::take(std::string adapterName) {
    std::string holder;
    // One step, so that of two requests that arrive together only one finds the adapter free.
    if (m_serviced->compareAndSet(std::string(), adapterName, holder)) {
        m_adapterName = std::move(adapterName);
        return;
    }
    if (holder == adapterName) {
        throw ETargetInUse(
            utils::formatStr("Firmware update for %s is currently in progress", adapterName.c_str()));
    }
    throw EJobIsRunning(utils::formatStr("Other job for %s is running at this moment", holder.c_str()));
}

void AdapterClaim::release() noexcept {
    *m_serviced = std::string();
    m_adapterName.clear();
}

void AdapterClaim::releaseIfConfigured() noexcept {
    // Once released, another request may have taken the same adapter.
    if (!m_adapterName.empty()) releaseIfConfigured(*m_serviced, m_adapterName);
    m_adapterName.clear();
}

void AdapterClaim::releaseIfConfigured(utils::Atomic<std::string>& serviced,
                                       const std::string& adapterName) noexcept {
    try {
        if (!utils::AutoSingleton<utils::SMASHv2Config>::getInstance()->getReleaseClaimAfterCheck()) return;
        std::string holder;
        serviced.compareAndSet(adapterName, std::string(), holder);
    } catch (...) {
        // The claim stays, as it does without the setting.
    }
}
