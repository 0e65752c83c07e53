// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "MidAPI/Image/Bytes.h"

/// The expansion ROM format, byte by byte: PCI Firmware Specification 3.x (expansion ROM chapters), Plug and
/// Play BIOS 1.0A (expansion header), UEFI (PCI option ROM). All fields are little-endian.
namespace ma {

namespace rom {

inline constexpr std::size_t kBlockSize = 512;  // images are measured in these
inline constexpr std::size_t kMaxImages = 64;
inline constexpr std::uint32_t kNetworkBaseClass = 0x02;
inline constexpr std::uint32_t kEthernetClass = 0x020000;

/// Code types of the PCI data structure.
enum CodeType : std::uint8_t { PcAt = 0, OpenFirmware = 1, PaRisc = 2, Efi = 3 };

// The image header; offsets from the start of the image.
inline constexpr std::uint16_t kSignature = 0xAA55;
inline constexpr std::size_t kHeaderRuntimeUnits = 0x02;
inline constexpr std::size_t kHeaderEntry = 0x03;
inline constexpr std::size_t kHeaderEfiSignature = 0x04;
// The standard reserves this byte, and common images keep their checksum in it: a sum is corrected here. The
// last byte of an image, the other usual place, may be code.
inline constexpr std::size_t kHeaderChecksum = 0x06;
inline constexpr std::size_t kHeaderEfiSubsystem = 0x08;
inline constexpr std::size_t kHeaderEfiMachine = 0x0A;
inline constexpr std::size_t kHeaderEfiImage = 0x16;
inline constexpr std::size_t kHeaderDataStructure = 0x18;
inline constexpr std::size_t kHeaderPnp = 0x1A;
inline constexpr std::size_t kHeaderLength = 0x1C;
inline constexpr std::uint32_t kEfiSignature = 0x0EF1;

// The PCI data structure; offsets from its start.
inline constexpr std::size_t kPcirVendor = 0x04;
inline constexpr std::size_t kPcirDevice = 0x06;
inline constexpr std::size_t kPcirDeviceList = 0x08;
inline constexpr std::size_t kPcirLength = 0x0A;
inline constexpr std::size_t kPcirRevision = 0x0C;
inline constexpr std::size_t kPcirClass = 0x0D;
inline constexpr std::size_t kPcirImageUnits = 0x10;
inline constexpr std::size_t kPcirCodeRevision = 0x12;
inline constexpr std::size_t kPcirCodeType = 0x14;
inline constexpr std::size_t kPcirIndicator = 0x15;
inline constexpr std::size_t kPcirClp = 0x1A;
inline constexpr std::size_t kPcirLengthRevision0 = 24;
inline constexpr std::size_t kPcirLengthRevision3 = 28;
inline constexpr std::uint8_t kLastImage = 0x80;

// The Plug and Play expansion header; offsets from its start.
inline constexpr std::size_t kPnpNext = 0x06;
inline constexpr std::size_t kPnpManufacturer = 0x0E;
inline constexpr std::size_t kPnpProduct = 0x10;
inline constexpr std::size_t kPnpLength = 0x20;
inline constexpr int kMaxPnpHeaders = 16;

/// Sum of all bytes modulo 256. `image` is a multiple of kBlockSize long.
inline std::uint8_t sumOfImage(std::span<const std::uint8_t> image) {
    std::uint8_t sum = 0;
    // A fixed inner count: the compiler makes vector code of it.
    for (std::size_t block = 0; block < image.size(); block += kBlockSize) {
        const std::uint8_t* bytes = image.data() + block;
        for (std::size_t index = 0; index < kBlockSize; ++index)
            sum = static_cast<std::uint8_t>(sum + bytes[index]);
    }
    return sum;
}

}  // namespace rom

}  // namespace ma
