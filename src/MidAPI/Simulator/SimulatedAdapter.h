// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Image/ImageBuffers.h"
#include "MidAPI/Image/OptionRom.h"
#include "MidAPI/Progress.h"
#include "MidAPI/Simulator/AdapterDescription.h"
#include "MidAPI/Simulator/Fault.h"
#include "MidAPI/Simulator/FlashStore.h"
#include "Utils/Os/Linux/Mutex.h"

namespace ma {

/// One simulated adapter port: the operations of ma.h for it. Thread-safe.
class SimulatedAdapter {
  public:
    SimulatedAdapter(AdapterDescription description, const std::string& stateDirectory,
                     std::shared_ptr<FlashFiles> files);

    const AdapterDescription& description() const { return m_description; }
    FaultList& faults() { return m_faults; }

    utils::PCIAddr address();
    bool readComponents(std::vector<utils::FirmwareVersionInfo>& components);
    int prepare(const ImageBuffers& buffers, std::uint32_t& imageSize,
                std::vector<utils::FirmwareType>& types);
    bool write(std::span<const std::uint8_t> image, std::uint32_t& errorCode, std::string& errorText);
    bool updateCapabilityWord(const std::vector<utils::FirmwareType>& types, std::uint32_t& errorCode,
                              std::string& errorText);
    std::uint16_t progress() const { return m_progress.percent(); }
    bool setBootType(BootType type);
    AdapterInfo info();

    /// What it remembers and what it boots; for tests and tools. Throw std::runtime_error.
    FlashState state() const { return m_store.state(); }
    std::vector<std::uint8_t> flashContent() const { return m_store.content(); }

  private:
    std::vector<utils::FirmwareVersionInfo> components();
    void requireWritable(std::span<const std::uint8_t> image) const;
    void requireUnchanged();
    void writeLocked(std::span<const std::uint8_t> image);
    PrepareStatus prepareOrThrow(const ImageBuffers& buffers, std::uint32_t& imageSize,
                                 std::vector<utils::FirmwareType>& types);

    const AdapterDescription m_description;
    FlashStore m_store;
    FaultList m_faults;
    Progress m_progress;

    /// What the flash held when it was last read, so that a query need not read it again.
    struct Cache {
        FlashState state;
        std::vector<utils::FirmwareVersionInfo> components;
    };
    utils::Mutex m_cacheMutex;
    std::optional<Cache> m_cache QUENX_GUARDED_BY(m_cacheMutex);
    /// What was installed when the image was prepared that is to be written next.
    std::optional<std::vector<utils::FirmwareVersionInfo>> m_heldAgainst QUENX_GUARDED_BY(m_cacheMutex);
};

}  // namespace ma
