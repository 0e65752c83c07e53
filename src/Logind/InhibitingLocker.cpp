// SPDX-License-Identifier: Apache-2.0
#include "Logind/InhibitingLocker.h"

#include <exception>
#include <utility>

#include "Utils/Log.h"

namespace logind {

InhibitingLocker::InhibitingLocker(std::string who) : m_who(std::move(who)) {}

InhibitingLocker::~InhibitingLocker() = default;

int InhibitingLocker::Lock() {
    const int result = OSLockerLinux::Lock();
    // Whatever fails here, the adapter is written to: that somebody might shut the machine down is no reason
    // not to begin.
    try {
        const std::lock_guard lock(m_mutex);
        if (m_inhibitor == nullptr)
            m_inhibitor =
                std::make_unique<Inhibitor>(m_who, "The firmware of a network adapter is being written.");
        if (const std::string& problem = m_inhibitor->problem(); !problem.empty())
            QUENX_DEBUG("a shutdown is not held up: %s", problem.c_str());
    } catch (const std::exception& error) {
        QUENX_DEBUG("a shutdown is not held up: %s", error.what());
    }
    return result;
}

int InhibitingLocker::UnLock() {
    {
        const std::lock_guard lock(m_mutex);
        m_inhibitor.reset();
    }
    return OSLockerLinux::UnLock();
}

}  // namespace logind
