// SPDX-License-Identifier: Apache-2.0
#include "Cli/Adapters.h"
#include "Cli/Json.h"
#include "Cli/TextTable.h"
#include "Cli/Verbs.h"

namespace cli {

namespace {

Json adapterToJson(const Adapter& adapter) {
    return {{"name", adapter.name},
            {"description", adapter.description},
            {"pciAddress", adapter.pciAddress},
            {"ids", adapter.ids},
            {"updatable", adapter.updatable},
            {"components", toJson(adapter.components)},
            {"path", adapter.path.toString()}};
}

}  // namespace

ExitStatus showAdapters(Context& context) {
    const std::vector<Adapter> adapters = readAdapters(context.management);
    if (context.json) {
        Json list = Json::array();
        for (const Adapter& adapter : adapters)
            list.push_back(adapterToJson(adapter));
        printJson(context.out, {{"adapters", std::move(list)}});
        return ExitStatus::Done;
    }
    if (adapters.empty()) {
        context.out << "There are no adapters.\n";
        const std::string advice = adviceForNoAdapters(context.management);
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

}  // namespace cli
