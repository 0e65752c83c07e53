// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "Utils/Export.h"
#include "Utils/Os/Linux/linux.h"

namespace ma {

/// Every change that the simulator makes to files, one system call each: the seam at which a test cuts the
/// power. All operations throw std::system_error, which names the file and the reason. No state; may be used
/// from any thread.
class QUENX_EXPORT FlashFiles {
  public:
    FlashFiles() = default;
    FlashFiles(const FlashFiles&) = delete;
    FlashFiles& operator=(const FlashFiles&) = delete;
    virtual ~FlashFiles();

    /// Makes one folder; it may be there already.
    virtual void makeFolder(const std::string& path);
    /// Opens an empty file for writing, emptying one that is there; the caller closes the descriptor.
    virtual int create(const std::string& path);
    /// Writes all bytes at the end of what was written so far.
    virtual void write(int descriptor, std::span<const std::uint8_t> bytes);
    /// Returns when what was written is on the medium.
    virtual void sync(int descriptor);
    virtual void rename(const std::string& from, const std::string& to);
    /// Returns when the entries of a folder (files made or renamed in it) are on the medium.
    virtual void syncFolder(const std::string& path);
};

/// CRC-32 as in IEEE 802.3 (reflected, polynomial 0x04C11DB7, start and final inversion).
std::uint32_t crc32(std::span<const std::uint8_t> bytes);

/// One bank: how long its content is, and its checksum. Length 0: nothing was written to it yet.
struct FlashBank {
    std::uint32_t length = 0;
    std::uint32_t checksum = 0;

    bool holds(std::span<const std::uint8_t> content) const;
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
};

inline constexpr std::size_t kFlashStateLength = 44;

std::array<std::uint8_t, kFlashStateLength> encodeFlashState(const FlashState& state);

/// Nothing when the bytes are no whole, intact record.
std::optional<FlashState> decodeFlashState(std::span<const std::uint8_t> bytes);

/// The persistent flash of one adapter: a folder with two banks and a record that says which of them is
/// booted. An update goes into the other bank; then the record is replaced in one step. So whenever the power
/// goes, the adapter boots the old image or the new one, and either is complete. Reading never waits for a
/// writer. The folder is made at the first write; until then the adapter is as it left the factory. May be
/// used from any thread and by several processes at once. Operations throw std::runtime_error:
/// std::system_error for a file, the other for damage.
class FlashStore {
  public:
    /// @param factoryFlash  the content of a flash that was never written to
    /// @param factoryState  boot type and capability word likewise
    FlashStore(std::string folder, std::vector<std::uint8_t> factoryFlash, FlashState factoryState,
               std::shared_ptr<FlashFiles> files);

    FlashState state() const;

    /// The content of the bank that the adapter boots: the active one or, when that is damaged, the other
    /// one.
    std::vector<std::uint8_t> content() const;

    /// The right to write an image, for as long as the result lives; see os::FileLock::isHeld().
    os::FileLock lockForWriting();

    /// Writes an image into the bank that is not booted, then makes it the one that is. `reached` is called
    /// with the bytes written so far, first with 0; an exception from it leaves the adapter with the old
    /// image. The caller holds the writing lock.
    void write(std::span<const std::uint8_t> image, const std::function<void(std::size_t)>& reached);

    /// Changes boot type or capability word.
    void changeState(const std::function<void(FlashState&)>& change);

  private:
    std::string path(const char* file) const { return m_folder + "/" + file; }
    std::string bankPath(std::uint8_t bank) const { return path(bank == 0 ? "bank-0.rom" : "bank-1.rom"); }
    void makeFolders();
    FlashState initialise();
    void writeBank(std::uint8_t bank, std::span<const std::uint8_t> image,
                   const std::function<void(std::size_t)>& reached);
    void storeState(FlashState state);
    std::optional<FlashState> storedState() const;
    std::optional<std::vector<std::uint8_t>> bankContent(const FlashState& state, std::uint8_t bank) const;
    std::uint8_t bootedBank(const FlashState& state) const;

    const std::string m_folder;
    const std::vector<std::uint8_t> m_factoryFlash;
    const FlashState m_factoryState;
    const std::shared_ptr<FlashFiles> m_files;
};

}  // namespace ma
