// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include "MidAPI/Devlink/DevlinkMessages.h"
#include "MidAPI/Devlink/Machine.h"
#include "MidAPI/Devlink/PciFunctions.h"
#include "Utils/Export.h"

namespace ma::devlink {

/// The right to flash a card, among all processes of this product on the machine. The kernel's own lock is
/// one function's, and the functions of a card may share a flash. A card is what has domain, bus and device
/// of the address in common, and what tells one serial number.
class QUENX_EXPORT CardLock {
  public:
    /// Makes the folder if need be. @throws std::system_error when there can be no lock, and os::ForeignFile
    /// where it, or its folder, is another user's
    /// @param patience  how long to wait for another holder, see isHeld()
    CardLock(Machine& machine, const std::string& folder, const PciFunction& function, const DeviceInfo& info,
             std::chrono::milliseconds patience);

    bool isHeld() const { return m_locks.back()->isHeld(); }
    /// Who holds the lock that this one did not get, for a person.
    std::string holder() const { return m_locks.back()->holder(); }

    /// The file of a function's lock that its address names.
    static std::string path(const std::string& folder, const PciFunction& function);

  private:
    std::vector<std::unique_ptr<os::FileLock>> m_locks;  // taken in this order; at least one
};

}  // namespace ma::devlink
