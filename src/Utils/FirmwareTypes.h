// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>

namespace utils {

/// The kind of a firmware image. The numbers are the indexes of the target-type names that clients use, and
/// lists of types are ordered by them.
enum class FirmwareType : std::int32_t { None = 0, CLP = 1, iSCSI = 2, PXE = 3, UEFI = 4, FCoE = 5 };

/// One firmware component found on an adapter.
struct FirmwareVersionInfo {
    FirmwareType type = FirmwareType::None;
    std::uint32_t version = 0;  ///< as the adapter API reports it
};

/// The PCI location of an adapter port.
struct PCIAddr {
    std::uint8_t bus = 0;
    std::uint8_t device = 0;
    std::uint8_t function = 0;
    bool noFunction = false;  ///< true when the address carries no function number
    std::string text;         ///< free text of the adapter API

    /// True when bus and device are equal: both are ports of one card, in one PCI domain.
    bool sameAdapter(const PCIAddr& other) const { return bus == other.bus && device == other.device; }

    bool operator==(const PCIAddr& other) const = default;
};

}  // namespace utils
