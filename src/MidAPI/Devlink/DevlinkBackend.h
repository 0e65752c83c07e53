// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/Backend.h"
#include "MidAPI/Devlink/AdapterTable.h"
#include "MidAPI/Devlink/Machine.h"
#include "MidAPI/Devlink/PackageVerdict.h"
#include "MidAPI/Devlink/Settings.h"
#include "Utils/Export.h"
#include "Utils/Os/Linux/Mutex.h"

namespace ma::devlink {

/// The backend of the machine's own adapters, through the kernel's devlink. An adapter is a PCI function, its
/// name the function's address. Several processes may work on the adapters of one machine.
class QUENX_EXPORT DevlinkBackend : public Backend {
  public:
    explicit DevlinkBackend(Settings settings,
                            std::shared_ptr<Machine> machine = std::make_shared<LinuxMachine>());
    ~DevlinkBackend() override;

    utils::StringArray enumerateAdapters() override;
    utils::PCIAddr getPCIAddress(const std::string& adapter) override;
    bool getCanBeUpdated(const std::string& adapter) override;
    bool getAdapterFirmwareVersion(const std::string& adapter,
                                   std::vector<utils::FirmwareVersionInfo>& components) override;
    int prepareFlashImage(const std::string& adapter, const std::uint8_t* file, std::uint32_t fileSize,
                          std::uint8_t* output, std::uint32_t* imageSize,
                          std::vector<utils::FirmwareType>& types) override;
    /// Only what was prepared for the adapter last is written.
    bool writeFlashImage(const std::string& adapter, const std::uint8_t* image, std::uint32_t imageSize,
                         std::uint32_t& errorCode, std::string& errorText) override;
    /// Devlink has no such word: reads the adapter's versions anew, and fails only when it is gone.
    bool updateCapabilityWord(const std::string& adapter, const std::vector<utils::FirmwareType>& types,
                              std::uint32_t& errorCode, std::string& errorText) override;
    std::uint16_t getFlashImageUpdateProgress(const std::string& adapter) override;
    /// Devlink knows no boot protocols: does nothing, and says so by false.
    bool setBootType(const std::string& adapter, BootType type) override;
    AdapterInfo getAdapterInfo(const std::string& adapter) override;
    std::string name() const override { return kDevlinkBackend; }
    std::string describeSearch() override;
    std::optional<ImageVerdict> judgeImage(const std::string& adapter, std::span<const std::uint8_t> file,
                                           const std::vector<utils::FirmwareType>& types) override;
    CardUse getCardUse(const std::string& adapter, const std::string& caller) override;
    Activation activate(const std::string& adapter, const ActivationRequest& request) override;

  private:
    /// What was prepared last for an adapter: the write is only told the bytes.
    struct Prepared {
        std::size_t size = 0;
        std::uint32_t checksum = 0;
        std::vector<std::string> components;
        /// The card's versions then. Empty once this process has written to it.
        std::optional<std::vector<NamedVersion>> heldAgainst;
        std::chrono::steady_clock::time_point end;  ///< until then the write is expected

        bool isOf(std::span<const std::uint8_t> image) const;
    };

    KnownFunction require(const std::string& adapter);
    PackageVerdict assess(const KnownFunction& known, std::span<const std::uint8_t> file,
                          const std::vector<utils::FirmwareType>& types);
    bool accepts(const KnownFunction& known, const std::string& component);
    void remember(const KnownFunction& known, std::span<const std::uint8_t> image,
                  const std::vector<std::string>& components);
    void write(const std::string& adapter, std::span<const std::uint8_t> image);
    KnownFunction readUnderLock(const std::string& adapter);
    std::string stagingFolder();
    Prepared takePrepared(const std::string& adapter, std::span<const std::uint8_t> image);
    void forgetVersions(const std::string& adapter);

    const Settings m_settings;
    const std::shared_ptr<Machine> m_machine;
    AdapterTable m_table;
    utils::Mutex m_preparedMutex;
    std::map<std::string, Prepared> m_prepared QUENX_GUARDED_BY(m_preparedMutex);
};

}  // namespace ma::devlink
