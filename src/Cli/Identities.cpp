// SPDX-License-Identifier: Apache-2.0
#include "Cli/Identities.h"

#include <algorithm>
#include <filesystem>
#include <optional>

#include "Cli/Failure.h"
#include "Cli/ImageUri.h"
#include "Cli/Values.h"

namespace cli {

namespace {

constexpr const char* ASK_INVENTORY =
    "\"quenxctl identities\" lists the images. To add a file, put its directory into the line "
    "\"FWFilePath=\" of the service's configuration file, or install it by its path.";

/// The same text, or two names of one file.
bool isSameFile(const std::string& uri, const std::string& other) {
    const std::optional<std::string> path = localPath(uri);
    const std::optional<std::string> otherPath = localPath(other);
    std::error_code error;
    return uri == other || (path && otherPath && std::filesystem::equivalent(*path, *otherPath, error));
}

Identity readIdentity(const core::InstanceValue& instance) {
    return {instance.path,
            textOf(instance, "InstanceID"),
            textOf(instance, "Description"),
            textOf(instance, "VersionString"),
            textsOf(instance, "TargetTypes"),
            {}};
}

}  // namespace

std::vector<Identity> readIdentities(Management& management) {
    std::vector<Identity> identities;
    for (const core::InstanceValue& instance : management.enumerateInstances("Quenx_SoftwareIdentity")) {
        identities.push_back(readIdentity(instance));
    }
    for (const core::InstanceValue& resource :
         management.enumerateInstances("Quenx_SoftwareIdentityResource")) {
        // A resource is named after the identity whose file it is, and its path.
        const std::string id = textOf(resource, "InstanceID");
        for (Identity& identity : identities) {
            if (id.starts_with(identity.id + "@")) identity.uris.push_back(textOf(resource, "AccessInfo"));
        }
    }
    return identities;
}

Identity findIdentity(Management& management, const std::string& id) {
    for (Identity& identity : readIdentities(management)) {
        if (identity.id != id) continue;
        if (identity.isInstallable()) return identity;
        throw Failure(ExitStatus::NotFound,
                      "\"" + id + "\" is installed on an adapter, but there is no image file of it.",
                      ASK_INVENTORY);
    }
    throw Failure(ExitStatus::NotFound, "There is no software identity \"" + id + "\".", ASK_INVENTORY);
}

Identity findIdentityOfFile(Management& management, const std::string& file) {
    const std::string wanted = imageUri(file);
    for (Identity& identity : readIdentities(management)) {
        const bool isIt = std::any_of(identity.uris.begin(), identity.uris.end(),
                                      [&](const std::string& uri) { return isSameFile(uri, wanted); });
        if (isIt) return identity;
    }
    throw Failure(ExitStatus::NotFound, "The service's inventory does not have " + file + ".", ASK_INVENTORY);
}

}  // namespace cli
