// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Cli/Management.h"

namespace cli {

/// A software identity of the inventory: an image that can be installed, or a component that is installed.
struct Identity {
    core::CimPath path;
    std::string id;  ///< its InstanceID
    std::string description;
    std::string version;
    std::vector<std::string> types;
    std::vector<std::string> uris;  ///< where its file is, and copies of it; none for an installed component

    bool isInstallable() const { return !uris.empty(); }
    /// Of several files with the same content, the one that the service takes.
    std::string uri() const { return uris.empty() ? std::string() : uris.back(); }
};

/// All identities, each with the URI that its resource serves.
std::vector<Identity> readIdentities(Management& management);

/// The installable one with this id, or whose file has this path or URI. Throws Failure that says what there
/// is.
Identity findIdentity(Management& management, const std::string& id);
Identity findIdentityOfFile(Management& management, const std::string& file);

}  // namespace cli
