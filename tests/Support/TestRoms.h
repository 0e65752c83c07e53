// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "MidAPI/Image/OptionRom.h"

namespace test {

/// Images for tests: the real ones of Debian's package ipxe-qemu, and made ones.

/// Path of a real image: realRomPath("efi-virtio") is of device 1af4:1041 with IMG_PXE 1 and IMG_UEFI 0.
std::string realRomPath(std::string_view name);

/// Its bytes.
std::vector<std::uint8_t> realRom(std::string_view name);

/// A ROM with the code revision of all its images changed.
std::vector<std::uint8_t> withRevision(std::vector<std::uint8_t> rom, std::uint16_t revision);

/// A small ROM (1024 bytes an image) for the device 1af4:1041, or for another one.
std::vector<std::uint8_t> madeRom(const std::vector<utils::FirmwareVersionInfo>& components,
                                  std::uint16_t vendor = 0x1af4, std::uint16_t device = 0x1041);

/// "IMG_PXE+none+77"; no types for "all".
std::vector<utils::FirmwareType> typesOf(const std::string& words);

/// "IMG_PXE 1, IMG_UEFI 0"
std::string describeComponents(const std::vector<utils::FirmwareVersionInfo>& components);
std::string describeRom(const std::vector<std::uint8_t>& rom);

/// What words stand for: bytes in hexadecimal, and texts in quotes: 0a1b 00 "text".
std::vector<std::uint8_t> bytesOf(const std::string& words);

}  // namespace test
