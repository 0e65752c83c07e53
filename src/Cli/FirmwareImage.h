#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "Cli/Adapters.h"
#include "MidAPI/Image/OptionRom.h"

namespace cli {

/// An image file as the program itself reads it, to explain what the service answers.
struct FirmwareImage {
    std::string path;
    /// Why the file is no intact image, as a sentence without its subject ("is a directory"); empty when it
    /// is one.
    std::string problem;
    std::uint64_t bytes = 0;
    ma::RomFile rom;

    bool isIntact() const { return problem.empty(); }
};

/// Reads the file. Never waits: what is no regular file is not opened. Never throws on account of the file.
FirmwareImage readFirmwareImage(const std::string& path);

/// What an intact image would mean for an adapter.
struct Comparison {
    std::vector<Component>
        chosen;  ///< of the file's components, those that are asked for; all without a choice
    std::vector<std::string> missing;  ///< types that are asked for and not in the file
    std::uint64_t bytes = 0;           ///< size of the chosen images
    std::string foreignIds;  ///< the first ids in the file that are not the adapter's; empty for none
    bool isNetwork = true;   ///< false when an image is for no network adapter (a VGA ROM)
    bool sameTypes = false;  ///< the adapter carries each chosen type
    bool older = false;      ///< some chosen component is older than the installed one
    bool current = false;    ///< each chosen component is installed in the same version
};

Comparison compareImage(const FirmwareImage& image, const Adapter& adapter,
                        const std::vector<std::string>& types);

}  // namespace cli
