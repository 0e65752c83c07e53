// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/PackageVerdict.h"

#include <algorithm>

#include "MidAPI/Devlink/PldmPackage.h"
#include "MidAPI/Image/ImagePreparation.h"
#include "MidAPI/Image/OptionRom.h"
#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

constexpr const char* kWhichCard = "which card the file is for";
constexpr const char* kHowItCompares = "whether it is older than what is installed";

/// Where a driver tells the version of a package as a whole, under one of these names.
constexpr std::string_view kSetVersions[] = {"fw.bundle_id", "fw"};

PackageVerdict refuse(PrepareStatus status, std::string reason) {
    return {{.status = status, .reason = std::move(reason)}};
}

std::string idText(const std::optional<std::uint16_t>& id) {
    return id ? utils::formatStr("%04x", *id) : "any";
}

/// "8086:1592", and the subsystem's ids where they make the difference.
std::string idsText(const PldmDevice& device, bool withSubsystem) {
    const std::string text = idText(device.vendor) + ':' + idText(device.device);
    if (!withSubsystem) return text;
    return text + " (subsystem " + idText(device.subsystemVendor) + ':' + idText(device.subsystemDevice) +
           ')';
}

/// What the records are for, each once and the first few alone.
std::string meantCards(const PldmPackage& package, bool withSubsystem) {
    std::vector<std::string> meant;
    for (const PldmDevice& device : package.devices) {
        std::string text = idsText(device, withSubsystem);
        if (std::ranges::find(meant, text) == meant.end()) meant.push_back(std::move(text));
    }
    if (meant.empty()) return "no PCI device";
    constexpr std::size_t kMostNamed = 4;
    const std::size_t named = std::min(meant.size(), kMostNamed);
    const std::string more = named < meant.size() ? " and others" : "";
    meant.resize(named);
    return "PCI device " + utils::joined(meant) + more;
}

/// The record that is for the card; null where none is.
const PldmDevice* recordFor(const PldmPackage& package, const PciIds& ids) {
    const auto fits = [&ids](const PldmDevice& device) { return device.fits(ids); };
    const auto found = std::ranges::find_if(package.devices, fits);
    return found == package.devices.end() ? nullptr : &*found;
}

/// Both ids, for a package that is for other cards.
std::string foreignCard(const PackageTarget& target, const PldmPackage& package) {
    const PldmDevice own = {.vendor = target.ids.vendor,
                            .device = target.ids.device,
                            .subsystemVendor = target.ids.subsystemVendor,
                            .subsystemDevice = target.ids.subsystemDevice};
    const bool isOtherSubsystem = std::ranges::any_of(package.devices, [&own](const PldmDevice& device) {
        return device.vendor == own.vendor && device.device == own.device;
    });
    return "the package is for " + meantCards(package, isOtherSubsystem) + ", the adapter is " +
           idsText(own, isOtherSubsystem);
}

/// What the driver tells in place of a package's own version.
struct Comparison {
    std::string_view name;
    std::string_view installed;
    std::string_view inFile;
};

/// The versions of the package that have an installed one to be held against.
std::vector<Comparison> comparisonsOf(const PackageTarget& target, const PldmPackage& package,
                                      const PldmDevice& device) {
    std::vector<Comparison> found;
    const auto add = [&](std::string_view name, std::string_view inFile) {
        const std::string_view installed = runningVersion(target.versions, name);
        const bool isComparable = !installed.empty() && compareVersions(inFile, installed).has_value();
        if (isComparable) found.push_back({name, installed, inFile});
        return isComparable;
    };
    for (const std::string_view name : kSetVersions)
        if (add(name, device.version)) break;
    for (const std::size_t index : device.components) {
        const PldmComponent& component = package.components[index];
        add(target.table.versionOf(component.identifier), component.version);
    }
    return found;
}

void compareVersionsOf(const PackageTarget& target, const PldmPackage& package, const PldmDevice& device,
                       PackageVerdict& verdict) {
    const std::vector<Comparison> comparisons = comparisonsOf(target, package, device);
    if (comparisons.empty()) verdict.unchecked.emplace_back(kHowItCompares);
    for (const Comparison& each : comparisons) {
        if (*compareVersions(each.inFile, each.installed) >= 0) continue;
        verdict.status = PrepareStatus::ImageIsOlder;
        verdict.reason = std::string(each.name) + " would go back from version " +
                         std::string(each.installed) + " (installed) to " + std::string(each.inFile) +
                         " (in the file)";
        return;
    }
}

/// The versions of all that the package brings for the card: that of the whole where the driver tells one,
/// else those of its components; none where one of them has no counterpart.
std::vector<ImageVerdict::Version> versionsOf(const PackageTarget& target, const PldmPackage& package,
                                              const PldmDevice& device) {
    std::vector<ImageVerdict::Version> found;
    const auto add = [&](std::string_view name, const std::string& inFile) {
        const std::string_view inFlash = versionInFlash(target.versions, name);
        // Texts of two kinds, a maker's name for a release beside a number, differ even where all is the
        // same.
        if (inFlash.empty() || !compareVersions(inFile, inFlash)) return false;
        found.push_back({std::string(name), std::string(inFlash), inFile});
        return true;
    };
    for (const std::string_view name : kSetVersions)
        if (add(name, device.version)) return found;
    for (const std::size_t index : device.components) {
        const PldmComponent& component = package.components[index];
        if (!add(target.table.versionOf(component.identifier), component.version)) return {};
    }
    return found;
}

/// What the package itself tells.
PackageVerdict assessPldm(const PackageTarget& target, const PldmPackage& package) {
    if (package.error)
        return refuse(PrepareStatus::InvalidParameter,
                      "the file is not an intact firmware package: it " + *package.error);
    const PldmDevice* device = recordFor(package, target.ids);
    if (device == nullptr) return refuse(PrepareStatus::ImageNotSupported, foreignCard(target, package));
    if (device->components.empty())
        return refuse(PrepareStatus::ImageNotApplicable, "the package has no image for this card");
    PackageVerdict verdict;
    verdict.isForCard = device->namesPciDevice();
    if (!verdict.isForCard) verdict.unchecked.emplace_back(kWhichCard);
    verdict.versions = versionsOf(target, package, *device);
    compareVersionsOf(target, package, *device, verdict);
    return verdict;
}

/// A whole-device file of a format that only its driver knows.
PackageVerdict assessContent(const PackageTarget& target, std::span<const std::uint8_t> file) {
    if (packageFormat(file) == PackageFormat::Known) return assessPldm(target, readPldmPackage(file));
    return {{.unchecked = {"whether the file is intact", kWhichCard, kHowItCompares}}};
}

/// A type that the driver does not take as a component of its own; empty when it takes all.
std::string chooseComponents(const PackageTarget& target, PackageVerdict& verdict) {
    for (const utils::FirmwareType type : verdict.types) {
        std::string component(target.table.componentOf(type));
        const std::string_view name = firmwareTypeName(type);
        const std::string shown =
            name.empty() ? "type " + std::to_string(static_cast<std::int32_t>(type)) : std::string(name);
        if (component.empty()) return shown + " is no component that a driver could be asked for";
        if (!target.accepts(component))
            return "the driver takes no component \"" + component + "\", which " + shown +
                   " is here; without types the whole device is updated";
        verdict.components.push_back(std::move(component));
    }
    return {};
}

}  // namespace

PackageVerdict assessPackage(const PackageTarget& target, std::span<const std::uint8_t> file,
                             const std::vector<utils::FirmwareType>& requested) {
    if (file.empty()) return refuse(PrepareStatus::InvalidParameter, "the file is empty");
    if (file.size() > target.largestImage)
        return refuse(PrepareStatus::InvalidParameter,
                      "the file has " + std::to_string(file.size()) + " bytes, more than the " +
                          std::to_string(target.largestImage) + " that are allowed (largest_image)");
    PackageVerdict verdict = assessContent(target, file);
    if (!hasOutput(verdict.status)) return verdict;
    if (!target.hindrance.empty())
        return refuse(PrepareStatus::ImageNotSupported,
                      "this adapter cannot be updated: " + target.hindrance);
    verdict.types = distinctTypes(requested);
    if (std::string reason = chooseComponents(target, verdict); !reason.empty())
        return refuse(PrepareStatus::ImageNotApplicable, std::move(reason));
    return verdict;
}

}  // namespace ma::devlink
