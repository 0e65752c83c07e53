// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/Inventory.h"

#include <unistd.h>

#include <algorithm>
#include <filesystem>

#include "Cli/Display/Output.h"
#include "Cli/Update/Candidate.h"

namespace cli {

namespace {

/// The text that a port gives under a description, its identifying texts and their descriptions being
/// parallel.
std::string identifyingText(const core::InstanceValue& port, std::string_view description) {
    const std::vector<std::string> texts = port.texts("OtherIdentifyingInfo");
    const std::vector<std::string> descriptions = port.texts("IdentifyingDescriptions");
    for (std::size_t i = 0; i < std::min(texts.size(), descriptions.size()); ++i) {
        if (core::sameName(descriptions[i], description)) return texts[i];
    }
    return {};
}

/// Without the domain that "lspci -D" prints and the model leaves out.
std::string_view withoutDomain(std::string_view pciAddress) {
    constexpr std::string_view kFirstDomain = "0000:";
    if (pciAddress.starts_with(kFirstDomain)) pciAddress.remove_prefix(kFirstDomain.size());
    return pciAddress;
}

bool isMeant(const Adapter& adapter, const std::string& target) {
    const std::string_view address = withoutDomain(adapter.pciAddress);
    const core::CimPath path(target);
    // An adapter without an address must not be meant by an empty one.
    return adapter.name == target || (!address.empty() && core::sameName(address, withoutDomain(target))) ||
           (path.isInstancePath() && adapter.path.isSameObjectAs(path));
}

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

void to_json(Json& json, const Component& component) {
    json = {{"type", component.type}, {"version", component.version}};
}

std::optional<std::uint32_t> versionOf(const std::vector<Component>& components, std::string_view type) {
    const auto found = std::ranges::find(components, type, &Component::type);
    return found == components.end() ? std::nullopt : std::optional(found->version);
}

std::string componentsText(const std::vector<Component>& components) {
    if (components.empty()) return "nothing";
    std::vector<std::string> texts;
    texts.reserve(components.size());
    for (const Component& component : components)
        texts.push_back(component.type + " " + std::to_string(component.version));
    return joined(texts);
}

void to_json(Json& json, const Adapter& adapter) {
    json = {{"name", adapter.name}, {"description", adapter.description}, {"pciAddress", adapter.pciAddress},
            {"ids", adapter.ids},   {"updatable", adapter.updatable},     {"components", adapter.components},
            {"path", adapter.path}, {"answers", adapter.answers}};
}

std::vector<Component> readComponents(core::CimOperations& operations, const core::CimPath& port) {
    const core::AssociationFilter installed = {"Quenx_ElementSoftwareIdentity", "Quenx_SoftwareIdentity", "",
                                               ""};
    std::vector<Component> components;
    for (const core::InstanceValue& identity : operations.associators(port, installed)) {
        const std::vector<std::string> types = identity.texts("TargetTypes");
        const auto version = static_cast<std::uint32_t>(identity.number("MajorVersion"));
        // An installed identity is one component, so has one type, and the version is its major number.
        if (!types.empty()) components.push_back({types.front(), version});
    }
    return components;
}

std::vector<Adapter> readAdapters(core::CimOperations& operations) {
    std::vector<Adapter> adapters;
    for (const core::InstanceValue& port : operations.enumerateInstances("Quenx_EthernetPort")) {
        adapters.push_back({port.path, port.text("Name"), port.text("Description"),
                            identifyingText(port, "PCI Address"),
                            identifyingText(port, "PCI Vendor and Device ID"),
                            !core::sameName(identifyingText(port, "Firmware Update"), "Not Supported"),
                            readComponents(operations, port.path)});
        // Unknown to the provider, and not merely not told.
        const bool isUnknown = port.get<std::uint64_t>("EnabledState") == 0U;
        adapters.back().answers = !isUnknown || !adapters.back().components.empty();
    }
    return adapters;
}

std::string adviceForSilence(const Connection& connection) {
    if (!connection.isInProcess || ::geteuid() == 0) return "The system log has the reason.";
    // What was written to a simulated adapter is for the eyes of the user who wrote it.
    return "Run quenxctl as root, as whom alone you may see what root has written; the system log has the "
           "reason.";
}

std::string adviceForNoAdapters(const Connection& connection) {
    if (!connection.isInProcess) return {};
    return "Describe simulated ones in /etc/quenx-adapters.toml, or in a file that --adapters or "
           "QUENX_ADAPTERS names.";
}

Adapter findAdapter(const Connection& connection, const std::string& target) {
    std::vector<Adapter> adapters = readAdapters(*connection.operations);
    if (adapters.empty())
        throw CommandError(ExitStatus::NotFound, "There are no adapters.", adviceForNoAdapters(connection));
    std::vector<std::string> names;
    for (Adapter& adapter : adapters) {
        if (isMeant(adapter, target)) return std::move(adapter);
        names.push_back(adapter.name);
    }
    throw CommandError(ExitStatus::NotFound, "There is no adapter \"" + target + "\".",
                       didYouMean(target, names) + "The adapters are " + joined(names) + ".");
}

void to_json(Json& json, const InventoryItem& item) {
    json = {{"id", item.id},       {"description", item.description},     {"version", item.version},
            {"types", item.types}, {"installable", item.isInstallable()}, {"uris", item.uris},
            {"path", item.path}};
}

std::vector<InventoryItem> readInventory(core::CimOperations& operations) {
    std::vector<InventoryItem> items;
    for (const core::InstanceValue& identity : operations.enumerateInstances("Quenx_SoftwareIdentity")) {
        items.push_back({identity.path,
                         identity.text("InstanceID"),
                         identity.text("Description"),
                         identity.text("VersionString"),
                         identity.texts("TargetTypes"),
                         {}});
    }
    for (const auto& resource : operations.enumerateInstances("Quenx_SoftwareIdentityResource")) {
        // A resource is named after the identity whose file it is, and its path.
        const std::string id = resource.text("InstanceID");
        for (InventoryItem& item : items) {
            if (id.starts_with(item.id + "@")) item.uris.push_back(resource.text("AccessInfo"));
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
        if (std::ranges::any_of(item.uris, [&](const auto& uri) { return isSameFile(uri, wanted); }))
            return std::move(item);
    }
    throw CommandError(ExitStatus::NotFound, "The service's inventory does not have " + file + ".",
                       kAskInventory);
}

}  // namespace cli
