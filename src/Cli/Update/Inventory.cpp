// SPDX-License-Identifier: Apache-2.0
#include "Cli/Update/Inventory.h"

#include <unistd.h>

#include <algorithm>
#include <filesystem>

#include "Cli/Display/Output.h"
#include "Cli/Update/Candidate.h"
#include "MidAPI/ma.h"

namespace cli {

namespace {

/// The texts that stand under a description: what identifies a port, and what each text is, are parallel
/// lists.
std::vector<std::string> textsUnder(const std::vector<std::string>& descriptions,
                                    const std::vector<std::string>& texts, std::string_view description) {
    std::vector<std::string> found;
    for (std::size_t i = 0; i < std::min(texts.size(), descriptions.size()); ++i) {
        if (core::sameName(descriptions[i], description)) found.push_back(texts[i]);
    }
    return found;
}

std::vector<std::string> identifyingTexts(const core::InstanceValue& port, std::string_view description) {
    return textsUnder(port.texts("IdentifyingDescriptions"), port.texts("OtherIdentifyingInfo"), description);
}

std::string identifyingText(const core::InstanceValue& port, std::string_view description) {
    const std::vector<std::string> found = identifyingTexts(port, description);
    return found.empty() ? std::string() : found.front();
}

constexpr std::string_view kVendor = "Quenx:";
constexpr const char* kResetNeeded = "Quenx:Reset Needed";

/// What an installed identity is a version of: its image type, or else the driver's name for it.
Component componentOf(const core::InstanceValue& identity) {
    const std::vector<std::string> kinds = identity.texts("IdentityInfoType");
    const std::vector<std::string> types = identity.texts("TargetTypes");
    Component component;
    if (!types.empty()) {
        component.type = types.front();
    } else if (kinds.size() > 1 && kinds[1].starts_with(kVendor)) {
        component.type = kinds[1].substr(kVendor.size());  // behind the ids
    }
    const std::string label = std::string(kVendor) + component.type;
    const std::vector<std::string> values = textsUnder(kinds, identity.texts("IdentityInfoValue"), label);
    const auto number = utils::parseNumber<std::uint32_t>(values.empty() ? "" : values.front());
    component.version = number.value_or(static_cast<std::uint32_t>(identity.number("MajorVersion")));
    // Of an image the text repeats type and number.
    const std::string text = identity.text("VersionString");
    if (text != component.type + " " + std::to_string(component.version)) component.text = text;
    return component;
}

/// An identity that waits for a reset belongs to the one that runs.
void takeStored(std::vector<Component>& components, const Component& stored) {
    const auto running = std::ranges::find(components, stored.type, &Component::type);
    if (running != components.end()) running->stored = stored.text;
}

bool isNamed(const Adapter& adapter, const std::string& target) {
    const core::CimPath path(target);
    return adapter.name == target || (path.isInstancePath() && adapter.path.isSameObjectAs(path));
}

/// By the address with the domain that "lspci -D" prints, and that the model leaves out where it is the first
/// one; or by the address without it, which adapters of several domains may have.
bool isAt(const Adapter& adapter, std::string_view target) {
    const auto hasDomain = [](std::string_view address) { return std::ranges::count(address, ':') == 2; };
    const std::string& shown = adapter.pciAddress;
    const std::string full = hasDomain(shown) ? shown : "0000:" + shown;
    // An adapter without an address must not be meant by an empty one.
    return !shown.empty() &&
           core::sameName(hasDomain(target) ? full : full.substr(full.find(':') + 1), target);
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
    if (!component.text.empty()) json["text"] = component.text;
    if (!component.stored.empty()) json["stored"] = component.stored;
}

const Component* findComponent(const std::vector<Component>& components, std::string_view type) {
    const auto found = std::ranges::find(components, type, &Component::type);
    return found == components.end() ? nullptr : &*found;
}

std::optional<std::uint32_t> versionOf(const std::vector<Component>& components, std::string_view type) {
    const Component* found = findComponent(components, type);
    return found == nullptr ? std::nullopt : std::optional(found->version);
}

std::string labelOf(const std::string& adapter, const std::string& backend) {
    return backend == ma::kSimulatorBackend ? adapter + " (simulated)" : adapter;
}

std::string componentsText(const std::vector<Component>& components) {
    if (components.empty()) return "nothing";
    std::vector<std::string> texts;
    texts.reserve(components.size());
    for (const Component& component : components)
        texts.push_back(component.type + " " + component.versionText() +
                        (component.stored.empty() ? "" : " (" + component.stored + " after a reset)"));
    return joined(texts);
}

void to_json(Json& json, const Adapter& adapter) {
    json = {{"name", adapter.name},
            {"backend", adapter.backend},
            {"description", adapter.description},
            {"pciAddress", adapter.pciAddress},
            {"ids", adapter.ids},
            {"driver", adapter.driver},
            {"serialNumber", adapter.serialNumber},
            {"boardSerialNumber", adapter.boardSerialNumber},
            {"interfaces", adapter.interfaces},
            {"updatable", adapter.updatable},
            {"busy", adapter.busy},
            {"writer", adapter.writer},
            {"components", adapter.components},
            {"resetNeeded", adapter.resetNeeded},
            {"path", adapter.path},
            {"answers", adapter.answers}};
}

std::vector<Component> readComponents(core::CimOperations& operations, const core::CimPath& port) {
    const core::AssociationFilter installed = {"Quenx_ElementSoftwareIdentity", "Quenx_SoftwareIdentity", "",
                                               ""};
    std::vector<Component> components;
    for (const core::InstanceValue& identity : operations.associators(port, installed)) {
        Component component = componentOf(identity);
        if (component.type.empty()) continue;
        if (!textsUnder(identity.texts("IdentityInfoType"), identity.texts("IdentityInfoValue"), kResetNeeded)
                 .empty()) {
            takeStored(components, component);
        } else {
            components.push_back(std::move(component));
        }
    }
    return components;
}

namespace {

/// Unknown to the provider, and not merely not told.
bool isUnknown(const core::InstanceValue& port) {
    return port.get<std::uint64_t>("EnabledState") == 0U;
}

std::string resetNeededOf(const core::InstanceValue& port) {
    const std::string reset = identifyingText(port, "Reset Needed");
    if (reset.empty()) return isUnknown(port) ? "unknown" : "none";
    return utils::lowerCase(reset);
}

void readMore(Adapter& adapter, const core::InstanceValue& port) {
    adapter.backend = backendOf(port);
    adapter.driver = identifyingText(port, "Driver");
    adapter.serialNumber = identifyingText(port, "Serial Number");
    adapter.boardSerialNumber = identifyingText(port, "Board Serial Number");
    adapter.interfaces = identifyingTexts(port, "Network Interface");
    adapter.resetNeeded = resetNeededOf(port);
    adapter.busy = identifyingText(port, "Update State") == "Busy";
    adapter.writer = identifyingText(port, "Updating Process");
}

}  // namespace

std::vector<Adapter> readAdapters(core::CimOperations& operations) {
    std::vector<Adapter> adapters;
    for (const core::InstanceValue& port : operations.enumerateInstances("Quenx_EthernetPort")) {
        adapters.push_back({port.path, port.text("Name"), port.text("Description"),
                            identifyingText(port, "PCI Address"),
                            identifyingText(port, "PCI Vendor and Device ID"),
                            !core::sameName(identifyingText(port, "Firmware Update"), "Not Supported"),
                            readComponents(operations, port.path)});
        adapters.back().answers = !isUnknown(port) || !adapters.back().components.empty();
        readMore(adapters.back(), port);
    }
    return adapters;
}

std::string readResetNeeded(core::CimOperations& operations, const core::CimPath& port) {
    for (const core::InstanceValue& each : operations.enumerateInstances("Quenx_EthernetPort"))
        if (each.path.isSameObjectAs(port)) return resetNeededOf(each);
    return "unknown";
}

std::string backendOf(const core::InstanceValue& port) {
    return identifyingText(port, "Adapter Backend");
}

bool waitsForReset(const std::vector<Component>& components, const std::string& resetNeeded) {
    return std::ranges::any_of(components, [](const Component& each) { return !each.stored.empty(); }) ||
           (resetNeeded != "none" && resetNeeded != "unknown");
}

bool Adapter::waitsForReset() const {
    return cli::waitsForReset(components, resetNeeded);
}

std::string adviceForSilence(const Connection& connection) {
    if (!connection.isInProcess || ::geteuid() == 0) return "The system log has the reason.";
    // What was written to a simulated adapter is for the eyes of the user who wrote it.
    return "Run quenxctl as root, as whom alone you may see what root has written; the system log has the "
           "reason.";
}

std::string searchText(const Connection& connection) {
    return connection.isInProcess ? ma::describeSearch() : "";
}

std::string adviceForNoAdapters(const Connection& connection) {
    if (!connection.isInProcess) return {};
    const std::string search = searchText(connection);
    return search + (search.empty() ? "" : " ") +
           "Simulated ones can be described in a file that --adapters or QUENX_ADAPTERS names.";
}

Adapter findAdapter(const Connection& connection, const std::string& target) {
    std::vector<Adapter> adapters = readAdapters(*connection.operations);
    if (adapters.empty())
        throw CommandError(ExitStatus::NotFound, "There are no adapters.", adviceForNoAdapters(connection));
    std::vector<std::string> names;
    std::vector<std::string> namesThere;
    Adapter* there = nullptr;
    for (Adapter& adapter : adapters) {
        if (isNamed(adapter, target)) return std::move(adapter);
        names.push_back(adapter.name);
        if (!isAt(adapter, target)) continue;
        there = &adapter;
        namesThere.push_back(adapter.name);
    }
    if (namesThere.size() > 1)
        throw CommandError(
            ExitStatus::WrongUse,
            "Several adapters have the PCI address " + target + ": " + joined(namesThere) + ".",
            "Name one of them, or write its address with the PCI domain.");
    if (there != nullptr) return std::move(*there);
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
