// SPDX-License-Identifier: Apache-2.0
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <system_error>

#include "Cli/Connection/Connection.h"
#include "Cli/Display/Messages.h"
#include "Framework/Requests/ProviderSession.h"
#include "MidAPI/ma.h"
#include "Utils/Os/Linux/linux.h"

namespace cli {

namespace {

void requireReadable(const std::string& file, const std::string& what) {
    std::error_code error;  // access() says it better
    if (std::filesystem::is_directory(file, error))
        throw CommandError(ExitStatus::WrongUse, "The " + what + " " + file + " is a directory.",
                           "Name a file.");
    if (os::isSpecialFile(file))
        throw CommandError(ExitStatus::WrongUse, "The " + what + " " + file + " is not a regular file.",
                           "Name a file.");
    if (access(file.c_str(), R_OK) == 0) return;
    const Explanation why = cannotRead("the " + what + " " + file, errno);
    throw CommandError(ExitStatus::WrongUse, why.message, why.advice);
}

/// Where the simulated adapters of a description keep their flash unless told otherwise: the directory that
/// QUENX_ADAPTER_STATE names, else one beside the description ("adapters.toml" has "adapters.state").
std::string defaultStateDirectory(const std::string& adapterDescription) {
    const char* chosen = std::getenv("QUENX_ADAPTER_STATE");
    if (chosen != nullptr && *chosen != '\0') return chosen;
    return std::filesystem::absolute(adapterDescription).replace_extension(".state").string();
}

void selectAdapters(const ProviderSettings& settings) {
    if (settings.adapterDescription.empty()) return;
    requireReadable(settings.adapterDescription, "adapter description");
    const std::string state = settings.stateDirectory.empty()
                                  ? defaultStateDirectory(settings.adapterDescription)
                                  : settings.stateDirectory;
    try {
        ma::configureSimulator(settings.adapterDescription, state);
    } catch (const std::exception& error) {
        throw CommandError(ExitStatus::WrongUse, error.what(),
                           "Correct the adapter description and try again.");
    }
}

void loadProviders(core::ProviderLibraries& providers, const std::string& named) {
    // The program's own directory is not something that the user got wrong.
    const ExitStatus status = named.empty() ? ExitStatus::Failed : ExitStatus::WrongUse;
    const std::string directory = named.empty() ? core::ProviderLibraries::defaultDirectory() : named;
    const std::string advice = "Name the directory that holds libQuenx_SoftwareUpdate.so with --providers.";
    try {
        providers.load(directory);
    } catch (const std::system_error& error) {
        throw CommandError(
            status, "Cannot read the provider directory " + directory + ": " + error.code().message() + ".",
            advice);
    }
    // One library alone would load, and the verbs then miss what the other one serves.
    if (!providers.problems().empty()) {
        const auto& problem = providers.problems().front();
        throw CommandError(status, "Cannot load " + problem.file + ": " + problem.reason + ".",
                           "All libraries must come from the same build. " + advice);
    }
    if (providers.loaded().empty())
        throw CommandError(status, "There is no provider library in " + directory + ".", advice);
}

}  // namespace

Connection openProviders(const ProviderSettings& settings) {
    // The configuration ignores a file that it cannot read; a user who names one wants to hear of that.
    if (!settings.configFile.empty()) requireReadable(settings.configFile, "configuration file");
    const auto session = std::make_shared<core::ProviderSession>(settings.configFile);
    // The adapters first: providers may ask for them as soon as they are loaded.
    selectAdapters(settings);
    loadProviders(session->libraries(), settings.directory);
    // The operations share ownership with the session, so the libraries stay loaded while they can be called.
    return {.operations = {session, session->operations().get()}, .isInProcess = true, .sharesFiles = true};
}

}  // namespace cli
