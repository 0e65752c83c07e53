// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Image/ImagePreparation.h"

#include <algorithm>
#include <optional>

#include "MidAPI/Image/OptionRom.h"

namespace ma {
namespace {

using Types = std::vector<utils::FirmwareType>;
using Components = std::vector<utils::FirmwareVersionInfo>;

Preparation refuse(PrepareStatus status, std::string reason) {
    return {.status = status, .reason = std::move(reason)};
}

std::string typeNames(const Components& components) {
    std::string names;
    for (const utils::FirmwareVersionInfo& component : components)
        names += (names.empty() ? "" : ", ") + std::string(firmwareTypeName(component.type));
    return names.empty() ? "no boot image" : names;
}

/// Why an image is not for this card at all; empty when it is.
std::string mismatch(const PreparationTarget& target, const RomImage& image, std::size_t number) {
    const std::string which = "image " + std::to_string(number) + " of the file ";
    if (!image.isNetwork())
        return which + "is not for a network adapter (its base class code is " +
               std::to_string(image.classCode >> 16) + ", not 2)";
    if (image.fits(target.vendorId, target.deviceId)) return {};
    return which + "is for PCI device " + formatIds(image.vendorId, image.deviceId) + ", the adapter is " +
           formatIds(target.vendorId, target.deviceId);
}

/// Every image must be for the card, also those that are not asked for: nobody can trust a file with images
/// of two cards.
std::string anyMismatch(const PreparationTarget& target, const RomFile& rom) {
    for (std::size_t index = 0; index < rom.images.size(); ++index) {
        std::string found = mismatch(target, rom.images[index], index + 1);
        if (!found.empty()) return found;
    }
    return {};
}

bool isWanted(const RomImage& image, const Types& requested) {
    if (requested.empty()) return image.type != utils::FirmwareType{};
    return std::ranges::any_of(requested, [&](utils::FirmwareType type) { return image.carries(type); });
}

std::optional<std::uint32_t> versionOf(const Components& components, utils::FirmwareType type) {
    for (const utils::FirmwareVersionInfo& component : components)
        if (component.type == type) return component.version;
    return std::nullopt;
}

/// A requested type that the file does not have; a file of which nothing can be installed.
std::string notApplicable(const RomFile& rom, const Types& requested, const RomFile& chosen) {
    const Components inFile = rom.components();
    for (const utils::FirmwareType type : requested) {
        if (versionOf(inFile, type)) continue;
        const std::string_view name = firmwareTypeName(type);
        return "the file has no image of type " +
               (name.empty() ? std::to_string(static_cast<std::int32_t>(type)) : std::string(name)) +
               ", it has " + typeNames(inFile);
    }
    return chosen.images.empty() ? "the file has no image that an adapter could be given" : "";
}

/// What the flash would carry differs from what it carries: a type is new, or a CLP entry point would be
/// lost.
bool typesDiffer(const PreparationTarget& target, const RomFile& chosen) {
    const Components incoming = chosen.components();
    for (const utils::FirmwareVersionInfo& component : incoming)
        if (!versionOf(target.components, component.type)) return true;
    return versionOf(target.components, utils::FirmwareType::CLP) &&
           versionOf(incoming, utils::FirmwareType::PXE) && !versionOf(incoming, utils::FirmwareType::CLP);
}

/// Names the component that would go back; both versions, installed one first.
std::string downgrade(const PreparationTarget& target, const RomFile& chosen) {
    for (const utils::FirmwareVersionInfo& component : chosen.components()) {
        const auto installed = versionOf(target.components, component.type);
        if (installed && component.version < *installed)
            return std::string(firmwareTypeName(component.type)) + " would go back from version " +
                   std::to_string(*installed) + " (installed) to " + std::to_string(component.version) +
                   " (in the file)";
    }
    return {};
}

}  // namespace

RomFile chooseImages(const RomFile& rom, std::vector<utils::FirmwareType> requested) {
    const Types wanted = distinctTypes(std::move(requested));
    RomFile chosen;
    std::copy_if(rom.images.begin(), rom.images.end(), std::back_inserter(chosen.images),
                 [&wanted](const RomImage& image) { return isWanted(image, wanted); });
    return chosen;
}

Preparation assessImage(const PreparationTarget& target, std::span<const std::uint8_t> file,
                        const std::vector<utils::FirmwareType>& requested) {
    const RomFile rom = parseOptionRom(file);
    // A file for another card is called that even when it is damaged too: a whole copy would not help.
    if (std::string reason = anyMismatch(target, rom); !reason.empty())
        return refuse(PrepareStatus::ImageNotSupported, std::move(reason));
    if (rom.error)
        return refuse(PrepareStatus::InvalidParameter, "the file is not an intact ROM image: " + *rom.error);
    if (!target.canBeUpdated)
        return refuse(PrepareStatus::ImageNotSupported, "this adapter cannot be updated");

    const Types wanted = distinctTypes(requested);
    RomFile chosen = chooseImages(rom, wanted);
    if (std::string reason = notApplicable(rom, wanted, chosen); !reason.empty())
        return refuse(PrepareStatus::ImageNotApplicable, std::move(reason));

    Preparation result;
    const Components incoming = chosen.components();
    for (const utils::FirmwareVersionInfo& component : incoming)
        result.types.push_back(component.type);
    // Other types come before older versions: a caller may force either, but only the former needs a
    // permission of the configuration too.
    if (typesDiffer(target, chosen)) {
        result.status = PrepareStatus::ImageTypesDiffer;
        result.reason =
            "the image has " + typeNames(incoming) + ", the adapter carries " + typeNames(target.components);
    } else if (result.reason = downgrade(target, chosen); !result.reason.empty()) {
        result.status = PrepareStatus::ImageIsOlder;
    }
    result.chosen = std::move(chosen.images);
    return result;
}

Types distinctTypes(Types types) {
    std::erase(types, utils::FirmwareType{});
    std::sort(types.begin(), types.end());
    types.erase(std::unique(types.begin(), types.end()), types.end());
    return types;
}

bool hasOutput(PrepareStatus status) {
    return status == PrepareStatus::Prepared || status == PrepareStatus::ImageIsOlder ||
           status == PrepareStatus::ImageTypesDiffer;
}

// The last-image bits move with the choice: a chain must end where the chosen images end.
std::size_t composeChosen(const Preparation& preparation, std::span<const std::uint8_t> file,
                          std::span<std::uint8_t> output) {
    std::vector<std::span<const std::uint8_t>> images;
    images.reserve(preparation.chosen.size());
    for (const RomImage& image : preparation.chosen)
        images.push_back(imageBytes(file, image));
    return composeOptionRom(images, output);
}

}  // namespace ma
