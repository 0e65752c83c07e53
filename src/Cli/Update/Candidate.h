// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Cli/Update/Inventory.h"
#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Image/OptionRom.h"

namespace cli {

/// An image as a user names it, made a URI: a text with a scheme ("file:///x", "http://x") stays as it is,
/// all else is the path of a file, relative to the working directory, and becomes a file URI. Nothing is
/// percent-encoded: the service does not decode.
std::string imageUri(const std::string& image);

/// The path in a file URI; nothing for any other scheme.
std::optional<std::string> localPath(std::string_view uri);

/// The scheme of a URI in lower case; empty when there is none.
std::string uriScheme(std::string_view uri);

/// An image file as the program itself reads it, to explain what the service answers.
struct ImageFile {
    std::string path;
    /// Why the file is not an intact image; nothing when it is one.
    std::optional<Explanation> problem;
    ma::RomFile rom;
};

/// What an intact image would mean for an adapter.
struct Comparison {
    /// Of the file's components, those that are asked for; all without a choice.
    std::vector<Component> chosen;
    std::vector<std::string> missing;  ///< types that are asked for and not in the file
    std::uint64_t bytes = 0;           ///< size of the chosen images
    std::string foreignIds;  ///< the first ids in the file that are not the adapter's; empty for none
    bool isNetwork = true;   ///< false when an image is for something else (a VGA ROM)
    bool current = false;    ///< each chosen component is installed in the same version
};

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
    core::CimPath identity = {};          ///< names nothing when the image was named by its file
    std::vector<std::string> types = {};  ///< asked for; none means all that the image has
    bool force = false;                   ///< the service is told to install what is older, too
    std::optional<ImageFile> image = {};  ///< only when the URI names a file that this program sees, too
    std::optional<Comparison> comparison = {};  ///< only with an intact image
    /// What the adapter's backend says of the file, where the backend alone knows its format.
    std::optional<ma::ImageVerdict> verdict = {};

    /// True when installing would change nothing, as far as versions tell.
    bool isAlreadyCurrent() const;
};

/// Finds adapter and image, and compares them when the image is a file that this program can read. Throws
/// CommandError for an adapter, identity or image type that there is not.
Candidate makeCandidate(const Connection& connection, const UpdateOptions& options);
Candidate makeCandidate(const Connection& connection, Adapter adapter, const InventoryItem& image,
                        bool force);

}  // namespace cli
