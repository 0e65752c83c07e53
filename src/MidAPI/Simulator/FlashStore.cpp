#include "MidAPI/Simulator/FlashStore.h"

#include <sys/stat.h>

#include <algorithm>

#include "MidAPI/Simulator/WholeFile.h"
#include "Utils/Log.h"

namespace ma {
namespace {

constexpr std::size_t CHUNK = 4096;  // a sector of the flash
constexpr const char* STATE_FILE = "state";
constexpr const char* NEW_STATE_FILE = "state.new";

}  // namespace

FlashStore::FlashStore(std::string folder, std::vector<uint8_t> factoryFlash, FlashState factoryState,
                       std::shared_ptr<FlashFiles> files)
    : m_folder(std::move(folder)),
      m_factoryFlash(std::move(factoryFlash)),
      m_factoryState(factoryState),
      m_files(std::move(files)) {}

std::optional<FlashState> FlashStore::storedState() const {
    const auto bytes = readWholeFile(path(STATE_FILE), FLASH_STATE_LENGTH + 1);
    if (!bytes) return std::nullopt;
    if (std::optional<FlashState> state = decodeFlashState(*bytes)) return state;
    throw FlashError("the record " + path(STATE_FILE) + " is damaged; remove the folder " + m_folder +
                     " to have the adapter as it left the factory");
}

FlashState FlashStore::state() const {
    return storedState().value_or(m_factoryState);
}

std::optional<std::vector<uint8_t>> FlashStore::bankContent(const FlashState& state, uint8_t bank) const {
    const FlashBank& expected = state.banks[bank];
    // The file may be longer: an update that was cut off left it so.
    auto bytes = readWholeFile(bankPath(bank), expected.length);
    if (bytes && expected.holds(*bytes)) return bytes;
    return std::nullopt;
}

std::vector<uint8_t> FlashStore::content() const {
    constexpr int MOST_TRIES = 8;
    for (int attempt = 0; attempt < MOST_TRIES; ++attempt) {
        const std::optional<FlashState> state = storedState();
        if (!state) return m_factoryFlash;
        if (state->active().length == 0) return {};
        if (auto bytes = bankContent(*state, state->activeBank)) return *bytes;
        // Another process may have made two updates since the record was read.
        if (storedState().value_or(m_factoryState).generation != state->generation) continue;
        QUENX_ERROR("%s is damaged, booting the other bank", bankPath(state->activeBank).c_str());
        if (auto bytes = bankContent(*state, state->inactiveBank())) return *bytes;
        break;
    }
    throw FlashError("no bank in " + m_folder +
                     " is intact; remove the folder to have the adapter as it left the factory");
}

FileLock FlashStore::lockForWriting() {
    makeFolders();
    return FileLock(path("flash.lock"), FileLock::Mode::Try);
}

void FlashStore::write(std::span<const uint8_t> image, const std::function<void(std::size_t)>& reached) {
    const FlashState before = initialise();
    const auto bank = static_cast<uint8_t>(1 - bootedBank(before));
    writeBank(bank, image, reached);
    changeState([&](FlashState& state) {
        state.banks[bank] = {static_cast<uint32_t>(image.size()), crc32(image)};
        state.activeBank = bank;
    });
}

void FlashStore::changeState(const std::function<void(FlashState&)>& change) {
    initialise();
    const FileLock lock(path("state.lock"), FileLock::Mode::Wait);
    FlashState state = this->state();
    change(state);
    ++state.generation;
    storeState(state);
}

/// Gives a factory-fresh adapter its files, so that a change has something to change.
FlashState FlashStore::initialise() {
    makeFolders();
    const FileLock lock(path("state.lock"), FileLock::Mode::Wait);
    if (std::optional<FlashState> stored = storedState()) return *stored;
    FlashState state = m_factoryState;
    state.activeBank = 0;
    state.banks = {};
    state.banks[0] = {static_cast<uint32_t>(m_factoryFlash.size()), crc32(m_factoryFlash)};
    writeBank(0, m_factoryFlash, [](std::size_t) {});
    storeState(state);
    return state;
}

uint8_t FlashStore::bootedBank(const FlashState& state) const {
    if (state.active().length == 0 || bankContent(state, state.activeBank)) return state.activeBank;
    return bankContent(state, state.inactiveBank()) ? state.inactiveBank() : state.activeBank;
}

void FlashStore::makeFolders() {
    struct stat found {};
    if (::stat(m_folder.c_str(), &found) == 0) return;
    for (std::size_t slash = m_folder.find('/', 1);; slash = m_folder.find('/', slash + 1)) {
        const std::string folder = m_folder.substr(0, slash);
        if (::stat(folder.c_str(), &found) != 0) {
            m_files->makeFolder(folder);
            const std::size_t parent = folder.rfind('/');
            m_files->syncFolder(
                parent == std::string::npos ? "." : folder.substr(0, std::max<std::size_t>(parent, 1)));
        }
        if (slash == std::string::npos) return;
    }
}

void FlashStore::writeBank(uint8_t bank, std::span<const uint8_t> image,
                           const std::function<void(std::size_t)>& reached) {
    reached(0);
    {
        FlashFile file(*m_files, bankPath(bank));
        for (std::size_t written = 0; written < image.size();) {
            const std::size_t count = std::min(CHUNK, image.size() - written);
            file.write(image.subspan(written, count));
            written += count;
            reached(written);
        }
        file.sync();
    }
    // The record that comes next must never reach the medium before the bank's entry in the folder.
    m_files->syncFolder(m_folder);
}

void FlashStore::storeState(FlashState state) {
    {
        FlashFile file(*m_files, path(NEW_STATE_FILE));
        file.write(encodeFlashState(state));
        file.sync();
    }
    m_files->rename(path(NEW_STATE_FILE), path(STATE_FILE));
    m_files->syncFolder(m_folder);
}

}  // namespace ma
