// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/Candidate.h"

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <functional>
#include <span>
#include <system_error>

#include "MidAPI/Image/ImagePreparation.h"
#include "MidAPI/ma.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

constexpr std::string_view kAuthority = "//";

/// Beyond this the file is left to the service.
constexpr std::uint64_t kLargestRead = std::uint64_t{256} << 20;

bool isSchemeCharacter(char c) {
    return utils::isLetter(c) || utils::isDigit(c) || c == '+' || c == '-' || c == '.';
}

Explanation notAnImage(const std::string& path, const std::string& why) {
    return {path + " " + why + ".", "Name a complete firmware image."};
}

/// Empty for a file that can be an image.
std::string kindProblem(const struct stat& info) {
    constexpr std::uint64_t kLargestImage = 0x7FFFFFFF;
    if (S_ISDIR(info.st_mode)) return "is a directory";
    if (!S_ISREG(info.st_mode)) return "is not a regular file";
    if (info.st_size == 0) return "is empty";
    const auto bytes = static_cast<std::uint64_t>(info.st_size);
    if (bytes > kLargestImage) return "is larger than 2 GiB";
    return bytes > kLargestRead ? "is larger than any firmware image for a network adapter" : "";
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

bool carries(const ma::RomImage& image, const std::string& type) {
    const auto wanted = ma::firmwareTypeFromName(type);
    return wanted && image.carries(*wanted);
}

/// Reads the file. Never waits: only a regular file is opened. Never throws on account of the file.
/// @param isJudged  given the content of a file that can be an image; true when no more is to be read of it
ImageFile readImage(const std::string& path,
                    const std::function<bool(std::span<const std::uint8_t>)>& isJudged) try {
    ImageFile image{path, std::nullopt, {}};
    struct stat info = {};
    if (stat(path.c_str(), &info) != 0) throw std::system_error(errno, std::generic_category());
    // Checked before it is opened: opening a pipe would wait for somebody to write into it.
    if (const std::string why = kindProblem(info); !why.empty()) {
        image.problem = notAnImage(path, why);
        return image;
    }
    // If the file has gone since stat(), nothing can be read.
    const std::optional<std::vector<std::uint8_t>> content = os::readWholeFile(path, kLargestRead);
    if (!content) throw std::system_error(ENOENT, std::generic_category());
    if (isJudged(*content)) return image;
    image.rom = ma::parseOptionRom(*content);
    if (image.rom.error)
        image.problem = notAnImage(path, "is not a complete firmware image: " + *image.rom.error);
    return image;
} catch (const std::system_error& error) {
    return {path, cannotRead(path, error.code().value()), {}};
}

std::vector<utils::FirmwareType> typesOf(const std::vector<std::string>& names) {
    std::vector<utils::FirmwareType> types;
    for (const std::string& name : names)
        if (const auto type = ma::firmwareTypeFromName(name)) types.push_back(*type);
    return types;
}

/// The images that are written for these types. @param types  as ma::assessImage() takes them, by name
ma::RomFile chosenOf(const ma::RomFile& rom, const std::vector<std::string>& types) {
    return ma::chooseImages(rom, typesOf(types));
}

/// Another PXE image would take the one with the CLP entry point away, so the same version is not the same.
bool losesClp(const Adapter& adapter, const std::vector<Component>& chosen) {
    return versionOf(adapter.components, "IMG_CLP") && versionOf(chosen, "IMG_PXE") &&
           !versionOf(chosen, "IMG_CLP");
}

/// @param types  as for chosenOf()
Comparison compare(const ma::RomFile& rom, const Adapter& adapter, const std::vector<std::string>& types) {
    Comparison result;
    const ma::RomFile chosen = chosenOf(rom, types);
    for (const utils::FirmwareVersionInfo& component : chosen.components())
        result.chosen.push_back({std::string(ma::firmwareTypeName(component.type)), component.version});
    for (const std::string& type : types) {
        const bool isThere =
            std::ranges::any_of(rom.images, [&](const auto& image) { return carries(image, type); });
        // "IMG_PXE+" asks for an empty type besides, which the service ignores, too.
        if (!type.empty() && !isThere) result.missing.push_back(type);
    }
    for (const ma::RomImage& image : chosen.images)
        result.bytes += image.length;
    result.isNetwork = std::ranges::all_of(rom.images, &ma::RomImage::isNetwork);
    // An adapter that does not show its ids can be compared with nothing; the service knows them.
    if (!adapter.ids.empty()) result.foreignIds = firstForeignIds(rom, adapter.ids);
    result.current = !result.chosen.empty() && !losesClp(adapter, result.chosen) &&
                     std::ranges::all_of(result.chosen, [&](const Component& component) {
                         const Component* installed = findComponent(adapter.components, component.type);
                         return installed != nullptr && installed->flashText() == component.versionText();
                     });
    return result;
}

/// Throws CommandError for a type that the service's capabilities do not name. If they name none, any type is
/// taken.
void requireKnownTypes(core::CimOperations& operations, const std::vector<std::string>& types) {
    const auto capabilities = operations.enumerateInstances("Quenx_SoftwareInstallationServiceCapabilities");
    if (capabilities.empty()) return;
    const std::vector<std::string> known = capabilities.front().texts("SupportedTargetTypes");
    if (known.empty()) return;
    // The service would answer with the code that every bad argument gets.
    for (const std::string& type : types) {
        if (type.empty() || std::find(known.begin(), known.end(), type) != known.end()) continue;
        throw CommandError(ExitStatus::WrongUse, "There is no image type \"" + type + "\".",
                           didYouMean(type, known) + "The types are " + joined(known) + ".");
    }
}

Candidate compared(const Connection& connection, Candidate candidate) {
    // If the service runs on another machine, the same path may name another file.
    std::optional<std::string> path;
    if (!candidate.localFile.empty())
        path = candidate.localFile;
    else if (connection.sharesFiles)
        path = localPath(candidate.uri);
    if (!path) return candidate;
    candidate.image = readImage(*path, [&](std::span<const std::uint8_t> content) {
        if (connection.isInProcess)
            candidate.verdict = ma::judgeImage(candidate.adapter.name, content, typesOf(candidate.types));
        return candidate.verdict.has_value();
    });
    if (!candidate.image->problem && !candidate.verdict)
        candidate.comparison = compare(candidate.image->rom, candidate.adapter, candidate.types);
    return candidate;
}

}  // namespace

std::string uriScheme(std::string_view uri) {
    const auto colon = uri.find(':');
    if (colon == std::string_view::npos || colon == 0 || !utils::isLetter(uri.front())) return {};
    std::string scheme = utils::lowerCase(uri.substr(0, colon));
    if (!std::all_of(scheme.begin(), scheme.end(), isSchemeCharacter)) return {};
    return scheme;
}

std::string imageUri(const std::string& image) {
    const std::string scheme = uriScheme(image);
    // "file:" is a URI even when badly written; other colons without "//" are common in file names.
    const bool isUri =
        scheme == "file" || (!scheme.empty() && image.substr(scheme.size() + 1).starts_with(kAuthority));
    if (isUri) return image;
    return "file://" + std::filesystem::absolute(image).string();
}

std::optional<std::string> localPath(std::string_view uri) {
    const std::string scheme = uriScheme(uri);
    if (scheme != "file") return std::nullopt;
    const std::string_view rest = uri.substr(scheme.size() + 1);
    if (!rest.starts_with(kAuthority)) return std::nullopt;
    return std::string(rest.substr(kAuthority.size()));
}

Candidate::Answer Candidate::fits() const {
    if (!adapter.updatable || (verdict && verdict->status == ma::PrepareStatus::ImageNotSupported))
        return Answer::No;
    if (verdict) return verdict->isForCard ? Answer::Yes : Answer::Unknown;
    if (!comparison) return Answer::Unknown;
    if (!comparison->isNetwork || !comparison->foreignIds.empty()) return Answer::No;
    return adapter.ids.empty() ? Answer::Unknown : Answer::Yes;
}

Candidate::Answer Candidate::isInFlash() const {
    const auto answer = [](bool isSo) { return isSo ? Answer::Yes : Answer::No; };
    // An image for another card can have the same versions: the service is to refuse that one.
    if (fits() == Answer::No || (image && image->problem)) return Answer::No;
    if (verdict) {
        // What is older than what runs may be what waits for a reset.
        const bool isTaken = verdict->status == ma::PrepareStatus::Prepared ||
                             verdict->status == ma::PrepareStatus::ImageIsOlder;
        if (!isTaken) return Answer::No;
        if (verdict->versions.empty()) return Answer::Unknown;
        return answer(std::ranges::all_of(
            verdict->versions, [](const auto& version) { return version.inFlash == version.inFile; }));
    }
    if (!comparison || (adapter.components.empty() && !adapter.answers)) return Answer::Unknown;
    return answer(comparison->current && comparison->missing.empty());
}

std::vector<Component> Candidate::brought() const {
    if (comparison) return comparison->chosen;
    std::vector<Component> components;
    if (verdict)
        for (const ma::ImageVerdict::Version& version : verdict->versions)
            components.push_back({.type = version.name, .text = version.inFile});
    return components;
}

namespace {

/// The file to send; empty where the server has the image.
std::string fileToSend(const UpdateOptions& options) {
    if (!options.upload) return {};
    if (std::optional<std::string> path = localPath(imageUri(options.image))) return std::move(*path);
    throw CommandError(ExitStatus::WrongUse, options.image + " is not a file that can be sent.",
                       "Name a file of this machine, or leave out --upload.");
}

}  // namespace

Candidate makeCandidate(const Connection& connection, const UpdateOptions& options) {
    return makeCandidate(connection, findAdapter(connection, options.target), options);
}

Candidate makeCandidate(const Connection& connection, Adapter adapter, const UpdateOptions& options) {
    if (!options.identity.empty()) {
        return makeCandidate(connection, std::move(adapter),
                             findById(*connection.operations, options.identity), options.force);
    }
    requireKnownTypes(*connection.operations, options.types);
    return compared(connection, {.adapter = std::move(adapter),
                                 .uri = imageUri(options.image),
                                 .types = options.types,
                                 .force = options.force,
                                 .localFile = fileToSend(options)});
}

Candidate makeCandidate(const Connection& connection, Adapter adapter, const InventoryItem& image,
                        bool force) {
    return compared(connection, {.adapter = std::move(adapter),
                                 .uri = image.uri(),
                                 .identity = image.path,
                                 .types = image.types,
                                 .force = force});
}

}  // namespace cli
