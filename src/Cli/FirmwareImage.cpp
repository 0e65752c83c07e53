// SPDX-License-Identifier: Apache-2.0
#include "Cli/FirmwareImage.h"

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <system_error>

#include "Utils/Os/Linux/linux.h"

namespace cli {

namespace {

/// Beyond this the file is left to the service.
constexpr std::uint64_t LARGEST_READ = std::uint64_t{256} << 20;
constexpr std::uint64_t LARGEST_IMAGE = 0x7FFFFFFF;

Explanation notAnImage(const std::string& path, const std::string& why) {
    return {path + " " + why + ".", "Name a complete firmware image."};
}

/// Empty for a file that can be an image.
std::string kindProblem(const struct stat& info) {
    if (S_ISDIR(info.st_mode)) return "is a directory";
    if (!S_ISREG(info.st_mode)) return "is not a regular file";
    if (info.st_size == 0) return "is empty";
    const auto bytes = static_cast<std::uint64_t>(info.st_size);
    if (bytes > LARGEST_IMAGE) return "is larger than 2 GiB";
    return bytes > LARGEST_READ ? "is larger than any firmware image for a network adapter" : "";
}

std::string firstForeignIds(const ma::RomFile& rom, const std::string& adapterIds) {
    for (const ma::RomImage& image : rom.images) {
        const auto matches = [&](std::uint16_t device) {
            return ma::formatIds(image.vendorId, device) == adapterIds;
        };
        if (!matches(image.deviceId) &&
            std::none_of(image.furtherDeviceIds.begin(), image.furtherDeviceIds.end(), matches)) {
            return ma::formatIds(image.vendorId, image.deviceId);
        }
    }
    return {};
}

bool isChosen(const std::vector<std::string>& types, const std::string& type) {
    return types.empty() || std::find(types.begin(), types.end(), type) != types.end();
}

bool holds(const ma::RomFile& rom, const std::string& type) {
    const auto wanted = ma::firmwareTypeFromName(type);
    return wanted && std::any_of(rom.images.begin(), rom.images.end(),
                                 [&](const ma::RomImage& image) { return image.carries(*wanted); });
}

std::uint64_t bytesOf(const ma::RomFile& rom, const std::vector<std::string>& types) {
    std::uint64_t bytes = 0;
    for (const ma::RomImage& image : rom.images) {
        const bool wanted = types.empty() || std::any_of(types.begin(), types.end(), [&](const auto& name) {
                                const auto type = ma::firmwareTypeFromName(name);
                                return type && image.carries(*type);
                            });
        if (wanted) bytes += image.length;
    }
    return bytes;
}

}  // namespace

FirmwareImage readFirmwareImage(const std::string& path) {
    FirmwareImage image;
    image.path = path;
    struct stat info = {};
    if (stat(path.c_str(), &info) != 0) {
        image.problem = cannotRead(path, errno);
        return image;
    }
    if (const std::string why = kindProblem(info); !why.empty()) {
        image.problem = notAnImage(path, why);
        return image;
    }
    image.bytes = static_cast<std::uint64_t>(info.st_size);
    std::optional<std::vector<std::uint8_t>> content;
    try {
        content = os::readWholeFile(path, LARGEST_READ);
    } catch (const std::system_error& error) {
        image.problem = cannotRead(path, error.code().value());
        return image;
    }
    if (!content) {
        image.problem = cannotRead(path, ENOENT);
        return image;
    }
    image.rom = ma::parseOptionRom(*content);
    if (image.rom.error) {
        image.problem = notAnImage(path, "is not a complete firmware image: " + *image.rom.error);
    }
    return image;
}

Comparison compareImage(const FirmwareImage& image, const Adapter& adapter,
                        const std::vector<std::string>& types) {
    Comparison result;
    for (const utils::FirmwareVersionInfo& component : image.rom.components()) {
        const std::string type(ma::firmwareTypeName(component.type));
        if (!type.empty() && isChosen(types, type)) result.chosen.push_back({type, component.version});
    }
    for (const std::string& type : types) {
        if (!type.empty() && !holds(image.rom, type)) result.missing.push_back(type);
    }
    result.bytes = bytesOf(image.rom, types);
    if (!adapter.ids.empty()) result.foreignIds = firstForeignIds(image.rom, adapter.ids);
    result.isNetwork = std::all_of(image.rom.images.begin(), image.rom.images.end(),
                                   [](const ma::RomImage& one) { return one.isNetwork(); });
    result.current = !result.chosen.empty() &&
                     std::all_of(result.chosen.begin(), result.chosen.end(), [&](const Component& component) {
                         return versionOf(adapter.components, component.type) == component.version;
                     });
    return result;
}

}  // namespace cli
