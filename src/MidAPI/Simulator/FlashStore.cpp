// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/FlashStore.h"

#include <sys/stat.h>

#include <algorithm>
#include <stdexcept>

#include "MidAPI/Image/Bytes.h"
#include "MidAPI/OperationFailure.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/linux.h"

namespace ma {
namespace {

// As the record of an old backup does.
constexpr const char* kFitsNoBank = "fits neither bank";
constexpr const char* kWritersLock = "flash.lock";
constexpr std::size_t kChunk = 4096;  // a sector of the flash

/// An open file of FlashFiles, closed with the scope.
class FlashFile {
  public:
    FlashFile(FlashFiles& files, const std::string& path) : m_files(files), m_file(files.create(path)) {}
    void write(std::span<const std::uint8_t> bytes) { m_files.write(m_file.number(), bytes); }
    void sync() { m_files.sync(m_file.number()); }

  private:
    FlashFiles& m_files;
    const os::Descriptor m_file;
};

/// Makes a change of the record one step for other processes.
class RecordLock {
  public:
    RecordLock(const std::string& path, std::chrono::milliseconds patience) : m_lock(path, patience) {
        if (m_lock.isHeld()) return;
        const auto seconds = std::chrono::duration_cast<std::chrono::seconds>(patience).count();
        throw OperationFailure(WriteError::Busy, m_lock.holder() + " holds " + path +
                                                     " and has not let go for " + std::to_string(seconds) +
                                                     " s; end it, and try again");
    }

  private:
    const os::FileLock m_lock;
};

}  // namespace

FlashStore::FlashStore(std::string folder, std::vector<std::uint8_t> factoryFlash, FlashState factoryState,
                       std::shared_ptr<FlashFiles> files)
    : m_folder(std::move(folder)),
      m_factoryFlash(std::move(factoryFlash)),
      m_factoryState(factoryState),
      m_files(std::move(files)) {}

FoundState FlashStore::findState() const {
    return logOnce(m_folder.findState(m_factoryState));
}

FoundState FlashStore::logOnce(FoundState found) const {
    // Each once, not at every query: the next change mends it.
    const utils::Mutex::AutoLocker lock(m_damageMutex);
    if (!found.damage.empty() && m_logged.insert(found.damage).second) QUENX_ERROR_TEXT(found.damage);
    return found;
}

std::vector<std::uint8_t> FlashStore::content() const {
    constexpr int kMaxTries = 8;  // each one more takes two whole updates in between
    for (int attempt = 0; attempt < kMaxTries; ++attempt) {
        const std::optional<FlashState> state = findState().state;
        if (!state) return m_factoryFlash;
        if (state->active().length == 0) return {};
        if (auto bytes = m_folder.bankContent(*state, state->activeBank)) return *bytes;
        // Another process may have made two updates since the record was read.
        if (this->state().generation != state->generation) continue;
        if (auto bytes = m_folder.bankContent(*state, state->inactiveBank())) {
            logOnce({.state = {},
                     .damage = m_folder.bank(state->activeBank) + " is damaged, booting the other bank"});
            return *bytes;
        }
        break;
    }
    if (const FoundState found = m_folder.findWithoutRecord(m_factoryState, kFitsNoBank); found.state) {
        logOnce(found);
        if (auto bytes = m_folder.bankContent(*found.state, bootedBank(*found.state))) return *bytes;
    }
    throw std::runtime_error("no bank in " + m_folder.path() +
                             " is intact; remove the folder to have the adapter as it left the factory");
}

os::FileLock FlashStore::lockForWriting() {
    makeFolders();
    return os::FileLock(m_folder.file(kWritersLock), std::min(m_files->patience(), kWriterPatience));
}

std::string FlashStore::writer() const try {
    const std::string path = m_folder.file(kWritersLock);
    // Whoever writes has left a note there, so nobody takes the lock of an adapter that is free.
    if (os::readSystemText(path, 1).value_or("").empty()) return {};
    const os::FileLock lock(path);
    return lock.isHeld() ? "" : lock.holder();
} catch (const std::runtime_error&) {
    return {};
}

void FlashStore::write(std::span<const std::uint8_t> image, const std::function<void(std::size_t)>& reached) {
    const FlashState before = initialise();
    // The bank that boots may be the inactive one, when the active one is damaged; it must survive a power
    // cut here.
    const auto bank = static_cast<std::uint8_t>(1 - bootedBank(before));
    writeBank(bank, image, reached);
    FlashState written = before;
    written.banks[bank] = {static_cast<std::uint32_t>(image.size()), crc32(image)};
    // Read back: what is not there must not become what boots.
    if (!m_folder.bankContent(written, bank))
        throw std::runtime_error(m_folder.bank(bank) +
                                 " does not hold what was written; the old flash stays");
    changeState([&](FlashState& state) {
        state.banks[bank] = written.banks[bank];
        state.activeBank = bank;
    });
}

void FlashStore::changeState(const std::function<void(FlashState&)>& change) {
    initialise();
    // The boot type may change during a flash.
    const RecordLock lock(m_folder.file("state.lock"), m_files->patience());
    FlashState state = this->state();
    change(state);
    ++state.generation;
    storeState(state);
}

/// Gives a factory-fresh adapter its files, so that a change has something to change.
FlashState FlashStore::initialise() {
    makeFolders();
    const RecordLock lock(m_folder.file("state.lock"), m_files->patience());
    // Another process may have made the files while we waited for the lock.
    FoundState found = findState();
    if (found.state && !m_folder.isBootable(*found.state)) {
        if (FoundState rescued = m_folder.findWithoutRecord(m_factoryState, kFitsNoBank); rescued.state)
            found = logOnce(std::move(rescued));
    }
    if (found.state) {
        // Mended before a bank is written to, which may be what it was found by.
        if (!found.damage.empty()) storeState(*found.state);
        return *found.state;
    }
    FlashState state = m_factoryState;
    state.activeBank = 0;
    state.banks = {};
    state.banks[0] = {static_cast<std::uint32_t>(m_factoryFlash.size()), crc32(m_factoryFlash)};
    writeBank(0, m_factoryFlash, [](std::size_t) {});
    // The copy last: a reader who found it alone would take the record for lost.
    storeRecord(state, m_folder.record());
    storeRecord(state, m_folder.copy());
    m_files->syncFolder(m_folder.path());
    return state;
}

std::uint8_t FlashStore::bootedBank(const FlashState& state) const {
    if (state.active().length == 0 || m_folder.bankContent(state, state.activeBank)) return state.activeBank;
    return m_folder.bankContent(state, state.inactiveBank()) ? state.inactiveBank() : state.activeBank;
}

void FlashStore::makeFolders() {
    const std::string& path = m_folder.path();
    if (os::closeFolderToOthers(path)) return;
    struct stat found {};
    // One by one, each entry brought to the medium: a folder that a power cut takes away takes the banks with
    // it.
    for (std::size_t slash = path.find('/', 1);; slash = path.find('/', slash + 1)) {
        const std::string folder = path.substr(0, slash);
        if (::stat(folder.c_str(), &found) != 0) {
            m_files->makeFolder(folder);
            const std::size_t parent = folder.rfind('/');
            m_files->syncFolder(
                parent == std::string::npos ? "." : folder.substr(0, std::max<std::size_t>(parent, 1)));
        }
        if (slash == std::string::npos) break;
    }
    os::closeFolderToOthers(path);
}

void FlashStore::writeBank(std::uint8_t bank, std::span<const std::uint8_t> image,
                           const std::function<void(std::size_t)>& reached) {
    reached(0);
    {
        FlashFile file(*m_files, m_folder.bank(bank));
        for (std::size_t written = 0; written < image.size();) {
            const std::size_t count = std::min(kChunk, image.size() - written);
            file.write(image.subspan(written, count));
            written += count;
            reached(written);
        }
        file.sync();
    }
    // The record that comes next must never reach the medium before the bank's entry in the folder.
    m_files->syncFolder(m_folder.path());
}

void FlashStore::storeState(const FlashState& state) {
    // The copy first: until the record itself is replaced, the old state is in force.
    storeRecord(state, m_folder.copy());
    storeRecord(state, m_folder.record());
    m_files->syncFolder(m_folder.path());
    const utils::Mutex::AutoLocker lock(m_damageMutex);
    m_logged.clear();
}

void FlashStore::storeRecord(const FlashState& state, const std::string& path) {
    const std::string made = m_folder.file("state.new");
    {
        FlashFile file(*m_files, made);
        file.write(encodeFlashState(state));
        file.sync();
    }
    // A rename is atomic: a reader, and the next start after a power cut, finds the old record or the new
    // one.
    m_files->rename(made, path);
}

}  // namespace ma
