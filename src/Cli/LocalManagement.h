// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>

#include "Cli/Management.h"
#include "Framework/Requests/ProviderSession.h"

namespace cli {

/// What a local session is told; an empty text leaves the choice to the system.
struct LocalSettings {
    std::string configFile;          ///< the providers' configuration file
    std::string adapterDescription;  ///< description of simulated adapters
    std::string stateDirectory;      ///< where those keep their flash; only with a description
    std::string providerDirectory;   ///< where the provider libraries are
};

/// The providers loaded into this process, as a host does. Leaving waits for the updates that have begun.
class LocalManagement : public Management {
  public:
    /// Throws Failure when a file or library cannot be had, naming it.
    explicit LocalManagement(const LocalSettings& settings);

    std::vector<core::InstanceValue> enumerateInstances(const std::string& className) override;
    std::vector<core::CimPath> enumerateInstanceNames(const std::string& className) override;
    core::InstanceValue getInstance(const core::CimPath& path) override;
    std::vector<core::InstanceValue> associators(const core::CimPath& path,
                                                 const core::AssociationFilter& by) override;
    std::vector<core::CimPath> associatorNames(const core::CimPath& path,
                                               const core::AssociationFilter& by) override;
    core::MethodResult invokeMethod(const core::CimPath& path, const std::string& method,
                                    const std::vector<core::Argument>& arguments) override;
    std::optional<std::uint32_t> checkImage(const core::CimPath& service, const std::string& uri,
                                            const core::CimPath& target,
                                            const InstallOptions& options) override;
    void deleteInstance(const core::CimPath& path) override;
    std::vector<core::ClassDeclaration> classes() override;
    bool runsJobs() const override { return true; }
    bool sharesFiles() const override { return true; }

  private:
    core::CimOperations& operations() { return *m_session->operations(); }

    std::optional<core::ProviderSession>
        m_session;  ///< from the time when its files are known to be readable
};

/// Where the simulated adapters of a description keep their flash unless told otherwise: the directory that
/// QUENX_ADAPTER_STATE names, else one beside the description ("adapters.toml" has "adapters.state").
std::string defaultStateDirectory(const std::string& adapterDescription);

}  // namespace cli
