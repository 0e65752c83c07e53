// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "MidAPI/Activation.h"
#include "MidAPI/Devlink/DevlinkConnection.h"
#include "MidAPI/Devlink/Machine.h"
#include "Utils/Export.h"
#include "Utils/StringArray.h"

/// Putting firmware in force that is in a device's flash, by having its driver reset it.
namespace ma::devlink {

/// Whether the driver of a device offers that while the machine runs. Waits while the device is being
/// flashed. @throws std::system_error when the question cannot be sent
QUENX_EXPORT bool offersActivation(DevlinkConnection& connection, const std::string& address);

/// Has the driver do it, waits until the interfaces of the card's functions are back with their links, for
/// Machine::patience() twelve times, and reads which firmware runs then: the acknowledgement alone proves
/// nothing. Whoever calls holds the card's lock, and has looked at what runs over it.
/// @throws std::system_error when the request cannot be sent
QUENX_EXPORT Activation activateDevice(Machine& machine, const std::string& address,
                                       const utils::StringArray& functions);

}  // namespace ma::devlink
