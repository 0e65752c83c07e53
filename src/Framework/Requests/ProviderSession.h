// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <optional>
#include <string>

#include "Framework/Requests/CimOperations.h"
#include "Framework/Requests/ProviderLibraries.h"
#include "Utils/Os/Linux/LinuxOSLocker.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

namespace core {

/// What every front holds while it serves: the providers' configuration, the locker under which they write to
/// adapters, and their libraries. Leaving waits for the updates that have begun. One at a time in a process;
/// used from one thread, but for the operations.
///
/// Which adapters there are is not its affair: a front that wants simulated ones says so to the adapter API
/// before it loads the providers.
class QUENX_EXPORT ProviderSession {
  public:
    /// @param configurationFile  empty for the system's
    explicit ProviderSession(const std::string& configurationFile);
    ~ProviderSession();
    ProviderSession(const ProviderSession&) = delete;
    ProviderSession& operator=(const ProviderSession&) = delete;

    /// Loads the providers of a directory, see ProviderLibraries::load().
    ProviderLibraries& libraries() { return m_libraries; }

    /// What the loaded providers answer, in the namespace that the configuration names. Shared with whatever
    /// stands in front of them.
    const std::shared_ptr<CimOperations>& operations() const { return m_operations; }

  private:
    // Destroyed last to first: the providers leave before what they use.
    std::optional<utils::SMASHv2Config> m_configuration;
    os::OSLockerLinux m_locker;
    ProviderLibraries m_libraries;
    std::shared_ptr<CimOperations> m_operations;
};

}  // namespace core
