// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <functional>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/Devlink/AdapterTable.h"
#include "MidAPI/Devlink/Machine.h"
#include "Utils/Export.h"

namespace ma::devlink {

/// What is to be flashed, and where.
struct FlashOrder {
    KnownFunction function;
    std::string folder;  ///< in which the kernel finds the image, see chooseFirmwareFolder()
    std::span<const std::uint8_t> image;
    std::vector<std::string> components;  ///< one flash for each, in this order; none for the whole device
};

/// Flashes a function; blocks until the device is done, and moves the function's progress. Whoever calls
/// holds the card's lock.
/// @param onStatus  called on another thread whenever the driver says how far it is
/// @throws OperationFailure  with codeOf() the error, the words of kernel or driver, the component, and what
///         is in the flash as far as the driver tells it. A flash that failed may have changed the device;
///         the ones after it are not begun.
QUENX_EXPORT void runFlash(Machine& machine, const FlashOrder& order, const std::function<void()>& onStatus);

}  // namespace ma::devlink
