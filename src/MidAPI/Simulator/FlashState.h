#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

#include "MidAPI/AdapterTypes.h"

namespace ma {

/// CRC-32 as in IEEE 802.3 (reflected, polynomial 0x04C11DB7, start and final inversion).
uint32_t crc32(std::span<const uint8_t> bytes);

/// One bank: how long its content is, and its checksum. Length 0: nothing was written to it yet.
struct FlashBank {
    uint32_t length = 0;
    uint32_t checksum = 0;

    bool holds(std::span<const uint8_t> content) const;
};

/// What an adapter remembers beside the content of its two banks. docs/image-format.md has its bytes.
struct FlashState {
    uint32_t generation = 0;  ///< counts the changes of this record
    uint8_t activeBank = 0;   ///< 0 or 1: the bank that the adapter boots
    std::array<FlashBank, 2> banks;
    uint32_t bootType = 0;        ///< a BootType
    uint32_t capabilityWord = 0;  ///< bit n: the boot image of type n is enabled

    const FlashBank& active() const { return banks[activeBank]; }
    uint8_t inactiveBank() const { return static_cast<uint8_t>(1 - activeBank); }
};

inline constexpr std::size_t FLASH_STATE_LENGTH = 44;

std::array<uint8_t, FLASH_STATE_LENGTH> encodeFlashState(const FlashState& state);

/// Nothing when the bytes are no whole, intact record.
std::optional<FlashState> decodeFlashState(std::span<const uint8_t> bytes);

}  // namespace ma
