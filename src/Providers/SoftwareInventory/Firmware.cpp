#include "Providers/SoftwareInventory/Firmware.h"

#include <cinttypes>

#include "Utils/Utils.h"

namespace inventory {

namespace {

/// 64-bit FNV-1a: tells files apart that are kept side by side, and is no protection against a forger.
std::uint64_t hashOf(std::span<const std::uint8_t> bytes) {
    std::uint64_t hash = 0xcbf29ce484222325ULL;
    for (const std::uint8_t byte : bytes)
        hash = (hash ^ byte) * 0x100000001b3ULL;
    return hash;
}

std::vector<FirmwareComponent> named(const std::vector<utils::FirmwareVersionInfo>& components) {
    std::vector<FirmwareComponent> result;
    for (const utils::FirmwareVersionInfo& component : components) {
        const std::string_view type = ma::firmwareTypeName(component.type);
        if (!type.empty()) result.push_back({std::string(type), component.version});
    }
    return result;
}

}  // namespace

Firmware describeImage(std::span<const std::uint8_t> file, const ma::RomFile& rom) {
    Firmware firmware;
    const ma::RomImage& first = rom.images.front();
    firmware.identifier = fmt("%04x-%04x-%016" PRIx64, first.vendorId, first.deviceId, hashOf(file));
    firmware.ids = ma::formatIds(first.vendorId, first.deviceId);
    firmware.components = named(rom.components());
    for (const ma::RomImage& image : rom.images) {
        if (firmware.manufacturer.empty()) firmware.manufacturer = image.manufacturer;
        if (firmware.product.empty()) firmware.product = image.product;
    }
    return firmware;
}

std::vector<Firmware> readInstalled(const std::vector<Port>& ports) {
    std::vector<Firmware> installed;
    for (const Port& port : ports) {
        const std::optional<ma::AdapterInfo> info = readInfo(port.adapter);
        if (!info) continue;
        for (FirmwareComponent& component : named(info->components)) {
            Firmware firmware;
            firmware.identifier = port.adapter + ":" + component.type;
            firmware.typeCode = SoftwareIdentity::INSTALLED_COMPONENT;
            firmware.adapter = port.adapter;
            firmware.ids = ma::formatIds(info->ids.vendor, info->ids.device);
            firmware.components.push_back(std::move(component));
            installed.push_back(std::move(firmware));
        }
    }
    return installed;
}

}  // namespace inventory
