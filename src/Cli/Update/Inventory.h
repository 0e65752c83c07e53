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
    std::string type;  ///< "IMG_PXE"; for what is of no type the driver's name, "fw.mgmt"
    std::uint32_t version = 0;
    std::string text = {};    ///< the version as the driver tells it; empty where it is the number
    std::string stored = {};  ///< what takes effect after a reset; empty when nothing waits for one

    std::string versionText() const { return text.empty() ? std::to_string(version) : text; }
    /// The version in the flash: the one that runs, unless another waits for a reset.
    std::string flashText() const { return stored.empty() ? versionText() : stored; }
    /// Whether what runs is the same.
    bool operator==(const Component& other) const {
        return type == other.type && versionText() == other.versionText();
    }
};
void to_json(nlohmann::ordered_json& json, const Component& component);

/// The component of this type; null where there is none.
const Component* findComponent(const std::vector<Component>& components, std::string_view type);
/// Its version.
std::optional<std::uint32_t> versionOf(const std::vector<Component>& components, std::string_view type);

/// "IMG_PXE 1, IMG_UEFI 0", "fw.mgmt 1.2 (1.3 after a reset)"; "nothing" for none.
std::string componentsText(const std::vector<Component>& components);

/// New firmware that does not run yet; false where the adapter does not tell.
/// @param resetNeeded  as Adapter has it
bool waitsForReset(const std::vector<Component>& components, const std::string& resetNeeded);

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
    std::string backend = {};           ///< by which the service reaches it; empty when not shown
    std::string driver = {};            ///< likewise, and so for what follows
    std::string serialNumber = {};
    std::string boardSerialNumber = {};
    std::vector<std::string> interfaces = {};
    std::string resetNeeded = {};  ///< "none", "reload", "reboot", "power cycle", "unknown"
    bool busy = false;             ///< somebody is writing to its card
    std::string writer = {};       ///< who, as the service tells it: "process 812 (quenxctl)"

    /// It has new firmware that does not run yet; false where the adapter does not tell.
    bool waitsForReset() const;
};
void to_json(nlohmann::ordered_json& json, const Adapter& adapter);

/// The backend that a port of the model shows; empty when it does not.
std::string backendOf(const core::InstanceValue& port);

/// All Ethernet ports with what is installed on them, in the model's order.
std::vector<Adapter> readAdapters(core::CimOperations& operations);

/// What is installed on a port.
std::vector<Component> readComponents(core::CimOperations& operations, const core::CimPath& port);

/// What a port waits for after an update: Adapter::resetNeeded.
std::string readResetNeeded(core::CimOperations& operations, const core::CimPath& port);

/// What to do about adapters that do not answer.
std::string adviceForSilence(const Connection& connection);

/// The adapter's name with a mark when it is no hardware: for results, which must not be taken for more than
/// they are.
std::string labelOf(const std::string& adapter, const std::string& backend);

/// What was looked for and what was found; empty for a server, which has its own.
std::string searchText(const Connection& connection);

/// What was looked for, and what to do, where there are no adapters; empty for a server.
std::string adviceForNoAdapters(const Connection& connection);

/// The adapter that a user means: by its name, its PCI address with or without the domain, or the text of its
/// object path. Throws CommandError that names the adapters there are, or those that share a short address.
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
