// SPDX-License-Identifier: Apache-2.0
#include "Cli/LocalManagement.h"

#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <system_error>

#include "Cli/Failure.h"
#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/RequestScope.h"
#include "Framework/Model/CimInstance.h"
#include "MidAPI/ma.h"
#include "Providers/Schema/UpdateInterfaces.h"

namespace cli {

namespace fs = std::filesystem;

namespace {

void requireReadable(const std::string& file, const std::string& what) {
    if (access(file.c_str(), R_OK) == 0) return;
    const Explanation why = cannotRead("the " + what + " " + file, errno);
    throw Failure(ExitStatus::WrongUse, why.message, why.advice);
}

void selectAdapters(const LocalSettings& settings) {
    if (settings.adapterDescription.empty()) return;
    requireReadable(settings.adapterDescription, "adapter description");
    const std::string state = settings.stateDirectory.empty()
                                  ? defaultStateDirectory(settings.adapterDescription)
                                  : settings.stateDirectory;
    try {
        ma::configureSimulator(settings.adapterDescription, state);
    } catch (const std::exception& error) {
        throw Failure(ExitStatus::WrongUse, error.what(), "Correct the adapter description and try again.");
    }
}

/// @param status  what a directory that cannot be used means
void loadProviders(core::ProviderLibraries& providers, const std::string& directory, ExitStatus status) {
    const std::string advice = "Name the directory that holds libQuenx_SoftwareUpdate.so with --providers.";
    try {
        providers.load(directory);
    } catch (const std::system_error& error) {
        throw Failure(status,
                      "Cannot read the provider directory " + directory + ": " + error.code().message() + ".",
                      advice);
    }
    if (!providers.problems().empty()) {
        const auto& problem = providers.problems().front();
        throw Failure(status, "Cannot load " + problem.file + ": " + problem.reason + ".",
                      "All libraries must come from the same build. " + advice);
    }
    if (providers.loaded().empty()) {
        throw Failure(status, "There is no provider library in " + directory + ".", advice);
    }
}

}  // namespace

std::string defaultStateDirectory(const std::string& adapterDescription) {
    const char* chosen = std::getenv("QUENX_ADAPTER_STATE");
    if (chosen != nullptr && *chosen != '\0') return chosen;
    return fs::absolute(adapterDescription).replace_extension(".state").string();
}

LocalManagement::LocalManagement(const LocalSettings& settings) {
    if (!settings.configFile.empty()) requireReadable(settings.configFile, "configuration file");
    m_session.emplace(settings.configFile);
    selectAdapters(settings);
    if (settings.providerDirectory.empty()) {
        loadProviders(m_session->libraries(), core::ProviderLibraries::defaultDirectory(),
                      ExitStatus::Failed);
    } else {
        loadProviders(m_session->libraries(), settings.providerDirectory, ExitStatus::WrongUse);
    }
}

std::vector<core::InstanceValue> LocalManagement::enumerateInstances(const std::string& className) {
    return operations().enumerateInstances(className);
}

std::vector<core::CimPath> LocalManagement::enumerateInstanceNames(const std::string& className) {
    return operations().enumerateInstanceNames(className);
}

core::InstanceValue LocalManagement::getInstance(const core::CimPath& path) {
    return operations().getInstance(path);
}

std::vector<core::InstanceValue> LocalManagement::associators(const core::CimPath& path,
                                                              const core::AssociationFilter& by) {
    return operations().associators(path, by);
}

std::vector<core::CimPath> LocalManagement::associatorNames(const core::CimPath& path,
                                                            const core::AssociationFilter& by) {
    return operations().associatorNames(path, by);
}

core::MethodResult LocalManagement::invokeMethod(const core::CimPath& path, const std::string& method,
                                                 const std::vector<core::Argument>& arguments) {
    return operations().invokeMethod(path, method, arguments);
}

std::optional<std::uint32_t> LocalManagement::checkImage(const core::CimPath& service, const std::string& uri,
                                                         const core::CimPath& target,
                                                         const InstallOptions& options) {
    const core::RequestScope scope;
    core::CimPath path = service;
    auto* check = dynamic_cast<update::ImageCheck*>(core::GetCimBroker()->getInstanceByPath(path));
    if (check == nullptr) return std::nullopt;
    return check->checkImage(uri, target, options.codes, options.values);
}

void LocalManagement::deleteInstance(const core::CimPath& path) {
    operations().deleteInstance(path);
}

std::vector<core::ClassDeclaration> LocalManagement::classes() {
    std::vector<core::ClassDeclaration> declarations;
    for (const core::ClassChain& chain : operations().enumerateClasses("", true))
        declarations.push_back(*chain.front());
    return declarations;
}

}  // namespace cli
