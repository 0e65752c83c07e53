// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/Image/OptionRom.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"

/// Making and changing expansion ROM files. Free of state; may be called from any thread.
namespace ma {

/// Writes whole images (see imageBytes()) one behind the other as a valid chain: only the last one has the
/// last-image bit, and where that changed a code type 0 image its checksum is corrected.
/// @param images  each the bytes of one image of a file that parseOptionRom() accepted; at least one
/// @param output  at least as long as all images together; may not overlap them
/// @return the length of the chain in bytes
QUENX_EXPORT std::size_t composeOptionRom(std::span<const std::span<const std::uint8_t>> images,
                                          std::span<std::uint8_t> output);

/// What a flash holds after an update: `base` with its images of the types that `update` has replaced by
/// those of `update`, in their place, and the other images of `update` appended. Both are chains that
/// parseOptionRom() accepts; either may be empty.
QUENX_EXPORT std::vector<std::uint8_t> mergeOptionRoms(std::span<const std::uint8_t> base,
                                                       std::span<const std::uint8_t> update);

/// Changes the code revision of one image of a parsed file, and corrects its checksum.
QUENX_EXPORT void setCodeRevision(std::span<std::uint8_t> file, const RomImage& image,
                                  std::uint16_t revision);

/// What a made image shall be.
struct NewRomImage {
    utils::FirmwareType type{};  ///< PXE, iSCSI, FCoE or UEFI; CLP gives a PXE image with a CLP entry point
    std::uint16_t vendorId = 0;
    std::uint16_t deviceId = 0;
    std::vector<std::uint16_t> furtherDeviceIds;  ///< at most 64
    std::uint16_t codeRevision = 0;
    bool clp = false;             ///< code type 0 only: give it a CLP entry point
    std::uint32_t length = 1024;  ///< bytes; rounded up to a multiple of 512, at least 512
    std::uint32_t classCode = rom::kEthernetClass;
};

/// An image with a correct header and checksum whose code does nothing (it returns at once): the flash of a
/// simulated adapter, or a test's input. It is the only image of its chain.
QUENX_EXPORT std::vector<std::uint8_t> makeRomImage(const NewRomImage& wanted);

}  // namespace ma
