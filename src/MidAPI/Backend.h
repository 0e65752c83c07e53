// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/Activation.h"
#include "MidAPI/AdapterTypes.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"
#include "Utils/StringArray.h"

namespace ma {

/// One way to reach adapters: the operations of ma.h, which is where each one's contract stands. Every
/// operation may be called from any thread, also for a port that another thread is writing to.
class QUENX_EXPORT Backend {
  public:
    Backend() = default;
    Backend(const Backend&) = delete;
    Backend& operator=(const Backend&) = delete;
    virtual ~Backend();

    virtual std::string name() const;  ///< by which it is chosen; empty for one that cannot be
    virtual utils::StringArray enumerateAdapters() = 0;
    virtual utils::PCIAddr getPCIAddress(const std::string& adapter) = 0;
    virtual bool getCanBeUpdated(const std::string& adapter) = 0;
    virtual bool getAdapterFirmwareVersion(const std::string& adapter,
                                           std::vector<utils::FirmwareVersionInfo>& components) = 0;
    virtual int prepareFlashImage(const std::string& adapter, const std::uint8_t* file,
                                  std::uint32_t fileSize, std::uint8_t* output, std::uint32_t* imageSize,
                                  std::vector<utils::FirmwareType>& types) = 0;
    virtual bool writeFlashImage(const std::string& adapter, const std::uint8_t* image,
                                 std::uint32_t imageSize, std::uint32_t& errorCode,
                                 std::string& errorText) = 0;
    virtual bool updateCapabilityWord(const std::string& adapter,
                                      const std::vector<utils::FirmwareType>& types, std::uint32_t& errorCode,
                                      std::string& errorText) = 0;
    virtual std::uint16_t getFlashImageUpdateProgress(const std::string& adapter) = 0;
    virtual bool setBootType(const std::string& adapter, BootType type) = 0;
    virtual AdapterInfo getAdapterInfo(const std::string& adapter) = 0;
    virtual std::string describeSearch();

    // These a backend need not offer.
    virtual std::optional<ImageVerdict> judgeImage(const std::string& adapter,
                                                   std::span<const std::uint8_t> file,
                                                   const std::vector<utils::FirmwareType>& types);
    virtual CardUse getCardUse(const std::string& adapter, const std::string& caller);
    virtual Activation activate(const std::string& adapter, const ActivationRequest& request);
    virtual std::string stateFolder() const;
};

}  // namespace ma
