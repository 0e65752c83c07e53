// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/Providers.h"

#include <stdexcept>
#include <system_error>

#include "Framework/Classes/CimBroker.h"
#include "Host/Daemon/Report.h"

namespace host {

void loadProviders(core::ProviderLibraries& providers, const std::string& directory) {
    const std::string advice = ". Set providers.directory to the directory of libQuenx_SoftwareUpdate.so.";
    try {
        providers.load(directory);
    } catch (const std::system_error& error) {
        throw std::runtime_error("Cannot read the provider directory " + directory + ": " +
                                 error.code().message() + advice);
    }
    for (const auto& problem : providers.problems())
        reportProblem("Cannot load " + problem.file + ": " + problem.reason);
    std::string names;
    for (const core::AgentUse& each : core::GetCimBroker()->useAgents())
        names += (names.empty() ? "" : ", ") + each.agent().getProviderName();
    if (names.empty()) throw std::runtime_error("There is no provider library in " + directory + advice);
    report("Loaded the providers " + names + ".");
}

}  // namespace host
