// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Cli/Adapters.h"
#include "Cli/Failure.h"
#include "MidAPI/Image/OptionRom.h"

namespace cli {

/// An image file as the program itself reads it, to explain what the service answers.
struct FirmwareImage {
    std::string path;
    /// Why the file is not an intact image; nothing when it is one.
    std::optional<Explanation> problem;
    std::uint64_t bytes = 0;
    ma::RomFile rom;

    bool isIntact() const { return !problem; }
};

/// Reads the file. Never waits: only a regular file is opened. Never throws on account of the file.
FirmwareImage readFirmwareImage(const std::string& path);

/// What an intact image would mean for an adapter.
struct Comparison {
    std::vector<Component>
        chosen;  ///< of the file's components, those that are asked for; all without a choice
    std::vector<std::string> missing;  ///< types that are asked for and not in the file
    std::uint64_t bytes = 0;           ///< size of the chosen images
    std::string foreignIds;  ///< the first ids in the file that are not the adapter's; empty for none
    bool isNetwork = true;   ///< false when an image is for something else (a VGA ROM)
    bool current = false;    ///< each chosen component is installed in the same version
};

Comparison compareImage(const FirmwareImage& image, const Adapter& adapter,
                        const std::vector<std::string>& types);

}  // namespace cli
