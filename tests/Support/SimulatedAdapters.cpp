// SPDX-License-Identifier: Apache-2.0
#include "Support/SimulatedAdapters.h"

#include "Support/TestRoms.h"

namespace test {

const char* const kTestAdapters = R"(adapter = [
{ name = "eth0", pci_address = "0000:03:00.0", pci_id = "1af4:1041", mac = "52:54:00:00:00:10", components = [
  { type = "IMG_PXE" }, { type = "IMG_UEFI", revision = 0 } ], speed = 10_000_000_000 },
{ name = "eth1", pci_address = "0000:03:00.1", pci_id = "1af4:1041", mac = "52:54:00:00:00:11", components = [
  { type = "IMG_PXE" }, { type = "IMG_UEFI", revision = 0 } ], speed = 10_000_000_000, link = false },
{ name = "eth2", pci_address = "0000:04:00.0", pci_id = "10ec:8139", mac = "52:54:00:00:00:12", components = [
  { type = "IMG_PXE" }, { type = "IMG_UEFI", revision = 0 } ], speed = 100_000_000 },
{ name = "eth3", pci_address = "0000:05:00.0", pci_id = "1022:2000", mac = "52:54:00:00:00:13", components = [
  { type = "IMG_PXE" } ], updatable = false },
{ name = "eth4", pci_address = "0000:06:00.0", pci_id = "15ad:07b0", mac = "52:54:00:00:00:14", components = [
  { type = "IMG_iSCSI" }, { type = "IMG_UEFI", revision = 0 } ], boot_type = "iscsi" },
]
)";

SimulatedAdapters::SimulatedAdapters(std::string_view description, std::shared_ptr<ma::FlashFiles> files)
    : m_files(std::move(files)) {
    m_folder.write("adapters.toml", description);
    m_simulator = makeSimulator();
    m_previous = ma::setBackend(m_simulator);
}

std::shared_ptr<ma::Simulator> SimulatedAdapters::makeSimulator() const {
    return std::make_shared<ma::Simulator>(ma::loadAdapterDescriptions(descriptionFile()), stateDirectory(),
                                           m_files);
}

SimulatedAdapters::~SimulatedAdapters() {
    ma::setBackend(m_previous);
}

void SimulatedAdapters::restart() {
    m_simulator = makeSimulator();
    ma::setBackend(m_simulator);
}

PreparedImage prepareImage(const std::string& adapter, const std::vector<std::uint8_t>& file,
                           std::vector<utils::FirmwareType> types) {
    PreparedImage result;
    result.image.resize(file.size());
    result.types = std::move(types);
    auto size = static_cast<std::uint32_t>(file.size());
    result.status =
        ma::prepareFlashImage(adapter, file.data(), size, result.image.data(), &size, result.types);
    result.image.resize(size);
    return result;
}

WriteResult writeImage(const std::string& adapter, const std::vector<std::uint8_t>& image) {
    WriteResult result;
    result.done = ma::writeFlashImage(adapter, image.data(), static_cast<std::uint32_t>(image.size()),
                                      result.code, result.text);
    return result;
}

std::string componentsOf(const std::string& adapter) {
    std::vector<utils::FirmwareVersionInfo> components;
    if (!ma::getAdapterFirmwareVersion(adapter, components)) return "unreadable";
    return describeComponents(components);
}

std::string adapterErrorOf(const std::function<void()>& call) try {
    call();
    return "none";
} catch (const ma::AdapterError& error) {
    return error.what();
}

}  // namespace test
