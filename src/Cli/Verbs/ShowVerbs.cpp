// SPDX-License-Identifier: Apache-2.0
// The verbs that only show what there is: adapters and identities, instances and their associations.
#include <algorithm>
#include <map>

#include "Cli/Display/Output.h"
#include "Cli/Update/Service.h"
#include "Cli/Verbs/Verbs.h"

namespace cli {

namespace {

/// Text: the path, then one indented line for each property that is not null.
ExitStatus print(Context& context, const std::vector<core::InstanceValue>& instances) {
    if (context.json) {
        printJson(context.out, {{"instances", instances}});
        return ExitStatus::Done;
    }
    for (const core::InstanceValue& instance : instances) {
        context.out << printable(instance.path.toString()) << '\n';
        for (const core::PropertyValue& property : instance.properties) {
            if (property.value.isNull()) continue;
            context.out << "    " << printable(property.name) << " = " << displayText(property.value) << '\n';
        }
    }
    return ExitStatus::Done;
}

ExitStatus print(Context& context, const std::vector<core::CimPath>& paths) {
    if (context.json) {
        printJson(context.out, {{"paths", paths}});
        return ExitStatus::Done;
    }
    for (const core::CimPath& path : paths)
        context.out << printable(path.toString()) << '\n';
    return ExitStatus::Done;
}

/// None where a server does not list them.
std::vector<std::string> servedClasses(core::CimOperations& operations) try {
    std::vector<std::string> names;
    for (const core::ClassChain& chain : operations.enumerateClasses("", true))
        names.push_back(chain.front()->name);
    return names;
} catch (const core::CimError&) {
    return {};
}

[[noreturn]] void refuseClass(core::CimOperations& operations, const std::string& name) {
    throw CommandError(ExitStatus::NotFound, "No class \"" + name + "\" is served.",
                       didYouMean(name, servedClasses(operations)) + kAskMof);
}

void refuseUnknownClass(core::CimOperations& operations, const std::string& name) {
    if (!name.empty() && operations.getClass(name).empty()) refuseClass(operations, name);
}

/// What two operations find around an instance, the one as instances and the other as paths.
template <class List, class ListNames>
ExitStatus showAround(Context& context, const VerbOptions& options, List list, ListNames listNames) {
    core::CimOperations& operations = *context.connection.operations;
    const core::CimPath path(options.path);
    if (!path.isInstancePath()) {
        throw CommandError(ExitStatus::WrongUse, "\"" + options.path + "\" is not the path of an instance.",
                           "Give one as \"quenxctl instances CLASS --names\" prints it, in single quotes.");
    }
    try {
        return options.namesOnly ? print(context, (operations.*listNames)(path, options.filter))
                                 : print(context, (operations.*list)(path, options.filter, std::nullopt));
    } catch (const core::CimError& error) {
        // To the operation an unknown class of the filter is a wrong parameter like any other.
        if (error.status() == core::CimStatus::InvalidParameter) {
            refuseUnknownClass(operations, options.filter.associationClass);
            refuseUnknownClass(operations, options.filter.resultClass);
        }
        throw;
    }
}

/// Nothing of its firmware is known: it does not answer, or answers nobody while it is written to.
bool isFirmwareUnknown(const Adapter& adapter) {
    return !adapter.answers || (adapter.busy && adapter.components.empty());
}

void tellWriters(Context& context, const std::vector<Adapter>& adapters) {
    for (const Adapter& adapter : adapters)
        if (adapter.busy && !adapter.writer.empty())
            context.error << printable(adapter.name + " is being written to by " + adapter.writer) << ".\n";
}

std::vector<std::string> silentOnes(const std::vector<Adapter>& adapters) {
    std::vector<std::string> names;
    for (const Adapter& adapter : adapters)
        if (isFirmwareUnknown(adapter)) names.push_back(adapter.name);
    return names;
}

void tellSilentOnes(Context& context, const std::vector<std::string>& names) {
    if (names.empty()) return;
    context.error << "The firmware of " << printable(joined(names)) << " cannot be read. "
                  << adviceForSilence(context.connection) << '\n';
}

ExitStatus showPending(Context& context, std::vector<Adapter> adapters) {
    const std::vector<std::string> silent = silentOnes(adapters);
    std::erase_if(adapters, [](const Adapter& adapter) { return !adapter.waitsForReset(); });
    const ExitStatus status = !adapters.empty() ? ExitStatus::ResetPending
                              : silent.empty()  ? ExitStatus::Done
                                                : ExitStatus::Unknown;
    if (context.json) {
        printJson(context.out, {{"adapters", adapters}, {"silent", silent}});
        return status;
    }
    Rows rows = {{"NAME", "BACKEND", "RESET", "FIRMWARE"}};
    for (const Adapter& adapter : adapters)
        rows.push_back(
            {adapter.name, adapter.backend, adapter.resetNeeded, componentsText(adapter.components)});
    if (!adapters.empty())
        printTable(context.out, rows);
    else
        context.out << (silent.empty() ? "No adapter waits for a reset.\n"
                                       : "No adapter that answers waits for a reset.\n");
    tellSilentOnes(context, silent);
    return status;
}

}  // namespace

namespace {

void printAdapters(Context& context, const std::vector<Adapter>& adapters) {
    if (adapters.empty()) {
        context.out << "There are no adapters.\n";
        printHint(context.out, adviceForNoAdapters(context.connection));
        return;
    }
    Rows rows = {{"NAME", "BACKEND", "PCI", "IDS", "UPDATABLE", "FIRMWARE", "DESCRIPTION"}};
    for (const Adapter& adapter : adapters) {
        const std::string firmware = isFirmwareUnknown(adapter)   ? "?"
                                     : adapter.components.empty() ? "-"
                                                                  : componentsText(adapter.components);
        const std::string updatable = !adapter.updatable ? "no" : adapter.busy ? "busy" : "yes";
        rows.push_back({adapter.name, adapter.backend, adapter.pciAddress, adapter.ids, updatable, firmware,
                        adapter.description});
    }
    printTable(context.out, rows);
    tellWriters(context, adapters);
    // Why that is so is the next question.
    if (std::ranges::none_of(adapters, &Adapter::updatable))
        printHint(context.out, adviceForNoAdapters(context.connection));
    tellSilentOnes(context, silentOnes(adapters));
}

/// The first steps, with the name of an adapter for which they work.
Rows nextSteps(const std::vector<Adapter>& adapters) {
    Rows steps;
    const auto free = std::ranges::find_if(
        adapters, [](const Adapter& adapter) { return adapter.updatable && !adapter.busy; });
    if (free != adapters.end()) {
        steps.push_back({"quenxctl check --target " + free->name + " IMAGE", "whether an image fits"});
        steps.push_back({"quenxctl install --target " + free->name + " IMAGE", "write it"});
    }
    if (std::ranges::any_of(adapters, &Adapter::waitsForReset))
        steps.push_back({"quenxctl adapters --pending", "new firmware that does not run yet"});
    if (std::ranges::any_of(adapters, &Adapter::busy))
        steps.push_back({"quenxctl status", "who writes to which adapter"});
    steps.push_back({"quenxctl history", "what was done, by whom, and how it ended"});
    steps.push_back({"quenxctl help", "everything else"});
    return steps;
}

}  // namespace

ExitStatus showAdapters(Context& context, const VerbOptions& options) {
    std::vector<Adapter> adapters = readAdapters(*context.connection.operations);
    if (options.pendingOnly) return showPending(context, std::move(adapters));
    if (context.json)
        printJson(context.out, {{"adapters", adapters}, {"search", searchText(context.connection)}});
    else
        printAdapters(context, adapters);
    return ExitStatus::Done;
}

ExitStatus showOverview(Context& context, const VerbOptions&) {
    const std::vector<Adapter> adapters = readAdapters(*context.connection.operations);
    printAdapters(context, adapters);
    context.out << "\nWhat you can do next:\n";
    printPairs(context.out, nextSteps(adapters));
    return ExitStatus::Done;
}

namespace {

/// What the policy says of the images among the items, by their URIs; empty where it asks for no signatures.
std::map<std::string, update::ImageTrust> trustOfImages(const Connection& connection,
                                                        const std::vector<InventoryItem>& items) {
    std::vector<std::string> uris;
    for (const InventoryItem& item : items)
        if (item.isInstallable()) uris.push_back(item.uri());
    const auto told = readTrust(connection, uris);
    std::map<std::string, update::ImageTrust> trust;
    for (std::size_t i = 0; told && i < uris.size(); ++i)
        trust[uris[i]] = (*told)[i];
    return trust;
}

/// "trusted by release", "QX-0603 The image has no signature."
std::string trustCell(const update::ImageTrust& trust) {
    if (!trust.key.empty()) return "trusted by " + trust.key;
    const core::Reason* row = core::findReason(trust.reason);
    return row == nullptr ? trust.why : core::reasonCode(trust.reason) + " " + row->text;
}

Json identityJson(const InventoryItem& item, const std::map<std::string, update::ImageTrust>& trust) {
    Json json = item;
    if (const auto found = trust.find(item.uri()); found != trust.end()) {
        json["signedBy"] = found->second.key.empty() ? Json() : Json(found->second.key);
        json["reasonId"] = found->second.key.empty() ? Json(core::reasonCode(found->second.reason)) : Json();
        json["reason"] = found->second.why;
    }
    return json;
}

}  // namespace

ExitStatus showIdentities(Context& context, const VerbOptions&) {
    const std::vector<InventoryItem> items = readInventory(*context.connection.operations);
    const auto trust = trustOfImages(context.connection, items);
    if (context.json) {
        Json identities = Json::array();
        for (const InventoryItem& item : items)
            identities.push_back(identityJson(item, trust));
        printJson(context.out, {{"identities", identities}});
        return ExitStatus::Done;
    }
    Rows rows = {{"ID", "VERSION", "TYPES", "WHERE"}};
    if (!trust.empty()) rows.front().emplace_back("TRUST");
    for (const InventoryItem& item : items) {
        rows.push_back({item.id, item.version, joined(item.types, ","),
                        item.isInstallable() ? item.uri() : item.description});
        if (const auto found = trust.find(item.uri()); found != trust.end())
            rows.back().push_back(trustCell(found->second));
    }
    printTable(context.out, rows);
    return ExitStatus::Done;
}

ExitStatus showInstances(Context& context, const VerbOptions& options) try {
    core::CimOperations& operations = *context.connection.operations;
    return options.namesOnly ? print(context, operations.enumerateInstanceNames(options.className))
                             : print(context, operations.enumerateInstances(options.className));
} catch (const core::CimError& error) {
    // Looked up only now: a class that is served needs no list of the others.
    if (error.status() != core::CimStatus::InvalidClass) throw;
    refuseClass(*context.connection.operations, options.className);
}

ExitStatus showAssociators(Context& context, const VerbOptions& options) {
    using core::CimOperations;
    return showAround(context, options, &CimOperations::associators, &CimOperations::associatorNames);
}

ExitStatus showReferences(Context& context, const VerbOptions& options) {
    using core::CimOperations;
    return showAround(context, options, &CimOperations::references, &CimOperations::referenceNames);
}

}  // namespace cli
