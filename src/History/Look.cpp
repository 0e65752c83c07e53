// SPDX-License-Identifier: Apache-2.0
#include "History/Look.h"

#include "Control/Sha256.h"
#include "MidAPI/Devlink/PldmPackage.h"
#include "MidAPI/Image/OptionRom.h"
#include "MidAPI/ma.h"
#include "Utils/Exception.h"
#include "Utils/Utils.h"

namespace history {

namespace {

std::string sha256Of(std::span<const std::uint8_t> file) {
    control::Sha256 hash;
    hash.add(file.data(), file.size());
    return hash.take();
}

void append(std::string& list, const std::string& name, const std::string& version) {
    if (!version.empty()) list += (list.empty() ? "" : ", ") + name + (name.empty() ? "" : " ") + version;
}

std::string versionsIn(std::span<const std::uint8_t> file) {
    std::string versions;
    if (ma::devlink::packageFormat(file) == ma::devlink::PackageFormat::Known) {
        const ma::devlink::PldmPackage package = ma::devlink::readPldmPackage(file);
        if (package.error) return "";
        for (const ma::devlink::PldmComponent& component : package.components)
            append(versions, std::to_string(component.identifier), component.version);
        return versions;
    }
    const ma::RomFile rom = ma::parseOptionRom(file);
    if (rom.error) return "";
    for (const utils::FirmwareVersionInfo& component : rom.components())
        append(versions, std::string(ma::firmwareTypeName(component.type)),
               std::to_string(component.version));
    return versions;
}

}  // namespace

std::optional<AdapterLook> lookAt(const std::string& adapter) try {
    const ma::AdapterInfo info = ma::getAdapterInfo(adapter);
    AdapterLook look{.backend = info.backend,
                     .pciAddress = ma::getPCIAddress(adapter).text,
                     .serial = info.boardSerialNumber.empty() ? info.serialNumber : info.boardSerialNumber,
                     .running = {},
                     .stored = {},
                     .isStoredKnown = info.resetNeeded != ma::ResetNeeded::Unknown};
    for (const ma::NamedVersion& version : info.versions) {
        append(look.running, version.name, version.running);
        append(look.stored, version.name, version.stored.empty() ? version.running : version.stored);
    }
    if (!info.versions.empty()) return look;
    for (const utils::FirmwareVersionInfo& component : info.components)
        append(look.running, std::string(ma::firmwareTypeName(component.type)),
               std::to_string(component.version));
    look.stored = look.running;
    return look;
} catch (const std::exception&) {
    return std::nullopt;
}

core::ImageFacts factsOf(std::span<const std::uint8_t> file) {
    return {sha256Of(file), file.size(), versionsIn(file)};
}

}  // namespace history
