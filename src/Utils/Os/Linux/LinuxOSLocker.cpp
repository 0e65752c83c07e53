// SPDX-License-Identifier: Apache-2.0
#include "Utils/Os/Linux/LinuxOSLocker.h"

#include "Utils/Log.h"

// The one instantiation of the process: every library finds the same current locker.
template class utils::Singleton<os::OSLocker>;

namespace os {

namespace {

constexpr int kTaken = 0;
constexpr int kBusy = 2;

}  // namespace

OSLocker::OSLocker() = default;
OSLocker::~OSLocker() = default;

OSLocker::AutoOSLocker::AutoOSLocker() {
    QUENX_DEBUG("autolocking semaphore");
    // The lock is advisory: the worker owns its adapter through the claim, and must not fail because another
    // library is busy with some other adapter.
    OSLocker::getInstance()->Lock();
}

OSLocker::AutoOSLocker::~AutoOSLocker() {
    QUENX_DEBUG("autoreleasing semaphore");
    try {
        OSLocker::getInstance()->UnLock();
    } catch (...) {
        // A locker that is gone has logged that itself, as every failure; there is nothing left to release.
    }
}

OSLockerLinux::OSLockerLinux() = default;
OSLockerLinux::~OSLockerLinux() = default;

int OSLockerLinux::Lock() {
    // One step: of two callers at once only one may be told that the locker was free.
    return m_busy.exchange(true) ? kBusy : kTaken;
}

int OSLockerLinux::UnLock() {
    m_busy.store(false);
    return 0;
}

}  // namespace os
