#include "MidAPI/Simulator/FlashState.h"

#include <algorithm>
#include <string_view>

#include "MidAPI/Image/ByteView.h"

namespace ma {
namespace {

constexpr std::string_view MAGIC = "QXFLASH1";
constexpr std::size_t GENERATION = 8;
constexpr std::size_t ACTIVE_BANK = 12;  // the three bytes behind it are 0
constexpr std::size_t BANKS = 16;        // two of BANK_LENGTH bytes
constexpr std::size_t BANK_LENGTH = 8;
constexpr std::size_t BOOT_TYPE = 32;
constexpr std::size_t CAPABILITY_WORD = 36;
constexpr std::size_t CHECKSUM = 40;

constexpr std::array<uint32_t, 256> makeCrcTable() {
    std::array<uint32_t, 256> table{};
    for (uint32_t index = 0; index < table.size(); ++index) {
        uint32_t value = index;
        for (int bit = 0; bit < 8; ++bit)
            value = value >> 1 ^ (value & 1 ? 0xEDB88320U : 0U);
        table[index] = value;
    }
    return table;
}
constexpr std::array<uint32_t, 256> CRC_TABLE = makeCrcTable();

}  // namespace

uint32_t crc32(std::span<const uint8_t> bytes) {
    uint32_t value = 0xFFFFFFFFU;
    for (const uint8_t byte : bytes)
        value = value >> 8 ^ CRC_TABLE[(value ^ byte) & 0xFF];
    return ~value;
}

bool FlashBank::holds(std::span<const uint8_t> content) const {
    return length != 0 && content.size() == length && crc32(content) == checksum;
}

std::array<uint8_t, FLASH_STATE_LENGTH> encodeFlashState(const FlashState& state) {
    std::array<uint8_t, FLASH_STATE_LENGTH> bytes{};
    std::copy(MAGIC.begin(), MAGIC.end(), bytes.begin());
    writeLe32(bytes, GENERATION, state.generation);
    bytes[ACTIVE_BANK] = state.activeBank;
    for (std::size_t bank = 0; bank < state.banks.size(); ++bank) {
        writeLe32(bytes, BANKS + bank * BANK_LENGTH, state.banks[bank].length);
        writeLe32(bytes, BANKS + bank * BANK_LENGTH + 4, state.banks[bank].checksum);
    }
    writeLe32(bytes, BOOT_TYPE, state.bootType);
    writeLe32(bytes, CAPABILITY_WORD, state.capabilityWord);
    writeLe32(bytes, CHECKSUM, crc32(std::span<const uint8_t>(bytes).first(CHECKSUM)));
    return bytes;
}

std::optional<FlashState> decodeFlashState(std::span<const uint8_t> bytes) {
    if (bytes.size() != FLASH_STATE_LENGTH || !std::equal(MAGIC.begin(), MAGIC.end(), bytes.begin()))
        return {};
    if (readLe32(bytes, CHECKSUM) != crc32(bytes.first(CHECKSUM))) return {};
    FlashState state;
    state.generation = readLe32(bytes, GENERATION);
    state.activeBank = bytes[ACTIVE_BANK];
    if (state.activeBank > 1) return {};
    for (std::size_t bank = 0; bank < state.banks.size(); ++bank) {
        state.banks[bank].length = readLe32(bytes, BANKS + bank * BANK_LENGTH);
        state.banks[bank].checksum = readLe32(bytes, BANKS + bank * BANK_LENGTH + 4);
    }
    state.bootType = readLe32(bytes, BOOT_TYPE);
    state.capabilityWord = readLe32(bytes, CAPABILITY_WORD);
    return state;
}

}  // namespace ma
