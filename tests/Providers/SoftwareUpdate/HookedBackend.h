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
    std::function<void(const std::string& operation)> hook;
    std::optional<int> prepareStatus;
    std::optional<std::string> capabilityText;  ///< also of a word that was written
    std::function<void(const std::string& adapter, ma::AdapterInfo& info)> told;
    std::atomic<int> progress{-1};  ///< instead of what the next one says; may change at any time

    /// Has every call of the operation wait from now on, until letGo().
    void hold(const std::string& operation) {
        m_holds = true;
        m_isHeld = false;
        hook = [this, operation](const std::string& called) {
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

    std::string name() const override { return m_next->name(); }
    utils::StringArray enumerateAdapters() override { return at("enumerateAdapters").enumerateAdapters(); }
    utils::PCIAddr getPCIAddress(const std::string& adapter) override {
        return at("getPCIAddress").getPCIAddress(adapter);
    }
    bool getCanBeUpdated(const std::string& adapter) override { return m_next->getCanBeUpdated(adapter); }
    bool getAdapterFirmwareVersion(const std::string& adapter,
                                   std::vector<utils::FirmwareVersionInfo>& components) override {
        return at("getAdapterFirmwareVersion").getAdapterFirmwareVersion(adapter, components);
    }
    int prepareFlashImage(const std::string& adapter, const std::uint8_t* file, std::uint32_t fileSize,
                          std::uint8_t* output, std::uint32_t* imageSize,
                          std::vector<utils::FirmwareType>& types) override {
        const int status =
            at("prepareFlashImage").prepareFlashImage(adapter, file, fileSize, output, imageSize, types);
        return prepareStatus.value_or(status);
    }
    bool writeFlashImage(const std::string& adapter, const std::uint8_t* image, std::uint32_t imageSize,
                         std::uint32_t& errorCode, std::string& errorText) override {
        return at("writeFlashImage").writeFlashImage(adapter, image, imageSize, errorCode, errorText);
    }
    bool updateCapabilityWord(const std::string& adapter, const std::vector<utils::FirmwareType>& types,
                              std::uint32_t& errorCode, std::string& errorText) override {
        const bool isDone =
            at("updateCapabilityWord").updateCapabilityWord(adapter, types, errorCode, errorText);
        errorText = capabilityText.value_or(errorText);
        return isDone;
    }
    std::uint16_t getFlashImageUpdateProgress(const std::string& adapter) override {
        const std::uint16_t next = at("getFlashImageUpdateProgress").getFlashImageUpdateProgress(adapter);
        const int answer = progress;
        return answer < 0 ? next : static_cast<std::uint16_t>(answer);
    }
    bool setBootType(const std::string& adapter, ma::BootType type) override {
        return at("setBootType").setBootType(adapter, type);
    }
    ma::AdapterInfo getAdapterInfo(const std::string& adapter) override {
        ma::AdapterInfo info = at("getAdapterInfo").getAdapterInfo(adapter);
        if (told) told(adapter, info);
        return info;
    }

  private:
    /// The next backend, after the hook.
    ma::Backend& at(const char* operation) const {
        if (hook) hook(operation);
        return *m_next;
    }

    std::shared_ptr<ma::Backend> m_next;
    std::atomic<bool> m_holds{false};
    std::atomic<bool> m_isHeld{false};
};

}  // namespace test
