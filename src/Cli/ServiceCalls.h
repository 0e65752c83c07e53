// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Cli/Management.h"

namespace cli {

/// What an update asks of the service beside the image.
struct InstallChoice {
    std::vector<std::string> types;  ///< image types to install; none means all. Not with an identity.
    bool force = false;              ///< also what is older
};

/// The one software installation service. Throws Failure when none is served.
core::CimPath findService(Management& management);

/// Calls InstallFromURI; returns what it answered.
core::MethodResult installFromUri(Management& management, const std::string& uri, const core::CimPath& target,
                                  const InstallChoice& choice);
/// Calls InstallFromSoftwareIdentity; the identity itself says the types.
core::MethodResult installFromIdentity(Management& management, const core::CimPath& identity,
                                       const core::CimPath& target, bool force);
/// Verifies as InstallFromURI does, without installing. Nothing on a server, whose service has no such
/// method.
std::optional<std::uint32_t> checkUri(Management& management, const std::string& uri,
                                      const core::CimPath& target, const InstallChoice& choice);
/// Calls CheckSoftwareIdentity.
core::MethodResult checkIdentity(Management& management, const core::CimPath& identity,
                                 const core::CimPath& target);

/// The job among a method's outputs. Throws Failure when there is none.
core::CimPath jobOf(const core::MethodResult& result);

/// Throws Failure for an image type that the service does not know. Any will do where it does not say.
void requireKnownTypes(Management& management, const std::vector<std::string>& types);

}  // namespace cli
