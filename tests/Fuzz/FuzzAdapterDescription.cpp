// SPDX-License-Identifier: Apache-2.0
#include <string_view>

#include "Fuzz/Fuzz.h"
#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Simulator/Simulator.h"
#include "Utils/Policy.h"

namespace {

/// What is taken must be usable: every adapter answers. Descriptions that name files are not followed.
void useAdapters(std::vector<ma::AdapterDescription> adapters) {
    for (ma::AdapterDescription& adapter : adapters) {
        adapter.flashFile.clear();
        adapter.faults.clear();
    }
    ma::Simulator simulator(std::move(adapters), "/nonexistent");
    for (const std::string& name : simulator.enumerateAdapters()) {
        require(!name.empty() && simulator.getPCIAddress(name).text.size() >= 10);
        require(simulator.getAdapterInfo(name).components.size() <= 5);
    }
}

}  // namespace

void fuzz(const std::string& text) {
    // The same reader, with the keys of another file.
    try {
        const utils::Policy policy = utils::parsePolicy(text, "fuzz.toml");
        for (const std::string& name : policy.administrators.value_or(std::vector<std::string>()))
            require(!name.empty() && name.find_first_of("\n*") == std::string::npos);
    } catch (const utils::PolicyError& error) {
        require(std::string_view(error.what()).starts_with("fuzz.toml, line "));
    }
    try {
        useAdapters(ma::parseAdapterDescriptions(text, "fuzz.toml"));
    } catch (const ma::AdapterError& error) {
        require(std::string_view(error.what()).starts_with("fuzz.toml, line "));
    }
}
