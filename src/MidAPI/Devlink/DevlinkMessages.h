// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Devlink/GenericNetlink.h"
#include "Utils/Export.h"

/// What the messages of devlink hold. Free of state; any thread may call.
namespace ma::devlink {

/// The name of devlink instances that are PCI functions: the bus, beside which stands the function's address.
constexpr const char* kPciBus = "pci";

/// What devlink is called in this kernel; the numbers are given at run time.
struct Family {
    std::uint16_t number = 0;         ///< 0: this kernel has no devlink
    std::uint32_t notifications = 0;  ///< the multicast group; 0: none
};

/// Reads the answer to a question for the family.
QUENX_EXPORT Family readFamily(ByteView attributes);

/// What a driver tells of its device.
struct DeviceInfo {
    std::string serialNumber;
    std::string boardSerialNumber;
    std::vector<NamedVersion> versions;  ///< each name once, in the driver's order
};

/// Reads the answer to DEVLINK_CMD_INFO_GET.
QUENX_EXPORT DeviceInfo readDeviceInfo(ByteView attributes);

/// How far a flash is.
struct FlashStatus {
    std::string text;         ///< the driver's words: for people, never to decide by
    std::uint64_t done = 0;   ///< bytes of the current step
    std::uint64_t total = 0;  ///< 0: the message is only a text, or about one long step
};

/// What the kernel tells everybody.
struct Notification {
    std::uint8_t command = 0;
    std::string device = {};  ///< the address of a PCI function; empty for devices of other buses
    FlashStatus status = {};  ///< of DEVLINK_CMD_FLASH_UPDATE_STATUS
};

QUENX_EXPORT Notification readNotification(const Message& message);

}  // namespace ma::devlink
