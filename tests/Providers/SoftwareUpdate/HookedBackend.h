#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "MidAPI/Backend.h"

namespace test {

/// Passes every operation on to another backend, after a hook that may wait or throw, and answers some of
/// them itself where a test says so.
class HookedBackend : public ma::Backend {
  public:
    struct Refusal {
        uint32_t code;
        std::string text;
        bool succeeds = false;  ///< the operation reports success, and leaves code and text all the same
    };

    explicit HookedBackend(std::shared_ptr<ma::Backend> next) : m_next(std::move(next)) {}

    // Set before the backend is used, or while nothing uses it.
    std::function<void(const std::string& operation, const std::string& adapter)> hook;
    std::optional<int> prepareStatus;
    std::optional<Refusal> writeAnswer;
    std::optional<Refusal> capabilityAnswer;

    utils::StringArray enumerateAdapters() override;
    utils::PCIAddr getPCIAddress(const std::string& adapter) override;
    bool getCanBeUpdated(const std::string& adapter) override;
    bool getAdapterFirmwareVersion(const std::string& adapter,
                                   std::vector<utils::FirmwareVersionInfo>& components) override;
    int prepareFlashImage(const std::string& adapter, const uint8_t* file, uint32_t fileSize, uint8_t* output,
                          uint32_t* imageSize, std::vector<utils::FirmwareType>& types) override;
    bool writeFlashImage(const std::string& adapter, const uint8_t* image, uint32_t imageSize,
                         uint32_t& errorCode, std::string& errorText) override;
    bool updateCapabilityWord(const std::string& adapter, const std::vector<utils::FirmwareType>& types,
                              uint32_t& errorCode, std::string& errorText) override;
    uint16_t getFlashImageUpdateProgress(const std::string& adapter) override;
    bool setBootType(const std::string& adapter, ma::BootType type) override;
    ma::AdapterInfo getAdapterInfo(const std::string& adapter) override;

  private:
    void call(const char* operation, const std::string& adapter) const {
        if (hook) hook(operation, adapter);
    }

    std::shared_ptr<ma::Backend> m_next;
};

}  // namespace test
