// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "Cli/Adapters.h"
#include "Cli/FirmwareImage.h"

namespace cli {

/// An image and the adapter that it is meant for, with what the program read of both by itself.
struct Candidate {
    Adapter adapter;
    std::string uri;
    std::vector<std::string> types;        ///< asked for; none means all that the image has
    bool force = false;                    ///< the service is told to install what is older, too
    std::optional<FirmwareImage> image;    ///< only when the URI names a local file
    std::optional<Comparison> comparison;  ///< only with an intact image
};

/// Reads the file that the URI names, when it is a local one, and compares it with the adapter.
/// @param sharesFiles  false when the service's files are not this program's: then no file is read
Candidate makeCandidate(Adapter adapter, const std::string& uri, std::vector<std::string> types, bool force,
                        bool sharesFiles);

/// True when installing would change nothing, as far as versions tell.
bool isAlreadyCurrent(const Candidate& candidate);

/// "eth0 is already current: it has IMG_PXE 1."
std::string alreadyCurrentText(const Candidate& candidate);

}  // namespace cli
