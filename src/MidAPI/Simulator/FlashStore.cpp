// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Simulator/FlashStore.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <stdexcept>
#include <string_view>
#include <system_error>

#include "MidAPI/Image/RomFormat.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/linux.h"

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

constexpr std::array<std::uint32_t, 256> makeCrcTable() {
    std::array<std::uint32_t, 256> table{};
    for (std::uint32_t index = 0; index < table.size(); ++index) {
        std::uint32_t value = index;
        for (int bit = 0; bit < 8; ++bit)
            value = value >> 1 ^ (value & 1 ? 0xEDB88320U : 0U);
        table[index] = value;
    }
    return table;
}
constexpr std::array<std::uint32_t, 256> kCrcTable = makeCrcTable();

constexpr std::size_t kChunk = 4096;  // a sector of the flash
constexpr const char* kStateFile = "state";
constexpr const char* kNewStateFile = "state.new";

constexpr mode_t kFolderMode = 0755;
constexpr mode_t kFileMode = 0644;

[[noreturn]] void fail(const std::string& what) {
    throw std::system_error(errno, std::generic_category(), what);
}

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

}  // namespace

FlashFiles::~FlashFiles() = default;

void FlashFiles::makeFolder(const std::string& path) {
    if (::mkdir(path.c_str(), kFolderMode) != 0 && errno != EEXIST) fail("cannot make the folder " + path);
}

int FlashFiles::create(const std::string& path) {
    // A link in the state directory must not lead the daemon, which is root, to another file.
    const int descriptor =
        ::open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC | O_NOFOLLOW, kFileMode);
    if (descriptor < 0) fail("cannot write the file " + path);
    return descriptor;
}

void FlashFiles::write(int descriptor, std::span<const std::uint8_t> bytes) {
    // A signal, or a medium that is nearly full, ends a write early.
    while (!bytes.empty()) {
        const ssize_t written = ::write(descriptor, bytes.data(), bytes.size());
        if (written < 0 && errno == EINTR) continue;
        if (written < 0) fail("cannot write to the flash");
        bytes = bytes.subspan(static_cast<std::size_t>(written));
    }
}

void FlashFiles::sync(int descriptor) {
    if (::fsync(descriptor) != 0) fail("cannot bring the flash to the medium");
}

void FlashFiles::rename(const std::string& from, const std::string& to) {
    if (::rename(from.c_str(), to.c_str()) != 0) fail("cannot rename " + from);
}

void FlashFiles::syncFolder(const std::string& path) {
    const os::Descriptor folder(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (folder.number() < 0) fail("cannot open the folder " + path);
    if (::fsync(folder.number()) != 0) fail("cannot bring the folder " + path + " to the medium");
}

std::uint32_t crc32(std::span<const std::uint8_t> bytes) {
    std::uint32_t value = 0xFFFFFFFFU;
    for (const std::uint8_t byte : bytes)
        value = value >> 8 ^ kCrcTable[(value ^ byte) & 0xFF];
    return ~value;
}

bool FlashBank::holds(std::span<const std::uint8_t> content) const {
    return length != 0 && content.size() == length && crc32(content) == checksum;
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

FlashStore::FlashStore(std::string folder, std::vector<std::uint8_t> factoryFlash, FlashState factoryState,
                       std::shared_ptr<FlashFiles> files)
    : m_folder(std::move(folder)),
      m_factoryFlash(std::move(factoryFlash)),
      m_factoryState(factoryState),
      m_files(std::move(files)) {}

std::optional<FlashState> FlashStore::storedState() const {
    const auto bytes = os::readWholeFile(path(kStateFile), kFlashStateLength + 1);
    if (!bytes) return std::nullopt;
    if (std::optional<FlashState> state = decodeFlashState(*bytes)) return state;
    throw std::runtime_error("the record " + path(kStateFile) + " is damaged; remove the folder " + m_folder +
                             " to have the adapter as it left the factory");
}

FlashState FlashStore::state() const {
    return storedState().value_or(m_factoryState);
}

std::optional<std::vector<std::uint8_t>> FlashStore::bankContent(const FlashState& state,
                                                                 std::uint8_t bank) const {
    const FlashBank& expected = state.banks[bank];
    // The file may be longer: an update that was cut off left it so. The checksum is that of the recorded
    // length.
    auto bytes = os::readWholeFile(bankPath(bank), expected.length);
    if (bytes && expected.holds(*bytes)) return bytes;
    return std::nullopt;
}

std::vector<std::uint8_t> FlashStore::content() const {
    constexpr int kMaxTries = 8;  // each one more takes two whole updates in between
    for (int attempt = 0; attempt < kMaxTries; ++attempt) {
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
    throw std::runtime_error("no bank in " + m_folder +
                             " is intact; remove the folder to have the adapter as it left the factory");
}

os::FileLock FlashStore::lockForWriting() {
    makeFolders();
    return os::FileLock(path("flash.lock"), os::FileLock::Mode::Try);
}

void FlashStore::write(std::span<const std::uint8_t> image, const std::function<void(std::size_t)>& reached) {
    const FlashState before = initialise();
    // The bank that boots may be the inactive one, when the active one is damaged; it must survive a power
    // cut here.
    const auto bank = static_cast<std::uint8_t>(1 - bootedBank(before));
    writeBank(bank, image, reached);
    changeState([&](FlashState& state) {
        state.banks[bank] = {static_cast<std::uint32_t>(image.size()), crc32(image)};
        state.activeBank = bank;
    });
}

void FlashStore::changeState(const std::function<void(FlashState&)>& change) {
    initialise();
    // Reading, changing and storing is one step for other processes: the boot type may change during a flash.
    const os::FileLock lock(path("state.lock"), os::FileLock::Mode::Wait);
    FlashState state = this->state();
    change(state);
    ++state.generation;
    storeState(state);
}

/// Gives a factory-fresh adapter its files, so that a change has something to change.
FlashState FlashStore::initialise() {
    makeFolders();
    const os::FileLock lock(path("state.lock"), os::FileLock::Mode::Wait);
    // Another process may have made the files while we waited for the lock.
    if (std::optional<FlashState> stored = storedState()) return *stored;
    FlashState state = m_factoryState;
    state.activeBank = 0;
    state.banks = {};
    state.banks[0] = {static_cast<std::uint32_t>(m_factoryFlash.size()), crc32(m_factoryFlash)};
    writeBank(0, m_factoryFlash, [](std::size_t) {});
    storeState(state);
    return state;
}

std::uint8_t FlashStore::bootedBank(const FlashState& state) const {
    if (state.active().length == 0 || bankContent(state, state.activeBank)) return state.activeBank;
    return bankContent(state, state.inactiveBank()) ? state.inactiveBank() : state.activeBank;
}

void FlashStore::makeFolders() {
    struct stat found {};
    if (::stat(m_folder.c_str(), &found) == 0) return;
    // One by one, each entry brought to the medium: a folder that a power cut takes away takes the banks with
    // it.
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

void FlashStore::writeBank(std::uint8_t bank, std::span<const std::uint8_t> image,
                           const std::function<void(std::size_t)>& reached) {
    reached(0);
    {
        FlashFile file(*m_files, bankPath(bank));
        for (std::size_t written = 0; written < image.size();) {
            const std::size_t count = std::min(kChunk, image.size() - written);
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
    // A rename is atomic: a reader, and the next start after a power cut, finds the old record or the new
    // one.
    {
        FlashFile file(*m_files, path(kNewStateFile));
        file.write(encodeFlashState(state));
        file.sync();
    }
    m_files->rename(path(kNewStateFile), path(kStateFile));
    m_files->syncFolder(m_folder);
}

}  // namespace ma
