// SPDX-License-Identifier: Apache-2.0
#include "InstantAdapters.h"

#include "MidAPI/ma.h"
#include "Support/TestRoms.h"
#include "Utils/Log.h"

namespace bench {

namespace {

constexpr std::size_t kPortsPerCard = 4;
constexpr std::size_t kDevicesPerBus = 32;

/// A check must not keep the adapter from the next one.
constexpr const char* kSettings = "ReleaseClaimAfterCheck=1\n";

class InstantBackend : public ma::Backend {
  public:
    explicit InstantBackend(std::size_t ports) {
        for (std::size_t i = 0; i < ports; ++i)
            m_names.push_back(InstantAdapters::portName(i));
    }

    utils::StringArray enumerateAdapters() override { return m_names; }

    utils::PCIAddr getPCIAddress(const std::string& adapter) override {
        const std::size_t index = std::stoul(adapter.substr(4));
        const std::size_t card = index / kPortsPerCard;
        return {static_cast<std::uint8_t>(card / kDevicesPerBus),
                static_cast<std::uint8_t>(card % kDevicesPerBus),
                static_cast<std::uint8_t>(index % kPortsPerCard), false, adapter};
    }

    bool getCanBeUpdated(const std::string&) override { return true; }

    bool getAdapterFirmwareVersion(const std::string&, std::vector<utils::FirmwareVersionInfo>&) override {
        return true;
    }

    int prepareFlashImage(const std::string&, const std::uint8_t*, std::uint32_t, std::uint8_t*,
                          std::uint32_t*, std::vector<utils::FirmwareType>&) override {
        return ma::PrepareStatus::Prepared;
    }

    bool writeFlashImage(const std::string&, const std::uint8_t*, std::uint32_t, std::uint32_t&,
                         std::string&) override {
        return true;
    }

    bool updateCapabilityWord(const std::string&, const std::vector<utils::FirmwareType>&, std::uint32_t&,
                              std::string&) override {
        return true;
    }

    std::uint16_t getFlashImageUpdateProgress(const std::string&) override { return 0; }
    bool setBootType(const std::string&, ma::BootType) override { return true; }
    ma::AdapterInfo getAdapterInfo(const std::string&) override { return {}; }

  private:
    utils::StringArray m_names;
};

}  // namespace

InstantAdapters::InstantAdapters(std::size_t ports, std::size_t images)
    : m_config(m_folder.write("provider.conf", "FWFilePath=" + m_folder.path() + "\n" + kSettings)),
      m_imageUri("file://" + m_folder.write("image.rom", test::madeRom({{utils::FirmwareType::PXE, 2}}))) {
    for (std::uint32_t i = 1; i < images; ++i) {
        m_folder.write("image" + std::to_string(i) + ".rom",
                       test::madeRom({{utils::FirmwareType::PXE, 2 + i}}));
    }
    utils::logLevel = 0;  // what is measured is not the system log
    m_previous = ma::setBackend(std::make_shared<InstantBackend>(ports));
}

InstantAdapters::~InstantAdapters() {
    ma::setBackend(m_previous);
}

std::string InstantAdapters::portName(std::size_t index) {
    return "port" + std::to_string(index);
}

}  // namespace bench
