// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Cli/Display/Messages.h"
#include "Cli/Update/Adapters.h"
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

/// Reads the file. Never waits: only a regular file is opened. Never throws on account of the file.
ImageFile readImage(const std::string& path);

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

/// @param types  those asked for; none means all
Comparison compare(const ma::RomFile& rom, const Adapter& adapter, const std::vector<std::string>& types);

}  // namespace cli
