// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "MidAPI/Backend.h"
#include "Utils/Os/Linux/Thread.h"

namespace test {

/// Passes every operation on to another backend, after a hook that may wait or throw, and answers some of
/// them itself where a test says so.
class HookedBackend : public ma::Backend {
  public:
    explicit HookedBackend(std::shared_ptr<ma::Backend> next) : m_next(std::move(next)) {}

    // Set before the backend is used, or while nothing uses it.
    std::function<void(const std::string& operation, const std::string& adapter)> hook;
    std::optional<int> prepareStatus;
    std::optional<std::string> capabilityText;  ///< also of a word that was written

    /// Has every call of the operation wait from now on, until letGo().
    void hold(const std::string& operation) {
        m_holds = true;
        m_isHeld = false;
        hook = [this, operation](const std::string& called, const std::string&) {
            if (called != operation) return;
            m_isHeld = true;
            while (m_holds)
                utils::Thread::msleep(1);
        };
    }
    void waitUntilHeld() const {
        while (!m_isHeld)
            utils::Thread::msleep(1);
    }
    void letGo() { m_holds = false; }

    utils::StringArray enumerateAdapters() override {
        call("enumerateAdapters", "");
        return m_next->enumerateAdapters();
    }
    utils::PCIAddr getPCIAddress(const std::string& adapter) override {
        call("getPCIAddress", adapter);
        return m_next->getPCIAddress(adapter);
    }
    bool getCanBeUpdated(const std::string& adapter) override { return m_next->getCanBeUpdated(adapter); }
    bool getAdapterFirmwareVersion(const std::string& adapter,
                                   std::vector<utils::FirmwareVersionInfo>& components) override {
        call("getAdapterFirmwareVersion", adapter);
        return m_next->getAdapterFirmwareVersion(adapter, components);
    }
    int prepareFlashImage(const std::string& adapter, const std::uint8_t* file, std::uint32_t fileSize,
                          std::uint8_t* output, std::uint32_t* imageSize,
                          std::vector<utils::FirmwareType>& types) override {
        call("prepareFlashImage", adapter);
        const int status = m_next->prepareFlashImage(adapter, file, fileSize, output, imageSize, types);
        return prepareStatus.value_or(status);
    }
    bool writeFlashImage(const std::string& adapter, const std::uint8_t* image, std::uint32_t imageSize,
                         std::uint32_t& errorCode, std::string& errorText) override {
        call("writeFlashImage", adapter);
        return m_next->writeFlashImage(adapter, image, imageSize, errorCode, errorText);
    }
    bool updateCapabilityWord(const std::string& adapter, const std::vector<utils::FirmwareType>& types,
                              std::uint32_t& errorCode, std::string& errorText) override {
        call("updateCapabilityWord", adapter);
        const bool isDone = m_next->updateCapabilityWord(adapter, types, errorCode, errorText);
        errorText = capabilityText.value_or(errorText);
        return isDone;
    }
    std::uint16_t getFlashImageUpdateProgress(const std::string& adapter) override {
        call("getFlashImageUpdateProgress", adapter);
        return m_next->getFlashImageUpdateProgress(adapter);
    }
    bool setBootType(const std::string& adapter, ma::BootType type) override {
        call("setBootType", adapter);
        return m_next->setBootType(adapter, type);
    }
    ma::AdapterInfo getAdapterInfo(const std::string& adapter) override {
        call("getAdapterInfo", adapter);
        return m_next->getAdapterInfo(adapter);
    }

  private:
    void call(const char* operation, const std::string& adapter) const {
        if (hook) hook(operation, adapter);
    }

    std::shared_ptr<ma::Backend> m_next;
    std::atomic<bool> m_holds{false};
    std::atomic<bool> m_isHeld{false};
};

}  // namespace test
