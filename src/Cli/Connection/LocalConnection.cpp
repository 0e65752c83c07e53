// SPDX-License-Identifier: Apache-2.0
#include <pwd.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <iostream>
#include <optional>
#include <system_error>

#include "Cli/Connection/Connection.h"
#include "Cli/Display/Messages.h"
#include "Cli/Display/Terminal.h"
#include "Framework/Requests/Audit.h"
#include "Framework/Requests/Caller.h"
#include "Framework/Requests/DeniedUpdates.h"
#include "Framework/Requests/ProviderSession.h"
#include "History/Log/LogAgent.h"
#include "Logind/InhibitingLocker.h"
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

/// Beside the description, unless the user has a directory for that: "adapters.toml" has "adapters.state".
std::optional<std::string> stateDirectory(const ma::BackendChoice& adapters) {
    if (adapters.state || std::getenv("QUENX_ADAPTER_STATE") != nullptr) return adapters.state;
    return std::filesystem::absolute(*adapters.description).replace_extension(".state").string();
}

void requireValue(const char* option, const std::optional<std::string>& value) {
    if (value && value->empty())
        throw CommandError(ExitStatus::WrongUse, std::string(option) + " has an empty value.",
                           "Give it one, or leave it out.");
}

void selectAdapters(ma::BackendChoice adapters) {
    // Whatever is wrong with the variables is told when the adapters are asked for.
    if (!adapters.backend && !adapters.description) return;
    requireValue("--backend", adapters.backend);
    requireValue("--adapters", adapters.description);
    requireValue("--state", adapters.state);
    if (adapters.description) {
        requireReadable(*adapters.description, "adapter description");
        adapters.state = stateDirectory(adapters);
    }
    try {
        ma::selectBackend(adapters);
    } catch (const std::exception& error) {
        throw CommandError(ExitStatus::WrongUse, sentence(error.what()),
                           !adapters.backend ? "Correct the adapter description and try again."
                           : adapters.description
                               ? "Leave out --backend or --adapters, or correct what they name."
                               : "Correct --backend; simulated adapters take --adapters with a description.");
    }
}

/// The session, and who uses it: the thread that opens it and gives it up.
struct LocalSession {
    explicit LocalSession(const ProviderSettings& settings)
        : session(settings.configFile, settings.policyFile) {}

    const core::CallerScope caller{
        {.principal = localUser(), .address = "local", .front = "quenxctl", .isAdministrator = true}};
    core::ProviderSession session;
};

/// At once, and not after the image has been looked at.
void requirePolicy(core::ProviderSession& session, const ProviderSettings& settings) {
    const std::string problem = session.policy().problem();
    if (problem.empty()) return;
    const std::string text = "The policy cannot be obeyed: " + problem + ".";
    if (settings.order) {
        tellOfRefusal(*settings.order, core::ReasonId::PolicyUnreadable, text);
        throw PolicyRefusal(settings.policyFile.empty() ? ExitStatus::Failed : ExitStatus::WrongUse, text,
                            kMendPolicy);
    }
    std::cerr << "quenxctl: Warning: " << printable(text) << '\n' << kMendPolicy << '\n';
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

void tellOfRefusal(const std::vector<core::Argument>& order, core::ReasonId reason, const std::string& text) {
    const core::Argument* const target = core::findByName(order, "Target");
    core::tellOfDenied("InstallFromURI", order, reason, text);
    core::audit({core::CallerScope::current(),
                 "InstallFromURI",
                 target == nullptr ? "" : core::valueText(target->value),
                 core::outcomeOf(core::CimStatus::AccessDenied, text),
                 {.reason = reason}},
                order);
}

std::string localUser() {
    const uid_t id = ::getuid();
    const passwd* entry = ::getpwuid(id);
    return entry == nullptr ? std::to_string(id) : entry->pw_name;
}

Connection openProviders(const ProviderSettings& settings) {
    // The configuration ignores a file that it cannot read; a user who names one wants to hear of that.
    if (!settings.configFile.empty()) requireReadable(settings.configFile, "configuration file");
    const auto local = std::make_shared<LocalSession>(settings);
    core::ProviderSession* const session = &local->session;
    // The adapters first: providers may ask for them as soon as they are loaded.
    selectAdapters(settings.adapters);
    session->workUnder(std::make_unique<logind::InhibitingLocker>("quenxctl"));
    const auto history = history::History::wanted();
    const auto refusals = std::make_shared<RefusalSink>(history);
    session->keepHistory(refusals);
    requirePolicy(*session, settings);
    loadProviders(session->libraries(), settings.directory);
    history::serveLog(*session, history);
    // The operations share ownership with the session, so the libraries stay loaded while they can be called.
    return {.operations = {local, session->operations().get()},
            .history = history,
            .refusals = refusals,
            .isInProcess = true,
            .sharesFiles = true};
}

}  // namespace cli
