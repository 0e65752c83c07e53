// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Framework/Requests/ImageVerifier.h"

namespace trust {

/// The devices that an image is for.
struct DeviceIds {
    std::uint16_t vendor = 0;
    std::uint16_t device = 0;
    std::optional<std::array<std::uint16_t, 2>> subsystem;  ///< its vendor and device; nothing for any
};

/// A type of image, or a version of a driver, and a version of it.
using NamedText = std::pair<std::string, std::string>;

/// What a signed manifest says of one image. The keys of the file have these names, in TOML:
///
///     name = "port.rom"
///     size = 65536
///     sha256 = "64 hexadecimal digits in lower case"
///     pci_ids = ["1af4:1041", "1af4:1041:1af4:1100"]
///     versions = { IMG_PXE = "2.1" }          # may be left out
///     lowest_versions = { IMG_PXE = "2.0" }   # may be left out
struct Manifest {
    std::string name;        ///< of the file, without folders
    std::uint64_t size = 0;  ///< bytes
    std::string sha256;
    std::vector<DeviceIds> devices;
    std::vector<NamedText> versions;
    std::vector<NamedText> lowest;  ///< that may be installed from now on, of this image or another
};

/// @param path  for the texts
/// @throws Refusal  ManifestBad, which names the line
Manifest parseManifest(std::string_view text, const std::string& path);

/// @throws Refusal  ManifestForOtherImage, ManifestDiffers, ManifestForOtherDevice for a manifest that is not
///                  of this image, or not for this adapter, also where the adapter's ids are not known
void requireManifestFor(const Manifest& manifest, const core::ImageToVerify& image, const std::string& path);

/// Whether the manifest is for an adapter with these ids; no for one that does not tell them.
bool isForDevice(const Manifest& manifest, const core::ImageToVerify& image);

}  // namespace trust
