// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>

#include "Utils/Export.h"
#include "Utils/Singleton.h"

namespace os {

/// The lock around work on adapters, shared by everything in the process that works on them. The hosting
/// process constructs one, an OSLockerLinux or one of its own, and the current one serves all libraries.
///
/// It is advisory. Who may write is decided by the adapter claim, and between processes by the adapter's own
/// lock; the locker only tells other code of the host, which asks it by Lock(), that somebody is at work.
class QUENX_EXPORT OSLocker : public utils::Singleton<OSLocker> {
  public:
    class AutoOSLocker;

    OSLocker();
    ~OSLocker() override;

    /// 0 when taken, 2 at once when busy.
    virtual int Lock() = 0;
    /// Frees it, whoever holds it; 0.
    virtual int UnLock() = 0;

    static const char* GetSingletonName() { return "OSLocker"; }
};

/// Holds the current locker for a scope. A busy one does not stop it, since the lock is advisory, a missing
/// one does. The scope does not keep the answer of Lock(), so its end frees the locker also when it had found
/// it busy: nothing that must be safe may rest on holding it. If the locker is gone at the end of the scope,
/// that is logged and nothing else happens.
class QUENX_EXPORT OSLocker::AutoOSLocker {
  public:
    /// @throws utils::Exception "No singleton instance found for OSLocker"
    AutoOSLocker();
    ~AutoOSLocker();
    AutoOSLocker(const AutoOSLocker&) = delete;
    AutoOSLocker& operator=(const AutoOSLocker&) = delete;
};

/// The locker of one process.
class QUENX_EXPORT OSLockerLinux : public OSLocker {
  public:
    OSLockerLinux();
    ~OSLockerLinux() override;
    int Lock() override;
    int UnLock() override;

  private:
    std::atomic<bool> m_busy{false};
};

}  // namespace os

extern template class utils::Singleton<os::OSLocker>;
