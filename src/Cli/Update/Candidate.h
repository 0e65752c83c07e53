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
    bool current = false;    ///< each chosen component is in the flash in the same version
};

/// The image and the adapter of an update or a check, as the user names them.
struct UpdateOptions {
    std::string target;
    std::string image;               ///< a path or a URI; empty with an identity
    std::string identity;            ///< empty with an image
    std::vector<std::string> types;  ///< image types to install; none means all. Not with an identity
    bool force = false;              ///< also what is older
    bool upload = false;             ///< the image is a file here, and sent to the server first
};

/// Which adapters get which image, where nobody names a single one.
struct ManyOptions {
    bool isAll = false;
    std::string match = {};                ///< a shell's pattern of names or PCI addresses; empty for none
    bool isFit = false;                    ///< only where the image is made for the adapter
    std::vector<std::string> images = {};  ///< several only with isFit; none with an identity
    bool keepsGoing = false;               ///< after a failure
    bool isDryRun = false;
    bool isConfirmed = false;  ///< adapters that are hardware may be written to
    bool follows = false;      ///< an update that runs already is waited for

    bool isAsked() const { return isAll || isFit || !match.empty(); }
};

/// An image and the adapter that it is meant for, with what the program read of both by itself.
struct Candidate {
    Adapter adapter;
    std::string uri;
    core::CimPath identity = {};          ///< names nothing when the image was named by its file
    std::vector<std::string> types = {};  ///< asked for; none means all that the image has
    bool force = false;                   ///< the service is told to install what is older, too
    std::string localFile = {};           ///< the image here, for one that is sent to the server; else empty
    std::optional<ImageFile> image = {};  ///< only when the URI names a file that this program sees, too
    std::optional<Comparison> comparison = {};  ///< only with an intact image
    /// What the adapter's backend says of the file, where the backend alone knows its format.
    std::optional<ma::ImageVerdict> verdict = {};

    /// What an image means for the adapter, as far as this program can tell.
    enum class Answer { No, Yes, Unknown };
    /// Whether it was made for the adapter, and can be installed there at all.
    Answer fits() const;
    /// Whether all that it would install is in the flash already. No, too, for one that the service is to
    /// refuse.
    Answer isInFlash() const;
    /// True when installing would change nothing, as far as versions tell.
    bool isAlreadyCurrent() const { return isInFlash() == Answer::Yes; }
    /// What the image has, of which the adapter has other versions or the same: "IMG_PXE 2", "fw 1.3.0".
    std::vector<Component> brought() const;
};

/// Finds adapter and image, and compares them when the image is a file that this program can read. Throws
/// CommandError for an adapter, identity or image type that there is not.
Candidate makeCandidate(const Connection& connection, const UpdateOptions& options);
/// The same for an adapter that was found already; the target that the options name does not matter.
Candidate makeCandidate(const Connection& connection, Adapter adapter, const UpdateOptions& options);
Candidate makeCandidate(const Connection& connection, Adapter adapter, const InventoryItem& image,
                        bool force);

}  // namespace cli
