// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "MidAPI/Simulator/Simulator.h"
#include "MidAPI/ma.h"
#include "Support/TempFolder.h"

namespace test {

/// What the adapters of SimulatedAdapters are when a test does not say otherwise:
///   eth0, eth1  two functions of one card, 1af4:1041, bus 3; IMG_PXE 1 and IMG_UEFI 0
///   eth2        10ec:8139, bus 4; the same types
///   eth3        1022:2000, bus 5; cannot be updated
///   eth4        15ad:07b0, bus 6; IMG_iSCSI 1 and IMG_UEFI 0
/// All are written at full speed. The flash is made of small images, so that tests are fast.
extern const char* const kTestAdapters;

/// The simulator's files without the waiting for the medium, which tests have no use for: much faster.
class UnsyncedFiles : public ma::FlashFiles {
  public:
    void sync(int) override {}
    void syncFolder(const std::string&) override {}
};

/// Simulated adapters with a state of their own as the backend of ma.h, for the scope of a test. They can be
/// "switched off and on again" by restart().
class SimulatedAdapters {
  public:
    /// @param description  the text of an adapter description
    explicit SimulatedAdapters(std::string_view description = kTestAdapters,
                               std::shared_ptr<ma::FlashFiles> files = std::make_shared<UnsyncedFiles>());
    SimulatedAdapters(const SimulatedAdapters&) = delete;
    SimulatedAdapters& operator=(const SimulatedAdapters&) = delete;
    ~SimulatedAdapters();

    /// The running simulator: orders faults, looks into the flash.
    ma::Simulator& operator*() const { return *m_simulator; }
    ma::Simulator* operator->() const { return m_simulator.get(); }

    /// A new simulator on the state that the old one left.
    void restart();

    const TempFolder& folder() const { return m_folder; }
    std::string descriptionFile() const { return m_folder / "adapters.toml"; }
    std::string stateDirectory() const { return m_folder / "state"; }

  private:
    std::shared_ptr<ma::Simulator> makeSimulator() const;

    TempFolder m_folder;
    std::shared_ptr<ma::FlashFiles> m_files;
    std::shared_ptr<ma::Simulator> m_simulator;
    std::shared_ptr<ma::Backend> m_previous;
};

/// What ma::prepareFlashImage() made of a file.
struct PreparedImage {
    int status = 0;
    std::vector<std::uint8_t> image;         ///< `imageSize` bytes of the output
    std::vector<utils::FirmwareType> types;  ///< as they were left
};
PreparedImage prepareImage(const std::string& adapter, const std::vector<std::uint8_t>& file,
                           std::vector<utils::FirmwareType> types = {});

/// What ma::writeFlashImage() answered.
struct WriteResult {
    bool done = false;
    std::uint32_t code = 0;
    std::string text;
};
WriteResult writeImage(const std::string& adapter, const std::vector<std::uint8_t>& image);

/// "IMG_PXE 1, IMG_UEFI 0": what the adapter says that it carries.
std::string componentsOf(const std::string& adapter);

/// The text of the ma::AdapterError that the call throws; "none" when it throws none.
std::string adapterErrorOf(const std::function<void()>& call);

}  // namespace test
