// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "Utils/Export.h"

/// Reading the header of firmware packages as DMTF DSP0267 (PLDM for Firmware Update) 1.0 to 1.2 describes
/// them: for which devices they are, and which versions they hold. Free of state; any thread may call.
namespace ma::devlink {

/// One device identification record (DSP0267 7.4): a kind of device that the package is for.
struct QUENX_EXPORT PldmDevice {
    /// Nothing where the record leaves it open: makers do so for cards of any subsystem.
    std::optional<std::uint16_t> vendor = {};
    std::optional<std::uint16_t> device = {};
    std::optional<std::uint16_t> subsystemVendor = {};
    std::optional<std::uint16_t> subsystemDevice = {};
    std::string version = {};  ///< of the whole set of its components
    /// Those of the package that are for this device, as indexes, ascending.
    std::vector<std::size_t> components = {};

    /// Whether the record says anything of PCI; others cannot be held against a card.
    bool namesPciDevice() const { return vendor && device; }
    bool fits(const PciIds& ids) const;
};

/// One image of the package (DSP0267 7.6). The maker alone knows what its identifier means.
struct PldmComponent {
    std::uint16_t identifier = 0;
    std::uint32_t offset = 0;  ///< from the start of the file, bytes
    std::uint32_t size = 0;    ///< bytes
    std::string version;
};

/// What reading a file gave. With an error nothing of it is to be trusted.
struct PldmPackage {
    std::vector<PldmDevice> devices;
    std::vector<PldmComponent> components;
    std::optional<std::string> error;  ///< a text naming what is wrong, and at which offset of the file
};

/// How a file begins.
enum class PackageFormat {
    Unknown,  ///< as no package of DSP0267 does
    Known,    ///< as one that readPldmPackage() reads
    Newer,    ///< as one of a later revision of the format, with fields that are not known here
};
QUENX_EXPORT PackageFormat packageFormat(std::span<const std::uint8_t> file);

/// Reads the header of a file of PackageFormat::Known; never reads outside it, whatever the bytes. The
/// checksum of the header must be right, and all images must lie within the file. Texts come out printable.
QUENX_EXPORT PldmPackage readPldmPackage(std::span<const std::uint8_t> file);

}  // namespace ma::devlink
