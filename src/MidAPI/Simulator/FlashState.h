// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <vector>

#include "Utils/FirmwareTypes.h"

namespace ma {

/// One bank: how long its content is, and its checksum. Length 0: nothing was written to it yet.
struct FlashBank {
    std::uint32_t length = 0;
    std::uint32_t checksum = 0;

    bool holds(std::span<const std::uint8_t> content) const;
    bool operator==(const FlashBank&) const = default;
};

/// What an adapter remembers beside the content of its two banks. docs/image-format.md has its bytes.
struct FlashState {
    std::uint32_t generation = 0;  ///< counts the changes of this record
    std::uint8_t activeBank = 0;   ///< 0 or 1: the bank that the adapter boots
    std::array<FlashBank, 2> banks;
    std::uint32_t bootType = 0;        ///< a BootType
    std::uint32_t capabilityWord = 0;  ///< bit n: the boot image of type n is enabled

    const FlashBank& active() const { return banks[activeBank]; }
    std::uint8_t inactiveBank() const { return static_cast<std::uint8_t>(1 - activeBank); }
    bool operator==(const FlashState&) const = default;
};

/// The bit of a type in the capability word; 0 for a type that has none.
std::uint32_t capabilityBit(utils::FirmwareType type);
/// The bits of all these components.
std::uint32_t capabilityBits(const std::vector<utils::FirmwareVersionInfo>& components);

inline constexpr std::size_t kFlashStateLength = 44;

std::array<std::uint8_t, kFlashStateLength> encodeFlashState(const FlashState& state);

/// Nothing when the bytes are no whole, intact record.
std::optional<FlashState> decodeFlashState(std::span<const std::uint8_t> bytes);

}  // namespace ma
