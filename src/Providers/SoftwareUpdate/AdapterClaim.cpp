#include "Providers/SoftwareUpdate/AdapterClaim.h"

#include "Providers/SoftwareUpdate/Quenx_ConcreteJob.h"
#include "Providers/SoftwareUpdate/UpdateExceptions.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Utils.h"

AdapterClaim::AdapterClaim(const std::string& adapterName) : m_adapterName(adapterName) {
    std::string holder;
    if (Quenx_ConcreteJob::m_servicedAdapter.compareAndSet(std::string(), adapterName, holder)) return;
    if (holder == adapterName) {
        throw ETargetInUse(
            utils::formatStr("Firmware update for %s is currently in progress", adapterName.c_str()));
    }
    throw EJobIsRunning(utils::formatStr("Other job for %s is running at this moment", holder.c_str()));
}

AdapterClaim::~AdapterClaim() {
    if (m_taken) releaseClaimIfConfigured(m_adapterName);
}

void AdapterClaim::release() noexcept {
    Quenx_ConcreteJob::m_servicedAdapter = std::string();
    m_taken = false;
}

void releaseClaimIfConfigured(const std::string& adapterName) noexcept {
    try {
        if (!utils::AutoSingleton<utils::SMASHv2Config>::getInstance()->getReleaseClaimAfterCheck()) return;
        std::string holder;
        Quenx_ConcreteJob::m_servicedAdapter.compareAndSet(adapterName, std::string(), holder);
    } catch (...) {
        // The claim stays, as it does without the setting.
    }
}
