// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/Image/RomFormat.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"

/// Reading, making and changing PCI expansion ROM files (PCI Firmware Specification 3.x): a chain of images,
/// each a multiple of 512 bytes long, one behind the other until one has the last-image bit. Everything here
/// is free of state; the functions may be called from any thread.
namespace ma {

/// One image of a chain, as its header and its PCI data structure describe it.
struct QUENX_EXPORT RomImage {
    std::uint32_t offset = 0;         ///< from the start of the file, bytes
    std::uint32_t length = 0;         ///< bytes, a multiple of 512
    std::uint32_t dataStructure = 0;  ///< offset of the PCI data structure from the start of the image, bytes
    std::uint16_t vendorId = 0;
    std::uint16_t deviceId = 0;
    /// Of the same vendor; only data structures of revision 3 have them.
    std::vector<std::uint16_t> furtherDeviceIds;
    std::uint8_t codeType = 0;  ///< one of RomCodeType, or a value not known here
    std::uint16_t codeRevision = 0;
    std::uint32_t classCode = 0;  ///< 24 bits: base class, subclass, programming interface
    bool last = false;
    std::uint16_t clpEntry = 0;  ///< offset of the DMTF CLP entry point, 0 for none
    /// From the Plug and Play expansion headers; printable, at most 255 characters.
    std::string manufacturer;
    /// Likewise. If a chain of headers names several, the one that tells the type.
    std::string product;

    /// What the image boots: IMG_UEFI for code type 3; for code type 0 IMG_iSCSI or IMG_FCoE when a product
    /// name says so, otherwise IMG_PXE; type 0 for code that no port of this system runs.
    utils::FirmwareType type{};

    /// An image with a CLP entry point counts as IMG_CLP too, with the same revision and the same fate:
    /// choosing either type chooses the image.
    /// Code of no type (type 0) carries nothing, whatever it points to.
    bool isClp() const { return clpEntry != 0 && type != utils::FirmwareType{}; }
    bool isNetwork() const { return (classCode >> 16) == rom::kNetworkBaseClass; }
    /// True when the image was made for this device.
    bool fits(std::uint16_t vendor, std::uint16_t device) const;
    /// True when the image is of this type, IMG_CLP included.
    bool carries(utils::FirmwareType wanted) const;
};

/// What reading a file gave. With an error, `images` are those before the place where it is.
struct QUENX_EXPORT RomFile {
    std::vector<RomImage> images;
    std::optional<std::string> error;  ///< a sentence naming what is wrong, and at which offset of the file

    /// The components in the file, ascending by type, one per type; with several images of one type (UEFI
    /// drivers for several machines) the highest code revision counts.
    std::vector<utils::FirmwareVersionInfo> components() const;
};

/// Reads a chain. Never reads outside `file`, whatever the bytes. What follows the last image is ignored.
/// Checksums of code type 0 images are verified; more than rom::kMaxImages images are an error.
QUENX_EXPORT RomFile parseOptionRom(std::span<const std::uint8_t> file);

/// The bytes of one image of a parsed file.
QUENX_EXPORT std::span<const std::uint8_t> imageBytes(std::span<const std::uint8_t> file,
                                                      const RomImage& image);

/// "1af4:1041": ids as they are usually written.
QUENX_EXPORT std::string formatIds(std::uint16_t vendor, std::uint16_t device);

/// Name of a type as clients write it ("IMG_PXE"); empty for type 0 and for an unknown type.
QUENX_EXPORT std::string_view firmwareTypeName(utils::FirmwareType type);

/// The type of this name, case and all; nothing for an unknown name (also for the empty one).
QUENX_EXPORT std::optional<utils::FirmwareType> firmwareTypeFromName(std::string_view name);

// Making and changing.

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
