#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/Image/OptionRom.h"
#include "Providers/InventoryInterfaces.h"
#include "Providers/SoftwareInventory/AdapterReading.h"

namespace inventory {

/// A part of a firmware: an image of one type.
struct FirmwareComponent {
    std::string type;  ///< "IMG_PXE"
    std::uint32_t version = 0;

    bool operator==(const FirmwareComponent&) const = default;
};

/// What a software identity says, wherever the firmware is.
struct Firmware {
    std::string identifier;
    SoftwareIdentity::TypeCode typeCode = SoftwareIdentity::FIRMWARE_IMAGE;
    std::string adapter;                        ///< on which it is installed; empty for a file
    std::string ids;                            ///< vendor and device, as "1af4:1041"
    std::vector<FirmwareComponent> components;  ///< in ascending order of type
    std::string manufacturer;                   ///< empty when the image names none
    std::string product;                        ///< likewise

    bool operator==(const Firmware&) const = default;
};

/// The firmware in a file of intact ROM images. Its identifier is made of the ids and the content, so that a
/// copy of the file, or the file under another name, is the same firmware.
Firmware describeImage(std::span<const std::uint8_t> file, const ma::RomFile& rom);

/// What is installed on the ports, one firmware for each component, so that each has its own version. A port
/// that does not answer has none.
std::vector<Firmware> readInstalled(const std::vector<Port>& ports);

}  // namespace inventory
