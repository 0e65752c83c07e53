// SPDX-License-Identifier: Apache-2.0
// Listing adapters and software identities.
#include "Cli/Display/Output.h"
#include "Cli/Update/Inventory.h"
#include "Cli/Verbs/Verbs.h"

namespace cli {

ExitStatus showAdapters(Context& context, const VerbOptions&) {
    const std::vector<Adapter> adapters = readAdapters(*context.connection.operations);
    if (context.json) {
        printJson(context.out, {{"adapters", adapters}});
        return ExitStatus::Done;
    }
    if (adapters.empty()) {
        context.out << "There are no adapters.\n";
        const std::string advice = adviceForNoAdapters(context.connection);
        if (!advice.empty()) context.out << advice << '\n';
        return ExitStatus::Done;
    }
    std::vector<std::vector<std::string>> rows = {
        {"NAME", "PCI", "IDS", "UPDATABLE", "FIRMWARE", "DESCRIPTION"}};
    for (const Adapter& adapter : adapters) {
        rows.push_back({adapter.name, adapter.pciAddress, adapter.ids, adapter.updatable ? "yes" : "no",
                        adapter.components.empty() ? "-" : componentsText(adapter.components),
                        adapter.description});
    }
    printTable(context.out, rows);
    return ExitStatus::Done;
}

ExitStatus showIdentities(Context& context, const VerbOptions&) {
    const std::vector<InventoryItem> items = readInventory(*context.connection.operations);
    if (context.json) {
        printJson(context.out, {{"identities", items}});
        return ExitStatus::Done;
    }
    std::vector<std::vector<std::string>> rows = {{"ID", "VERSION", "TYPES", "WHERE"}};
    for (const InventoryItem& item : items) {
        rows.push_back({item.id, item.version, joined(item.types, ","),
                        item.isInstallable() ? item.uri() : item.description});
    }
    printTable(context.out, rows);
    return ExitStatus::Done;
}

}  // namespace cli
