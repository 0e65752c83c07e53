// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/FlashFolder.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <filesystem>
#include <span>
#include <stdexcept>
#include <system_error>

#include "MidAPI/Image/Bytes.h"
#include "MidAPI/Image/OptionRom.h"
#include "Utils/Os/Linux/linux.h"

namespace ma {

namespace {

using Bytes = std::vector<std::uint8_t>;

constexpr std::size_t kMaxBank = std::size_t{64} * 1024 * 1024;

/// Nothing when there is no such file; nothing in it when it cannot be read.
std::optional<Bytes> contentOf(const std::string& path, std::size_t most) try {
    return os::readWholeFile(path, most);
} catch (const std::system_error& error) {
    // A worn-out medium, or a folder in the file's place, is damage like any other. A file that this user
    // may not read is none.
    constexpr std::array kDamage = {EIO, EISDIR, EUCLEAN, EBADMSG, ENODATA, ELOOP};
    if (std::ranges::find(kDamage, error.code().value()) == kDamage.end()) throw;
    return Bytes();
}

}  // namespace

FoundState FlashFolder::findState(const FlashState& factory) const {
    const auto recorded = contentOf(record(), kFlashStateLength + 1);
    if (auto state = recorded ? decodeFlashState(*recorded) : std::nullopt) return {state, ""};
    // A first change that was cut off, or is under way, leaves the factory's content in one bank.
    if (!recorded && !std::filesystem::exists(copy()) && !std::filesystem::exists(bank(1))) return {};
    FoundState found = findWithoutRecord(factory, recorded ? "is damaged" : "is missing");
    if (found.state) return found;
    throw std::runtime_error(found.damage + ", and no bank in " + m_path +
                             " is intact; remove the folder to have the adapter as it left the factory");
}

FoundState FlashFolder::findWithoutRecord(const FlashState& factory, const std::string& why) const {
    const auto copied = contentOf(copy(), kFlashStateLength + 1);
    const std::string damage = "the record " + record() + " " + why;
    // A copy that fits neither bank is older than both: a version that keeps none has written since.
    if (auto state = copied ? decodeFlashState(*copied) : std::nullopt; state && isBootable(*state))
        return {state, damage + "; its copy is used"};
    if (auto state = rebuild(factory))
        return {state, damage + ", its copy is no better; it is made anew from the banks, and boots " +
                           bank(state->activeBank)};
    return {std::nullopt, damage};
}

std::optional<Bytes> FlashFolder::bankContent(const FlashState& state, std::uint8_t number) const {
    const FlashBank& expected = state.banks[number];
    // The file may be longer: an update that was cut off left it so. The checksum is that of the recorded
    // length.
    auto bytes = contentOf(bank(number), expected.length);
    if (bytes && expected.holds(*bytes)) return bytes;
    return std::nullopt;
}

bool FlashFolder::isBootable(const FlashState& state) const {
    return state.active().length == 0 || bankContent(state, state.activeBank) ||
           bankContent(state, state.inactiveBank());
}

/// A state whose active bank is the one written last of those that hold a whole ROM.
std::optional<FlashState> FlashFolder::rebuild(const FlashState& factory) const {
    FlashState state = factory;
    state.banks = {};
    std::optional<std::filesystem::file_time_type> newest;
    for (std::uint8_t number = 0; number < state.banks.size(); ++number) {
        const auto bytes = contentOf(bank(number), kMaxBank);
        const RomFile rom = parseOptionRom(bytes ? *bytes : Bytes());
        if (rom.error) continue;
        const std::uint32_t length = rom.images.back().offset + rom.images.back().length;
        state.banks[number] = {length, crc32(std::span(*bytes).first(length))};
        std::error_code gone;  // then it is older than any other
        const auto written = std::filesystem::last_write_time(bank(number), gone);
        if (newest && written < *newest) continue;
        newest = written;
        state.activeBank = number;
        state.capabilityWord = capabilityBits(rom.components());
    }
    if (!newest) return std::nullopt;
    // Not one that was counted, by which somebody may know another content.
    state.generation = static_cast<std::uint32_t>(newest->time_since_epoch().count());
    return state;
}

}  // namespace ma
