#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

/// Little-endian numbers in a span of bytes. The callers have checked the bounds with fitsIn().
namespace ma {

/// True when `length` bytes at `offset` lie within `size`.
constexpr bool fitsIn(std::size_t offset, std::size_t length, std::size_t size) {
    return offset <= size && length <= size - offset;
}

inline uint16_t readLe16(std::span<const uint8_t> bytes, std::size_t offset) {
    return static_cast<uint16_t>(bytes[offset] | bytes[offset + 1] << 8);
}

inline uint32_t readLe32(std::span<const uint8_t> bytes, std::size_t offset) {
    return readLe16(bytes, offset) | uint32_t{readLe16(bytes, offset + 2)} << 16;
}

inline void writeLe16(std::span<uint8_t> bytes, std::size_t offset, uint16_t value) {
    bytes[offset] = static_cast<uint8_t>(value & 0xFF);
    bytes[offset + 1] = static_cast<uint8_t>(value >> 8);
}

inline void writeLe32(std::span<uint8_t> bytes, std::size_t offset, uint32_t value) {
    writeLe16(bytes, offset, static_cast<uint16_t>(value & 0xFFFF));
    writeLe16(bytes, offset + 2, static_cast<uint16_t>(value >> 16));
}

}  // namespace ma
