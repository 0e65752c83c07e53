// SPDX-License-Identifier: Apache-2.0
#include "Cli/Identities.h"
#include "Cli/Json.h"
#include "Cli/TextTable.h"
#include "Cli/Verbs.h"

namespace cli {

namespace {

std::string typesText(const Identity& identity) {
    std::string text;
    for (const std::string& type : identity.types)
        text += (text.empty() ? "" : ",") + type;
    return text;
}

Json identityToJson(const Identity& identity) {
    return {{"id", identity.id},
            {"description", identity.description},
            {"version", identity.version},
            {"types", identity.types},
            {"installable", identity.isInstallable()},
            {"uris", identity.uris},
            {"path", identity.path.toString()}};
}

}  // namespace

ExitStatus showIdentities(Context& context) {
    const std::vector<Identity> identities = readIdentities(context.management);
    if (context.json) {
        Json list = Json::array();
        for (const Identity& identity : identities)
            list.push_back(identityToJson(identity));
        printJson(context.out, {{"identities", std::move(list)}});
        return ExitStatus::Done;
    }
    std::vector<std::vector<std::string>> rows = {{"ID", "VERSION", "TYPES", "WHERE"}};
    for (const Identity& identity : identities) {
        rows.push_back({identity.id, identity.version, typesText(identity),
                        identity.isInstallable() ? identity.uri() : identity.description});
    }
    printTable(context.out, rows);
    return ExitStatus::Done;
}

}  // namespace cli
