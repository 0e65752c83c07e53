// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/FlashState.h"

#include <algorithm>
#include <string_view>

#include "MidAPI/Image/Bytes.h"

namespace ma {

namespace {

constexpr std::string_view kMagic = "QXFLASH1";
constexpr std::size_t kGeneration = 8;
constexpr std::size_t kActiveBank = 12;  // the three bytes behind it are 0
constexpr std::size_t kBanks = 16;       // two of kBankLength bytes
constexpr std::size_t kBankLength = 8;
constexpr std::size_t kBootType = 32;
constexpr std::size_t kCapabilityWord = 36;
constexpr std::size_t kChecksum = 40;

}  // namespace

bool FlashBank::holds(std::span<const std::uint8_t> content) const {
    return length != 0 && content.size() == length && crc32(content) == checksum;
}

std::uint32_t capabilityBit(utils::FirmwareType type) {
    const auto number = static_cast<std::uint32_t>(type);
    return number >= 1 && number <= 5 ? 1U << number : 0;
}

std::uint32_t capabilityBits(const std::vector<utils::FirmwareVersionInfo>& components) {
    std::uint32_t bits = 0;
    for (const utils::FirmwareVersionInfo& component : components)
        bits |= capabilityBit(component.type);
    return bits;
}

std::array<std::uint8_t, kFlashStateLength> encodeFlashState(const FlashState& state) {
    std::array<std::uint8_t, kFlashStateLength> bytes{};
    std::copy(kMagic.begin(), kMagic.end(), bytes.begin());
    writeLe32(bytes, kGeneration, state.generation);
    bytes[kActiveBank] = state.activeBank;
    for (std::size_t bank = 0; bank < state.banks.size(); ++bank) {
        writeLe32(bytes, kBanks + bank * kBankLength, state.banks[bank].length);
        writeLe32(bytes, kBanks + bank * kBankLength + 4, state.banks[bank].checksum);
    }
    writeLe32(bytes, kBootType, state.bootType);
    writeLe32(bytes, kCapabilityWord, state.capabilityWord);
    writeLe32(bytes, kChecksum, crc32(std::span<const std::uint8_t>(bytes).first(kChecksum)));
    return bytes;
}

std::optional<FlashState> decodeFlashState(std::span<const std::uint8_t> bytes) {
    if (bytes.size() != kFlashStateLength || !std::equal(kMagic.begin(), kMagic.end(), bytes.begin()))
        return {};
    if (readLe32(bytes, kChecksum) != crc32(bytes.first(kChecksum))) return {};
    FlashState state;
    state.generation = readLe32(bytes, kGeneration);
    state.activeBank = bytes[kActiveBank];
    // An intact checksum does not prove that the number is one of ours.
    if (state.activeBank > 1) return {};
    for (std::size_t bank = 0; bank < state.banks.size(); ++bank) {
        state.banks[bank].length = readLe32(bytes, kBanks + bank * kBankLength);
        state.banks[bank].checksum = readLe32(bytes, kBanks + bank * kBankLength + 4);
    }
    state.bootType = readLe32(bytes, kBootType);
    state.capabilityWord = readLe32(bytes, kCapabilityWord);
    return state;
}

}  // namespace ma
