// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <set>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/Simulator/FlashFiles.h"
#include "MidAPI/Simulator/FlashFolder.h"
#include "MidAPI/Simulator/FlashState.h"
#include "Utils/Os/Linux/FileLock.h"
#include "Utils/Os/Linux/Mutex.h"

namespace ma {

/// The persistent flash of one adapter: a folder with two banks and a record that says which of them is
/// booted. An update goes into the other bank; then the record is replaced in one step. So whenever the power
/// goes, the adapter boots the old image or the new one, and either is complete. A damaged record is made up
/// for by its copy or the banks, and the log says so. Reading never waits for a writer. The folder is made at
/// the first write, for its owner alone; until then the adapter is as it left the factory. May be used from
/// any thread and by several processes at once. Operations throw std::runtime_error: std::system_error or
/// os::ForeignFile for a file, OperationFailure when another process does not let go of the record, others
/// for damage.
class FlashStore {
  public:
    /// @param factoryFlash  the content of a flash that was never written to
    /// @param factoryState  boot type and capability word likewise
    FlashStore(std::string folder, std::vector<std::uint8_t> factoryFlash, FlashState factoryState,
               std::shared_ptr<FlashFiles> files);

    FlashState state() const { return findState().state.value_or(m_factoryState); }

    /// The content of the bank that the adapter boots: the active one or, when that is damaged, the other
    /// one.
    std::vector<std::uint8_t> content() const;

    /// The right to write an image, for as long as the result lives; see os::FileLock::isHeld().
    os::FileLock lockForWriting();
    /// Who has that right, for a person. Empty where nobody has it, and for who may not take it himself.
    std::string writer() const;

    /// Writes an image into the bank that is not booted, then makes it the one that is. `reached` is called
    /// with the bytes written so far, first with 0; an exception from it leaves the adapter with the old
    /// image. The caller holds the writing lock.
    void write(std::span<const std::uint8_t> image, const std::function<void(std::size_t)>& reached);

    /// Changes boot type or capability word.
    void changeState(const std::function<void(FlashState&)>& change);

  private:
    void makeFolders();
    FoundState findState() const;
    FoundState logOnce(FoundState found) const;
    FlashState initialise();
    void writeBank(std::uint8_t bank, std::span<const std::uint8_t> image,
                   const std::function<void(std::size_t)>& reached);
    void storeState(const FlashState& state);
    void storeRecord(const FlashState& state, const std::string& path);
    std::uint8_t bootedBank(const FlashState& state) const;

    const FlashFolder m_folder;
    const std::vector<std::uint8_t> m_factoryFlash;
    const FlashState m_factoryState;
    const std::shared_ptr<FlashFiles> m_files;
    mutable utils::Mutex m_damageMutex;
    mutable std::set<std::string> m_logged QUENX_GUARDED_BY(m_damageMutex);  ///< damage since the last change
};

}  // namespace ma
