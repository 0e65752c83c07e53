// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <mutex>
#include <string>

#include "Logind/Inhibitor.h"
#include "Utils/Os/Linux/LinuxOSLocker.h"

namespace logind {

/// The lock around work on adapters, under which the machine is not shut down. Thread-safe. See
/// core::ProviderSession::workUnder().
class InhibitingLocker : public os::OSLockerLinux {
  public:
    /// @param who  the program, for people
    explicit InhibitingLocker(std::string who);
    ~InhibitingLocker() override;

    int Lock() override;
    int UnLock() override;

  private:
    const std::string m_who;
    std::mutex m_mutex;
    std::unique_ptr<Inhibitor> m_inhibitor;
};

}  // namespace logind
