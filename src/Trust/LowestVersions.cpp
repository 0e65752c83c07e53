// SPDX-License-Identifier: Apache-2.0
#include "Trust/LowestVersions.h"

#include <algorithm>
#include <filesystem>
#include <optional>
#include <string>

#include "MidAPI/Devlink/ComponentTable.h"
#include "Trust/Refusal.h"
#include "Trust/Signature.h"
#include "Trust/Signed.h"

namespace trust {

namespace {

namespace fs = std::filesystem;

/// The images in a folder that have manifests; more than anybody keeps in one are not looked at.
std::vector<std::string> imagesWithManifest(const std::string& folder) {
    constexpr std::size_t kMost = 1000;
    const std::string ending = kManifest;
    std::vector<std::string> images;
    std::error_code error;  // a folder that is not there has none
    for (fs::directory_iterator each(folder, error); !error && each != fs::directory_iterator();
         each.increment(error)) {
        const std::string path = each->path().string();
        if (path.ends_with(ending)) images.push_back(path.substr(0, path.size() - ending.size()));
        if (images.size() == kMost) break;
    }
    std::ranges::sort(images);
    return images;
}

/// Nothing where there is none, or none that is trusted.
std::optional<Manifest> trustedManifest(const std::string& image, std::span<const Key> keys,
                                        std::time_t now) try {
    const Signed found = findSigned(image);
    if (!found.manifest) return std::nullopt;
    verifySignature(bytesOf(found.signature), bytesOf(*found.manifest), keys, now, found.path);
    return parseManifest(*found.manifest, image + kManifest);
} catch (const Refusal&) {
    return std::nullopt;
}

[[noreturn]] void refuse(const std::string& what, const NamedText& lowest, const std::string& manifest) {
    throw Refusal(core::ReasonId::BelowLowestVersion,
                  what + ", and " + manifest + " allows " + lowest.first + " " + lowest.second + " or newer");
}

void requireVersion(const std::vector<NamedText>& versions, const NamedText& lowest,
                    const std::string& manifest) {
    const auto own = std::ranges::find(versions, lowest.first, &NamedText::first);
    if (own == versions.end()) {
        // Firmware of other types does not bring the old one back.
        if (!versions.empty()) return;
        refuse("no signed manifest of the image tells its versions", lowest, manifest);
    }
    const auto order = ma::devlink::compareVersions(own->second, lowest.second);
    if (order && *order != std::strong_ordering::less) return;
    refuse("the image has " + own->first + " " + own->second, lowest, manifest);
}

}  // namespace

void requireAllowedVersions(const core::ImageToVerify& image, const std::vector<NamedText>& versions,
                            std::span<const Key> keys, std::time_t now) {
    std::vector<std::string> folders = image.folders;
    folders.push_back(fs::path(image.path).parent_path().string());
    std::ranges::sort(folders);
    folders.erase(std::unique(folders.begin(), folders.end()), folders.end());
    for (const std::string& folder : folders) {
        for (const std::string& other : imagesWithManifest(folder)) {
            const std::optional<Manifest> manifest = trustedManifest(other, keys, now);
            if (!manifest || !isForDevice(*manifest, image)) continue;
            for (const NamedText& lowest : manifest->lowest)
                requireVersion(versions, lowest, other + kManifest);
        }
    }
}

}  // namespace trust
