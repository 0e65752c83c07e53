// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <nlohmann/json_fwd.hpp>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Cli/Connection/Connection.h"

/// What there is: the adapters, the firmware on them, and the images for them.
namespace cli {

/// A firmware component: an image type and its version.
struct Component {
    std::string type;  ///< "IMG_PXE"
    std::uint32_t version = 0;

    bool operator==(const Component&) const = default;
};
void to_json(nlohmann::ordered_json& json, const Component& component);

/// The version of the component of this type; nothing where there is none.
std::optional<std::uint32_t> versionOf(const std::vector<Component>& components, std::string_view type);

/// "IMG_PXE 1, IMG_UEFI 0"; "nothing" for none.
std::string componentsText(const std::vector<Component>& components);

/// An adapter port as the model shows it.
struct Adapter {
    core::CimPath path;
    std::string name;
    std::string description;
    std::string pciAddress;
    std::string ids;  ///< "1af4:1041"; empty when not shown
    bool updatable = true;
    std::vector<Component> components;  ///< what is installed, as far as it is shown
    bool answers = true;                ///< false when nothing can be read from it
};
void to_json(nlohmann::ordered_json& json, const Adapter& adapter);

/// All Ethernet ports with what is installed on them, in the model's order.
std::vector<Adapter> readAdapters(core::CimOperations& operations);

/// What is installed on a port.
std::vector<Component> readComponents(core::CimOperations& operations, const core::CimPath& port);

/// What to do about adapters that do not answer.
std::string adviceForSilence(const Connection& connection);

/// What to do where there are no adapters; empty for a server, which has its own.
std::string adviceForNoAdapters(const Connection& connection);

/// The adapter that a user means: by its name, its PCI address with or without the domain, or the text of its
/// object path. Throws CommandError that names the adapters there are.
Adapter findAdapter(const Connection& connection, const std::string& target);

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
