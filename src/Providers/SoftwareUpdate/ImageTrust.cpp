// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareUpdate/ImageTrust.h"

#include <algorithm>
#include <array>
#include <filesystem>
#include <optional>
#include <system_error>
#include <vector>

#include "Framework/Requests/ImageVerifier.h"
#include "Framework/Requests/NotedCall.h"
#include "Framework/Requests/PolicyDecision.h"
#include "MidAPI/ma.h"
#include "Providers/SoftwareUpdate/MethodResults.h"
#include "Providers/SoftwareUpdate/UpdateReport.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace {

namespace fs = std::filesystem;

[[noreturn]] void refuse(core::ReasonId reason, const std::string& uri, const std::string& why) {
    core::NotedCall::noteReason(reason);
    throw EAdapterNotSupported("Image " + uri + " may not be installed: " + why);
}

/// One that is not there has nothing below it.
bool isBelow(const std::string& file, const std::string& folder) {
    std::error_code isMissing;
    const fs::path whole = fs::canonical(folder, isMissing);
    if (isMissing) return false;
    const fs::path path(file);
    return std::mismatch(whole.begin(), whole.end(), path.begin(), path.end()).first == whole.end();
}

/// Where the policy has images: what it names, and what the object manager fills itself.
std::vector<std::string> foldersOf(const utils::Policy& policy) {
    std::vector<std::string> folders = policy.imageDirectories.value_or(std::vector<std::string>());
    folders.push_back(policy.keepImages);
    folders.push_back(utils::SMASHv2Config::getInstance()->getUploadDirectory());
    std::erase(folders, "");
    return folders;
}

/// These, and those of the images that were sent, which have one each.
std::vector<std::string> foldersWithManifests(const utils::Policy& policy) {
    std::vector<std::string> folders = foldersOf(policy);
    const std::string uploads = utils::SMASHv2Config::getInstance()->getUploadDirectory();
    if (uploads.empty()) return folders;
    for (const std::string& image : os::listDirectory(uploads))
        folders.push_back(uploads + "/" + image);
    return folders;
}

std::optional<std::array<std::uint16_t, 4>> pciIdsOf(const std::string& adapterName) try {
    if (adapterName.empty()) return std::nullopt;
    const ma::PciIds ids = ma::getAdapterInfo(adapterName).ids;
    if (ids.vendor == 0) return std::nullopt;
    return {{ids.vendor, ids.device, ids.subsystemVendor, ids.subsystemDevice}};
} catch (const ma::AdapterError&) {
    return std::nullopt;
}

}  // namespace

void requireAllowedPlace(const std::string& uri, const os::FileLook& file) {
    const utils::Policy& policy = core::PolicyDecision::policy();
    if (!policy.imageDirectories) return;
    const auto isIn = [&](const std::string& folder) { return isBelow(file.realPath, folder); };
    if (std::ranges::any_of(foldersOf(policy), isIn)) return;
    refuse(
        core::ReasonId::OutsideImageDirectories, uri,
        (file.realPath.empty() ? "where it lies cannot be told" : "it is " + file.realPath) +
            ", and the policy allows images below " +
            (policy.imageDirectories->empty() ? "no folder" : utils::joined(*policy.imageDirectories, ", ")) +
            " only");
}

std::int64_t largestAllowedImage() {
    return core::PolicyDecision::policy().largestImage;
}

void refuseTooLarge(const std::string& uri, std::int64_t size) {
    refuse(core::ReasonId::LargerThanPolicy, uri,
           "it has " + std::to_string(size) + " bytes, and the policy allows " +
               std::to_string(largestAllowedImage()));
}

void requireTrust(const std::string& uri, const std::string& path, std::span<const std::uint8_t> bytes,
                  const std::string& adapterName) {
    const utils::Policy& policy = core::PolicyDecision::policy();
    if (policy.trust == utils::TrustRule::Off) return;
    core::ImageVerifier* const verifier = core::ImageVerifier::installed();
    if (verifier == nullptr)
        refuse(core::ReasonId::NoVerifier, uri,
               "the policy asks for a signature, and this program cannot verify any");
    const core::TrustVerdict verdict = verifier->verify(
        {path, bytes, policy.trustKeys, pciIdsOf(adapterName), foldersWithManifests(policy)});
    if (!verdict.isTrusted()) refuse(verdict.reason, uri, verdict.text);
    UpdateReport::noteKey(verdict.key);
}
