// SPDX-License-Identifier: Apache-2.0
#include "Support/TestRoms.h"

#include <algorithm>
#include <sstream>

#include "Support/TempFolder.h"
#include "Utils/Utils.h"

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

std::vector<std::uint8_t> bytesOf(const std::string& words) {
    std::vector<std::uint8_t> bytes;
    std::istringstream stream(words);
    for (std::string word; stream >> word;) {
        if (word.starts_with('"')) {
            bytes.insert(bytes.end(), word.begin() + 1, word.end() - 1);
            continue;
        }
        for (std::size_t digit = 0; digit < word.size(); digit += 2)
            bytes.push_back(static_cast<std::uint8_t>(std::stoi(word.substr(digit, 2), nullptr, 16)));
    }
    return bytes;
}

std::vector<utils::FirmwareType> typesOf(const std::string& words) {
    if (words == "all") return {};
    const std::vector<std::string> names{"none", "IMG_CLP", "IMG_iSCSI", "IMG_PXE", "IMG_UEFI", "IMG_FCoE"};
    std::vector<utils::FirmwareType> types;
    for (const std::string& word : utils::split(words, '+')) {
        const auto number = std::ranges::find(names, word) - names.begin();
        types.push_back(static_cast<utils::FirmwareType>(word == "77" ? 77 : number));
    }
    return types;
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
