// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/Inventory.h"

#include <algorithm>
#include <filesystem>
#include <optional>

#include "Cli/Connection/Properties.h"
#include "Cli/Display/Messages.h"
#include "Cli/Display/Output.h"
#include "Cli/Update/Image.h"

namespace cli {

namespace {

constexpr const char* kAskInventory =
    "\"quenxctl identities\" lists the images. To add a file, put its directory into the line "
    "\"FWFilePath=\" of the service's configuration file (by default /etc/quenx-cimprovider.conf), or "
    "install "
    "it by its path.";

/// The same text, or two names of one file.
bool isSameFile(const std::string& uri, const std::string& other) {
    const std::optional<std::string> path = localPath(uri);
    const std::optional<std::string> otherPath = localPath(other);
    std::error_code error;
    return uri == other || (path && otherPath && std::filesystem::equivalent(*path, *otherPath, error));
}

}  // namespace

void to_json(Json& json, const InventoryItem& item) {
    json = {{"id", item.id},       {"description", item.description},     {"version", item.version},
            {"types", item.types}, {"installable", item.isInstallable()}, {"uris", item.uris},
            {"path", item.path}};
}

std::vector<InventoryItem> readInventory(core::CimOperations& operations) {
    std::vector<InventoryItem> items;
    for (const core::InstanceValue& identity : operations.enumerateInstances("Quenx_SoftwareIdentity")) {
        items.push_back({identity.path,
                         textOf(identity, "InstanceID"),
                         textOf(identity, "Description"),
                         textOf(identity, "VersionString"),
                         textsOf(identity, "TargetTypes"),
                         {}});
    }
    for (const auto& resource : operations.enumerateInstances("Quenx_SoftwareIdentityResource")) {
        // A resource is named after the identity whose file it is, and its path.
        const std::string id = textOf(resource, "InstanceID");
        for (InventoryItem& item : items) {
            if (id.starts_with(item.id + "@")) item.uris.push_back(textOf(resource, "AccessInfo"));
        }
    }
    return items;
}

InventoryItem findById(core::CimOperations& operations, const std::string& id) {
    for (InventoryItem& item : readInventory(operations)) {
        if (item.id != id) continue;
        if (item.isInstallable()) return std::move(item);
        throw CommandError(ExitStatus::NotFound,
                           "\"" + id + "\" is installed on an adapter, but there is no image file of it.",
                           kAskInventory);
    }
    throw CommandError(ExitStatus::NotFound, "There is no software identity \"" + id + "\".", kAskInventory);
}

InventoryItem findByFile(core::CimOperations& operations, const std::string& file) {
    const std::string wanted = imageUri(file);
    for (InventoryItem& item : readInventory(operations)) {
        const bool isIt = std::any_of(item.uris.begin(), item.uris.end(),
                                      [&](const std::string& uri) { return isSameFile(uri, wanted); });
        if (isIt) return std::move(item);
    }
    throw CommandError(ExitStatus::NotFound, "The service's inventory does not have " + file + ".",
                       kAskInventory);
}

}  // namespace cli
