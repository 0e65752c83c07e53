// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <nlohmann/json_fwd.hpp>
#include <string>
#include <vector>

#include "Framework/Requests/CimOperations.h"

namespace cli {

/// A software identity: an image that can be installed, or a component that is installed.
struct InventoryItem {
    core::CimPath path;
    std::string id;  ///< its InstanceID
    std::string description;
    std::string version;
    std::vector<std::string> types;
    std::vector<std::string> uris;  ///< where its file is, and copies of it; none for an installed component

    bool isInstallable() const { return !uris.empty(); }
    /// Of several files with the same content, the one that the service takes.
    std::string uri() const { return uris.empty() ? std::string() : uris.back(); }
};
void to_json(nlohmann::ordered_json& json, const InventoryItem& item);

/// All software identities, each with the URIs that its resources serve.
std::vector<InventoryItem> readInventory(core::CimOperations& operations);

/// The installable one with this id, or whose file has this path or URI. Throws CommandError that says what
/// there is.
InventoryItem findById(core::CimOperations& operations, const std::string& id);
InventoryItem findByFile(core::CimOperations& operations, const std::string& file);

}  // namespace cli
