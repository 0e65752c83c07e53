// SPDX-License-Identifier: Apache-2.0
#include "System/Quenxctl.h"

#include <algorithm>
#include <nlohmann/json.hpp>

namespace test {

void Quenxctl::describeAdapters(const std::string& fault) {
    std::string description = kTestAdapters;
    if (!fault.empty()) {
        description.insert(description.find("[[adapter]]\nname = \"eth1\""),
                           "[[adapter.fault]]\nat = \"write\"\n" + fault + "\n");
    }
    folder_.write("adapters.toml", description);
}

std::vector<std::string> Quenxctl::command(const std::vector<std::string>& arguments) const {
    std::vector<std::string> all = {QUENXCTL, "--adapters", folder_ / "adapters.toml"};
    // Never the machine's own.
    if (std::find(arguments.begin(), arguments.end(), "--config") == arguments.end())
        all.insert(all.end(), {"--config", configuration_});
    all.insert(all.end(), arguments.begin(), arguments.end());
    return all;
}

ProgramResult Quenxctl::quenxctl(const std::vector<std::string>& arguments,
                                 const std::vector<std::string>& environment) const {
    return run(command(arguments), environment);
}

void Quenxctl::expectError(const std::vector<std::string>& arguments, int status,
                           const std::string& part) const {
    const ProgramResult result = quenxctl(arguments);
    EXPECT_EQ(result.status, status) << part << "\n" << result.out << result.error;
    EXPECT_TRUE(contains(result.error, part)) << result.error << "\nwanted: " << part;
}

std::string Quenxctl::firmwareOf(const std::string& adapter) const {
    const ProgramResult result = quenxctl({"adapters", "--json"});
    const auto document = nlohmann::json::parse(result.out, nullptr, false);
    if (document.is_discarded()) return "no document: " + result.out + result.error;
    for (const auto& one : document["adapters"]) {
        if (one["name"] != adapter) continue;
        std::string text;
        for (const auto& component : one["components"]) {
            text += (text.empty() ? "" : ", ") + component["type"].get<std::string>() + " " +
                    std::to_string(component["version"].get<int>());
        }
        return text;
    }
    return "no such adapter";
}

}  // namespace test
