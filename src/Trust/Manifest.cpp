// SPDX-License-Identifier: Apache-2.0
#include "Trust/Manifest.h"

#include <algorithm>
#include <filesystem>

#include "Control/Sha256.h"
#include "Trust/Refusal.h"
#include "Utils/Toml.h"
#include "Utils/Utils.h"

namespace trust {

namespace {

using core::ReasonId;
using utils::TomlTable;

std::optional<std::uint16_t> parseId(std::string_view text) {
    constexpr int kHexadecimal = 16;
    constexpr std::size_t kDigits = 4;
    if (text.size() != kDigits) return std::nullopt;
    return utils::parseNumber<std::uint16_t>(text, kHexadecimal);
}

/// "vendor:device" or "vendor:device:vendor:device", the latter those of the subsystem.
std::optional<DeviceIds> parseDevice(std::string_view text) {
    std::vector<std::uint16_t> ids;
    for (const std::string& part : utils::split(text, ':')) {
        const auto id = parseId(part);
        if (!id) return std::nullopt;
        ids.push_back(*id);
    }
    if (ids.size() == 2) return DeviceIds{ids[0], ids[1], std::nullopt};
    if (ids.size() == 4) return DeviceIds{ids[0], ids[1], {{ids[2], ids[3]}}};
    return std::nullopt;
}

std::vector<DeviceIds> readDevices(const TomlTable& table, std::string_view key) {
    const std::string expected = "PCI ids, such as [\"1af4:1041\", \"1af4:1041:1af4:1100\"]";
    const auto texts = table.texts(
        key, [](std::string_view text) { return parseDevice(text).has_value(); }, expected);
    // A manifest for every device would be none.
    if (!texts || texts->empty()) table.fail(key, "\"pci_ids\" must be a list of " + expected);
    std::vector<DeviceIds> devices;
    for (const std::string& text : *texts)
        devices.push_back(*parseDevice(text));
    return devices;
}

std::vector<NamedText> readVersions(const TomlTable& table, const toml::table& parsed, std::string_view key) {
    std::vector<NamedText> versions;
    const toml::node* const node = parsed.get(key);
    if (node == nullptr) return versions;
    const toml::table* const found = node->as_table();
    if (found == nullptr)
        table.fail(key, "\"" + std::string(key) + "\" must be a table, such as { IMG_PXE = \"2.1\" }");
    const TomlTable inner = table.inner(*found, std::string(key));
    for (const auto& [name, value] : *found)
        versions.emplace_back(name.str(), inner.requiredText(name.str(), "2.1"));
    return versions;
}

Manifest readManifest(const toml::table& parsed) {
    const TomlTable table(parsed, "the manifest");
    constexpr std::string_view kKeys[] = {"name", "size", "sha256", "pci_ids", "versions", "lowest_versions"};
    table.allowOnly(kKeys);
    Manifest manifest;
    manifest.name = table.requiredText("name", "port.rom");
    const auto size = table.number<std::int64_t>("size");
    if (!size) table.fail("size", "\"size\" is missing; write the bytes of the image");
    manifest.size = static_cast<std::uint64_t>(*size);
    manifest.sha256 = table.requiredText("sha256", "(what sha256sum prints)");
    if (!control::isSha256(manifest.sha256))
        table.refuse("sha256", manifest.sha256, "64 hexadecimal digits in lower case");
    manifest.devices = readDevices(table, "pci_ids");
    manifest.versions = readVersions(table, parsed, "versions");
    manifest.lowest = readVersions(table, parsed, "lowest_versions");
    return manifest;
}

bool fits(const DeviceIds& allowed, const std::array<std::uint16_t, 4>& ids) {
    if (allowed.vendor != ids[0] || allowed.device != ids[1]) return false;
    return !allowed.subsystem || *allowed.subsystem == std::array{ids[2], ids[3]};
}

void requireDevice(const Manifest& manifest, const core::ImageToVerify& image, const std::string& path) {
    if (!image.pciIds)
        throw Refusal(ReasonId::ManifestForOtherDevice,
                      path + " is for some devices only, and the adapter does not tell its PCI ids");
    if (isForDevice(manifest, image)) return;
    const std::array<std::uint16_t, 4>& ids = *image.pciIds;
    throw Refusal(ReasonId::ManifestForOtherDevice,
                  path + utils::formatStr(" is not for the adapter, which is %04x:%04x:%04x:%04x", ids[0],
                                          ids[1], ids[2], ids[3]));
}

}  // namespace

Manifest parseManifest(std::string_view text, const std::string& path) try {
    return readManifest(utils::parseToml(text));
} catch (const utils::TomlError& error) {
    throw Refusal(ReasonId::ManifestBad, error.in(path));
}

bool isForDevice(const Manifest& manifest, const core::ImageToVerify& image) {
    return image.pciIds && std::ranges::any_of(manifest.devices, [&](const DeviceIds& each) {
               return fits(each, *image.pciIds);
           });
}

void requireManifestFor(const Manifest& manifest, const core::ImageToVerify& image, const std::string& path) {
    const std::string name = std::filesystem::path(image.path).filename().string();
    if (manifest.name != name)
        throw Refusal(ReasonId::ManifestForOtherImage, path + " is for " + utils::inQuotes(manifest.name) +
                                                           ", not for " + utils::inQuotes(name));
    if (manifest.size != image.bytes.size())
        throw Refusal(ReasonId::ManifestDiffers, path + " names " + std::to_string(manifest.size) +
                                                     " bytes, and the image has " +
                                                     std::to_string(image.bytes.size()));
    control::Sha256 sum;
    sum.add(image.bytes.data(), image.bytes.size());
    if (const std::string found = sum.take(); manifest.sha256 != found)
        throw Refusal(ReasonId::ManifestDiffers,
                      path + " names the SHA-256 " + manifest.sha256 + ", and the image has " + found);
    requireDevice(manifest, image, path);
}

}  // namespace trust
