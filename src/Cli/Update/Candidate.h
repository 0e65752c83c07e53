// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "Cli/Update/Adapters.h"
#include "Cli/Update/Image.h"
#include "Cli/Update/Inventory.h"

namespace cli {

/// The image and the adapter of an update or a check, as the user names them.
struct UpdateOptions {
    std::string target;
    std::string image;               ///< a path or a URI; empty with an identity
    std::string identity;            ///< empty with an image
    std::vector<std::string> types;  ///< image types to install; none means all. Not with an identity
    bool force = false;              ///< also what is older
};

/// An image and the adapter that it is meant for, with what the program read of both by itself.
struct Candidate {
    Adapter adapter;
    std::string uri;
    core::CimPath identity;                ///< names nothing when the image was named by its file
    std::vector<std::string> types;        ///< asked for; none means all that the image has
    bool force = false;                    ///< the service is told to install what is older, too
    std::optional<ImageFile> image;        ///< only when the URI names a file that this program sees, too
    std::optional<Comparison> comparison;  ///< only with an intact image

    /// True when installing would change nothing, as far as versions tell.
    bool isAlreadyCurrent() const;
};

/// Finds adapter and image, and compares them when the image is a file that this program can read. Throws
/// CommandError for an adapter, identity or image type that there is not.
Candidate makeCandidate(const Connection& connection, const UpdateOptions& options);
Candidate makeCandidate(const Connection& connection, Adapter adapter, const InventoryItem& image,
                        bool force);

}  // namespace cli
