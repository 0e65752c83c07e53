#pragma once

#include <cstddef>
#include <cstdint>

/// Numbers of the expansion ROM format: PCI Firmware Specification 3.x (expansion ROM chapters), Plug and
/// Play BIOS 1.0A (expansion header), UEFI (PCI option ROM). All fields are
/// little-endian.
namespace ma::rom {

inline constexpr std::size_t UNIT = 512;  // images are measured in these
inline constexpr std::size_t MAX_IMAGES = 64;
inline constexpr uint32_t NETWORK_BASE_CLASS = 0x02;
inline constexpr uint32_t ETHERNET_CLASS = 0x020000;

/// Code types of the PCI data structure.
enum CodeType : uint8_t { CODE_PC_AT = 0, CODE_OPEN_FIRMWARE = 1, CODE_PA_RISC = 2, CODE_EFI = 3 };

// The image header; offsets from the start of the image.
inline constexpr uint16_t SIGNATURE = 0xAA55;
inline constexpr std::size_t HEADER_RUNTIME_UNITS = 0x02;
inline constexpr std::size_t HEADER_ENTRY = 0x03;
inline constexpr std::size_t HEADER_EFI_SIGNATURE = 0x04;
// The standard reserves this byte, and common images keep their checksum in it: a sum is mended here. The
// last byte of an image, the other usual place, may be code.
inline constexpr std::size_t HEADER_CHECKSUM = 0x06;
inline constexpr std::size_t HEADER_EFI_SUBSYSTEM = 0x08;
inline constexpr std::size_t HEADER_EFI_MACHINE = 0x0A;
inline constexpr std::size_t HEADER_EFI_IMAGE = 0x16;
inline constexpr std::size_t HEADER_DATA_STRUCTURE = 0x18;
inline constexpr std::size_t HEADER_PNP = 0x1A;
inline constexpr std::size_t HEADER_LENGTH = 0x1C;
inline constexpr uint32_t EFI_SIGNATURE = 0x0EF1;

// The PCI data structure; offsets from its start.
inline constexpr std::size_t PCIR_VENDOR = 0x04;
inline constexpr std::size_t PCIR_DEVICE = 0x06;
inline constexpr std::size_t PCIR_DEVICE_LIST = 0x08;
inline constexpr std::size_t PCIR_LENGTH = 0x0A;
inline constexpr std::size_t PCIR_REVISION = 0x0C;
inline constexpr std::size_t PCIR_CLASS = 0x0D;
inline constexpr std::size_t PCIR_IMAGE_UNITS = 0x10;
inline constexpr std::size_t PCIR_CODE_REVISION = 0x12;
inline constexpr std::size_t PCIR_CODE_TYPE = 0x14;
inline constexpr std::size_t PCIR_INDICATOR = 0x15;
inline constexpr std::size_t PCIR_CLP = 0x1A;
inline constexpr std::size_t PCIR_LENGTH_REVISION_0 = 24;
inline constexpr std::size_t PCIR_LENGTH_REVISION_3 = 28;
inline constexpr uint8_t LAST_IMAGE = 0x80;

// The Plug and Play expansion header; offsets from its start.
inline constexpr std::size_t PNP_NEXT = 0x06;
inline constexpr std::size_t PNP_MANUFACTURER = 0x0E;
inline constexpr std::size_t PNP_PRODUCT = 0x10;
inline constexpr std::size_t PNP_LENGTH = 0x20;
inline constexpr int MAX_PNP_HEADERS = 16;

}  // namespace ma::rom
