// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "MidAPI/Devlink/DevlinkConnection.h"
#include "Utils/Export.h"

/// The requests about a device that the backend makes, by the address of its PCI function. All wait while
/// the device is being flashed, and throw std::system_error when the request cannot be sent.
namespace ma::devlink {

/// What it takes to change a device: for whoever is refused.
inline constexpr const char* kTakesPrivilege =
    "this takes the capability CAP_NET_ADMIN in the machine's own user namespace; run it as root";

/// Whether a device can be flashed from here.
enum class Flashable {
    Yes,
    NotOffered,    ///< its driver cannot flash it
    NotPermitted,  ///< this process may not
    Absent,        ///< devlink does not know it: no driver with devlink, or another network namespace
    Unknown,       ///< the kernel gave another answer, or none
};

struct FlashVerdict {
    Flashable flashable = Flashable::Unknown;
    std::string reason;  ///< for people, what follows "it cannot be updated: "; empty for Yes
};

/// Asks by a flash request without a file, which changes nothing.
QUENX_EXPORT FlashVerdict askFlashable(DevlinkConnection& connection, const std::string& address);

/// Asks whether the device takes a component by itself, by a flash request whose file has no name. Empty when
/// it does, and otherwise why not.
QUENX_EXPORT std::string refusalOfComponent(DevlinkConnection& connection, const std::string& address,
                                            const std::string& component);

/// What a driver tells of its device.
struct ToldInfo {
    DeviceInfo info = {};    ///< empty also where the driver tells nothing
    std::string error = {};  ///< why that is not known, for people; empty where it is
};
QUENX_EXPORT ToldInfo askInfo(DevlinkConnection& connection, const std::string& address);

/// The same over a connection of its own, after something may be wrong with the one in use. Never throws but
/// std::bad_alloc.
QUENX_EXPORT ToldInfo askInfoAnew(Machine& machine, const std::string& address);

/// Flashes a device; blocks until the device is done.
/// @param file       below a folder in which the kernel looks for firmware
/// @param component  empty for the whole device
QUENX_EXPORT Answer flash(DevlinkConnection& connection, const std::string& address, const std::string& file,
                          const std::string& component);

/// What the kernel said, for people: "TEXT (REASON)", or the reason of its error code alone. Behind that what
/// to do, where the kernel itself has refused: drivers fail with the same numbers for reasons of their own.
QUENX_EXPORT std::string describe(const Answer& answer);

}  // namespace ma::devlink
