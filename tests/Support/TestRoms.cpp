// SPDX-License-Identifier: Apache-2.0
#include "Support/TestRoms.h"

#include "Support/TempFolder.h"

namespace test {

std::string realRomPath(std::string_view name) {
    return "/usr/lib/ipxe/qemu/" + std::string(name) + ".rom";
}

std::vector<std::uint8_t> realRom(std::string_view name) {
    return readTestFile(realRomPath(name));
}

std::vector<std::uint8_t> withRevision(std::vector<std::uint8_t> rom, std::uint16_t revision) {
    for (const ma::RomImage& image : ma::parseOptionRom(rom).images)
        ma::setCodeRevision(rom, image, revision);
    return rom;
}

std::vector<std::uint8_t> madeRom(const std::vector<utils::FirmwareVersionInfo>& components,
                                  std::uint16_t vendor, std::uint16_t device) {
    std::vector<std::uint8_t> rom;
    for (const utils::FirmwareVersionInfo& component : components) {
        ma::NewRomImage image;
        image.type = component.type;
        image.vendorId = vendor;
        image.deviceId = device;
        image.codeRevision = static_cast<std::uint16_t>(component.version);
        rom = ma::mergeOptionRoms(rom, ma::makeRomImage(image));
    }
    return rom;
}

std::string describeComponents(const std::vector<utils::FirmwareVersionInfo>& components) {
    std::string text;
    for (const utils::FirmwareVersionInfo& component : components)
        text += (text.empty() ? "" : ", ") + std::string(ma::firmwareTypeName(component.type)) + " " +
                std::to_string(component.version);
    return text;
}

std::string describeRom(const std::vector<std::uint8_t>& rom) {
    return describeComponents(ma::parseOptionRom(rom).components());
}

}  // namespace test
