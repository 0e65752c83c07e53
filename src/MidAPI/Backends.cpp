// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Backends.h"

#include <unistd.h>

#include <algorithm>
#include <cstdlib>

#include "MidAPI/Devlink/DevlinkBackend.h"
#include "MidAPI/Devlink/PciFunctions.h"
#include "MidAPI/Simulator/Simulator.h"
#include "Utils/Utils.h"

namespace ma {
namespace {

constexpr const char* kAutomatic = "auto";
constexpr const char* kBackendVariable = "QUENX_BACKEND";
constexpr const char* kDescriptionVariable = "QUENX_ADAPTERS";
constexpr const char* kStateVariable = "QUENX_ADAPTER_STATE";
constexpr const char* kDefaultDescription = "/etc/quenx-adapters.toml";
constexpr const char* kDefaultState = "/var/lib/quenx/adapters";

Claim claimOfSimulator(const BackendChoice& choice) {
    if (choice.description) return Claim::Named;
    return ::access(kDefaultDescription, F_OK) == 0 ? Claim::Described : Claim::None;
}

std::shared_ptr<Backend> makeSimulator(const BackendChoice& choice) {
    return std::make_shared<Simulator>(choice.description.value_or(kDefaultDescription),
                                       choice.state.value_or(kDefaultState));
}

Claim claimOfDevlink(const BackendChoice&) {
    devlink::LinuxMachine machine;
    const auto functions = devlink::findPciFunctions(machine);
    // What cannot be read may be there.
    return functions && functions->empty() ? Claim::Possible : Claim::Present;
}

std::shared_ptr<Backend> makeDevlink(const BackendChoice&) {
    return std::make_shared<devlink::DevlinkBackend>(devlink::loadSettings());
}

constexpr BackendKind kKinds[] = {
    {kDevlinkBackend, false, claimOfDevlink, makeDevlink},
    {kSimulatorBackend, true, claimOfSimulator, makeSimulator},
};

const BackendKind* findKind(const std::string& name) {
    const auto* found = std::ranges::find(kKinds, name, &BackendKind::name);
    return found == std::end(kKinds) ? nullptr : found;
}

std::string kindNames() {
    std::vector<std::string> names;
    for (const BackendKind& kind : kKinds)
        names.emplace_back(kind.name);
    return utils::joined(names) + " or " + kAutomatic;
}

const BackendKind& kindOf(const BackendChoice& choice) {
    const std::string name = choice.backend.value_or(kAutomatic);
    if (name == kAutomatic)
        return *std::ranges::max_element(kKinds, {},
                                         [&](const BackendKind& kind) { return kind.claim(choice); });
    if (const BackendKind* kind = findKind(name)) return *kind;
    throw AdapterError("there is no backend \"" + name + "\"; it must be " + kindNames());
}

/// An empty variable was meant to name something, so it must not lead to real cards.
std::optional<std::string> variable(const char* name) {
    const char* value = std::getenv(name);
    if (value == nullptr) return std::nullopt;
    if (*value == '\0') throw AdapterError(name + std::string(": it is empty; give it a value or unset it"));
    return value;
}

/// Runs a step; a mistake in what a variable says is told with its name. Whoever reads of it has not
/// necessarily set it.
template <class Step>
auto blaming(const std::string& variableName, Step step) try {
    return step();
} catch (const AdapterError& error) {
    if (variableName.empty()) throw;
    throw AdapterError(variableName + ": " + error.what());
}

}  // namespace

std::shared_ptr<Backend> makeBackend(const BackendChoice& said) {
    BackendChoice choice = said;
    // What is said is said whole: a variable must not turn it into something else.
    const bool isOpen = !said.backend && !said.description;
    if (isOpen) choice.backend = variable(kBackendVariable);
    const std::string backendBy = isOpen && choice.backend ? kBackendVariable : "";

    const BackendKind* const named = findKind(said.backend.value_or(kAutomatic));
    const bool mayBeDescribed = named == nullptr || named->takesDescription;
    if (!said.description && mayBeDescribed) choice.description = variable(kDescriptionVariable);
    const std::string describedBy = !said.description && choice.description ? kDescriptionVariable : "";

    const BackendKind& kind = blaming(backendBy, [&]() -> const BackendKind& { return kindOf(choice); });
    if (kind.takesDescription && !choice.state) choice.state = variable(kStateVariable);
    return blaming(describedBy, [&] {
        if (choice.description && !kind.takesDescription)
            throw AdapterError("simulated adapters are described in " + *choice.description +
                               ", but the backend is to be " + kind.name + "; name only one of them");
        return kind.make(choice);
    });
}

}  // namespace ma
