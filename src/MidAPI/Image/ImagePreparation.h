// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Image/OptionRom.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"

namespace ma {

/// The adapter port that an image is held against.
struct PreparationTarget {
    std::uint16_t vendorId = 0;
    std::uint16_t deviceId = 0;
    bool canBeUpdated = true;
    std::vector<utils::FirmwareVersionInfo> components;  ///< what it carries, one per type
};

/// The verdict on an image file.
struct Preparation {
    PrepareStatus status = PrepareStatus::Prepared;
    std::string reason = {};  ///< a sentence for people; empty for PrepareStatus::Prepared
    /// The images to write; filled for PrepareStatus::Prepared and the two that force allows.
    std::vector<RomImage> chosen = {};
    /// Of those, ascending.
    std::vector<utils::FirmwareType> types = {};
};

/// Holds an image file against an adapter, without writing anything: which images of `requested` types (type
/// 0 ignored; none stands for all) would be written, and what speaks against it. The order of the tests is
/// the order of the table in README.md. Free of state; never reads outside `file`.
QUENX_EXPORT Preparation assessImage(const PreparationTarget& target, std::span<const std::uint8_t> file,
                                     const std::vector<utils::FirmwareType>& requested);

/// The images that are written for `requested` types (as above): each whole, also when it carries a type
/// besides.
QUENX_EXPORT RomFile chooseImages(const RomFile& rom, std::vector<utils::FirmwareType> requested);

/// True when the output of the preparation is an image that may be written.
QUENX_EXPORT bool hasOutput(PrepareStatus status);

/// The types, ascending, each once, without type 0: callers pass what clients wrote.
QUENX_EXPORT std::vector<utils::FirmwareType> distinctTypes(std::vector<utils::FirmwareType> types);

/// Writes the chosen images as one chain; `output` is at least as long as the file. Returns the chain's
/// length.
QUENX_EXPORT std::size_t composeChosen(const Preparation& preparation, std::span<const std::uint8_t> file,
                                       std::span<std::uint8_t> output);

}  // namespace ma
