// SPDX-License-Identifier: Apache-2.0
#include "Cli/Adapters.h"

#include <algorithm>

#include "Cli/Failure.h"
#include "Cli/Suggestion.h"
#include "Cli/Values.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

constexpr const char* PORT_CLASS = "Quenx_EthernetPort";

/// The text that a port gives under a description, its identifying texts and their descriptions being
/// parallel.
std::string identifyingText(const core::InstanceValue& port, std::string_view description) {
    const std::vector<std::string> texts = textsOf(port, "OtherIdentifyingInfo");
    const std::vector<std::string> descriptions = textsOf(port, "IdentifyingDescriptions");
    for (std::size_t i = 0; i < std::min(texts.size(), descriptions.size()); ++i) {
        if (core::sameName(descriptions[i], description)) return texts[i];
    }
    return {};
}

Adapter readAdapter(Management& management, const core::InstanceValue& port) {
    Adapter adapter;
    adapter.path = port.path;
    adapter.name = textOf(port, "Name");
    adapter.description = textOf(port, "Description");
    adapter.pciAddress = identifyingText(port, "PCI Address");
    adapter.ids = identifyingText(port, "PCI Vendor and Device ID");
    adapter.updatable = !core::sameName(identifyingText(port, "Firmware Update"), "Not Supported");
    adapter.components = readComponents(management, port.path);
    return adapter;
}

/// Without the domain that "lspci -D" prints and the model leaves out.
std::string_view withoutDomain(std::string_view pciAddress) {
    constexpr std::string_view FIRST_DOMAIN = "0000:";
    if (pciAddress.starts_with(FIRST_DOMAIN)) pciAddress.remove_prefix(FIRST_DOMAIN.size());
    return pciAddress;
}

bool isMeant(const Adapter& adapter, const std::string& target, const std::optional<core::CimPath>& path) {
    const std::string_view address = withoutDomain(adapter.pciAddress);
    return adapter.name == target || (!address.empty() && core::sameName(address, withoutDomain(target))) ||
           (path && adapter.path.isSameObjectAs(*path));
}

Failure unknownAdapter(const std::string& target, const std::vector<Adapter>& adapters) {
    std::vector<std::string> names;
    for (const Adapter& adapter : adapters)
        names.push_back(adapter.name);
    return {ExitStatus::NotFound, "There is no adapter \"" + target + "\".",
            didYouMean(target, names) + "The adapters are " + listText(names) + "."};
}

}  // namespace

std::vector<Component> readComponents(Management& management, const core::CimPath& port) {
    const core::AssociationFilter installed = {"Quenx_ElementSoftwareIdentity", "Quenx_SoftwareIdentity", "",
                                               ""};
    std::vector<Component> components;
    for (const core::InstanceValue& identity : management.associators(port, installed)) {
        const std::vector<std::string> types = textsOf(identity, "TargetTypes");
        const auto version = static_cast<std::uint32_t>(numberOf(identity, "MajorVersion"));
        if (!types.empty()) components.push_back({types.front(), version});
    }
    return components;
}

std::vector<Adapter> readAdapters(Management& management) {
    std::vector<Adapter> adapters;
    for (const core::InstanceValue& port : management.enumerateInstances(PORT_CLASS)) {
        adapters.push_back(readAdapter(management, port));
    }
    return adapters;
}

std::string adviceForNoAdapters(const Management& management) {
    if (!management.runsJobs()) return {};
    return "Describe simulated ones in /etc/quenx-adapters.toml, or in a file that --adapters or "
           "QUENX_ADAPTERS names.";
}

Adapter findAdapter(Management& management, const std::string& target) {
    const std::vector<Adapter> adapters = readAdapters(management);
    if (adapters.empty()) {
        throw Failure(ExitStatus::NotFound, "There are no adapters.", adviceForNoAdapters(management));
    }
    const core::CimPath asPath(target);
    const std::optional<core::CimPath> path =
        asPath.isInstancePath() ? std::optional<core::CimPath>(asPath) : std::nullopt;
    const auto found = std::find_if(adapters.begin(), adapters.end(),
                                    [&](const Adapter& adapter) { return isMeant(adapter, target, path); });
    if (found != adapters.end()) return *found;
    throw unknownAdapter(target, adapters);
}

std::optional<std::uint32_t> versionOf(const std::vector<Component>& components, std::string_view type) {
    const auto found = std::find_if(components.begin(), components.end(),
                                    [type](const Component& component) { return component.type == type; });
    return found == components.end() ? std::nullopt : std::optional(found->version);
}

std::string componentsText(const std::vector<Component>& components) {
    if (components.empty()) return "nothing";
    std::string text;
    for (const Component& component : components) {
        text += (text.empty() ? "" : ", ") + component.type + " " + std::to_string(component.version);
    }
    return text;
}

}  // namespace cli
