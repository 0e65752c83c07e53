#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/Simulator/FileLock.h"
#include "MidAPI/Simulator/FlashFiles.h"
#include "MidAPI/Simulator/FlashState.h"

namespace ma {

/// The persistent flash of one adapter: a folder with two banks and a record that says which of them is
/// booted. An update goes into the other bank; then the record is replaced in one step. So whenever the power
/// goes, the adapter boots the old image or the new one, and either is complete. Reading never waits for a
/// writer. The folder is made at the first write; until then the adapter is as it left the factory. May be
/// used from any thread and by several processes at once. Operations throw FlashError.
class FlashStore {
  public:
    /// @param factoryFlash  the content of a flash that was never written to
    /// @param factoryState  boot type and capability word likewise
    FlashStore(std::string folder, std::vector<uint8_t> factoryFlash, FlashState factoryState,
               std::shared_ptr<FlashFiles> files);

    FlashState state() const;

    /// The content of the bank that the adapter boots: the active one or, when that is damaged, the other
    /// one.
    std::vector<uint8_t> content() const;

    /// The right to write an image, for as long as the result lives; see FileLock::isHeld().
    FileLock lockForWriting();

    /// Writes an image into the bank that is not booted, then makes it the one that is. `reached` is called
    /// with the bytes written so far, first with 0; an exception from it leaves the adapter with the old
    /// image. The caller holds the writing lock.
    void write(std::span<const uint8_t> image, const std::function<void(std::size_t)>& reached);

    /// Changes boot type or capability word.
    void changeState(const std::function<void(FlashState&)>& change);

  private:
    std::string path(const char* file) const { return m_folder + "/" + file; }
    std::string bankPath(uint8_t bank) const { return path(bank == 0 ? "bank-0.rom" : "bank-1.rom"); }
    void makeFolders();
    FlashState initialise();
    void writeBank(uint8_t bank, std::span<const uint8_t> image,
                   const std::function<void(std::size_t)>& reached);
    void storeState(FlashState state);
    std::optional<FlashState> storedState() const;
    std::optional<std::vector<uint8_t>> bankContent(const FlashState& state, uint8_t bank) const;
    uint8_t bootedBank(const FlashState& state) const;

    const std::string m_folder;
    const std::vector<uint8_t> m_factoryFlash;
    const FlashState m_factoryState;
    const std::shared_ptr<FlashFiles> m_files;
};

}  // namespace ma
