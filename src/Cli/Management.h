// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Framework/Requests/CimRequests.h"

namespace cli {

/// What InstallFromURI takes as InstallOptions and InstallOptionsValues.
struct InstallOptions {
    std::vector<std::uint16_t> codes;
    std::vector<std::string> values;
};

/// The way to the management model: in this process, or over the wire. Errors of the model are
/// core::CimError; errors of the way itself are Failure. Used from one thread.
class Management {
  public:
    Management() = default;
    Management(const Management&) = delete;
    Management& operator=(const Management&) = delete;
    virtual ~Management() = default;

    virtual std::vector<core::InstanceValue> enumerateInstances(const std::string& className) = 0;
    virtual std::vector<core::CimPath> enumerateInstanceNames(const std::string& className) = 0;
    virtual core::InstanceValue getInstance(const core::CimPath& path) = 0;
    virtual std::vector<core::InstanceValue> associators(const core::CimPath& path,
                                                         const core::AssociationFilter& by) = 0;
    virtual std::vector<core::CimPath> associatorNames(const core::CimPath& path,
                                                       const core::AssociationFilter& by) = 0;
    virtual core::MethodResult invokeMethod(const core::CimPath& path, const std::string& method,
                                            const std::vector<core::Argument>& arguments) = 0;
    /// Has the service verify an image as InstallFromURI does; nothing is installed and no adapter is held.
    /// Returns what the method would, 0 for an image that could be installed. Only a service in this process
    /// can do that: a server answers nothing.
    virtual std::optional<std::uint32_t> checkImage(const core::CimPath& /*service*/,
                                                    const std::string& /*uri*/,
                                                    const core::CimPath& /*target*/,
                                                    const InstallOptions& /*options*/) {
        return std::nullopt;
    }
    virtual void deleteInstance(const core::CimPath& path) = 0;

    /// Every class that is served and every superclass of one, in no particular order.
    virtual std::vector<core::ClassDeclaration> classes() = 0;

    /// True when jobs run in this process, so end with it.
    virtual bool runsJobs() const = 0;

    /// True when a path means the same file to this program as to the service.
    virtual bool sharesFiles() const = 0;
};

}  // namespace cli
