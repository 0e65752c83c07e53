// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

#include "Utils/Export.h"

/// What the binary formats have in common: fields in little-endian order, bounds, and the checksum.
namespace ma {

/// True when `length` bytes at `offset` lie within `size`.
constexpr bool fitsIn(std::size_t offset, std::size_t length, std::size_t size) {
    return offset <= size && length <= size - offset;
}

inline std::uint16_t readLe16(std::span<const std::uint8_t> bytes, std::size_t offset) {
    return static_cast<std::uint16_t>(bytes[offset] | bytes[offset + 1] << 8);
}

inline std::uint32_t readLe32(std::span<const std::uint8_t> bytes, std::size_t offset) {
    return readLe16(bytes, offset) | std::uint32_t{readLe16(bytes, offset + 2)} << 16;
}

inline void writeLe16(std::span<std::uint8_t> bytes, std::size_t offset, std::uint16_t value) {
    bytes[offset] = static_cast<std::uint8_t>(value & 0xFF);
    bytes[offset + 1] = static_cast<std::uint8_t>(value >> 8);
}

inline void writeLe32(std::span<std::uint8_t> bytes, std::size_t offset, std::uint32_t value) {
    writeLe16(bytes, offset, static_cast<std::uint16_t>(value & 0xFFFF));
    writeLe16(bytes, offset + 2, static_cast<std::uint16_t>(value >> 16));
}

/// CRC-32 as in IEEE 802.3 (reflected, polynomial 0x04C11DB7, start and final inversion).
QUENX_EXPORT std::uint32_t crc32(std::span<const std::uint8_t> bytes);

}  // namespace ma
