#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <vector>

#include "Utils/FirmwareTypes.h"

namespace ma {

/// The boot protocol that an adapter port starts with.
enum class BootType : uint32_t {
    None = 0,  ///< the adapter's default: no boot protocol is preferred
    PXE = 1,
    iSCSI = 2,
    FCoE = 3,
    UEFI = 4,
};

/// What prepareFlashImage() answers. Callers take every value above 6 like 0.
enum PrepareStatus : int {
    PREPARED = 0,             ///< the output buffer holds the image to write
    INVALID_PARAMETER = 1,    ///< no such adapter, an empty file, or a file that is no intact ROM image
    IMAGE_NOT_SUPPORTED = 2,  ///< made for another card, or the adapter cannot be updated at all
    IMAGE_IS_OLDER = 3,       ///< older than what is installed, same types; the output is filled all the same
    IMAGE_TYPES_DIFFER =
        4,  ///< other image types than the adapter carries; the output is filled all the same
    IMAGE_NOT_APPLICABLE = 5,  ///< a requested type is not in the file, or nothing in it can be installed
    UNSPECIFIED_ERROR = 6,     ///< the adapter itself could not be read
};

/// Error codes that writeFlashImage() and updateCapabilityWord() leave behind; a backend or an ordered fault
/// may leave others.
enum WriteError : uint32_t {
    NO_ERROR = 0,
    ERROR_UNKNOWN_ADAPTER = 1,
    ERROR_BAD_IMAGE = 2,
    ERROR_NOT_UPDATABLE = 3,
    ERROR_BUSY = 5,    ///< another process or thread writes to this adapter; the text says which
    ERROR_DEVICE = 6,  ///< the device, or the files that stand for it, failed; the text says why
};

/// Vendor and device of a PCI function, and of its subsystem.
struct PciIds {
    uint16_t vendor = 0;
    uint16_t device = 0;
    uint16_t subsystemVendor = 0;
    uint16_t subsystemDevice = 0;
};

/// What is known of an adapter port beside its firmware update.
struct AdapterInfo {
    std::array<uint8_t, 6> permanentMac{};
    uint64_t speed = 0;  ///< bits per second, 0 when unknown
    bool linkUp = false;
    PciIds ids;
    std::vector<utils::FirmwareVersionInfo> components;  ///< in ascending order of type
    std::string description;
};

}  // namespace ma
