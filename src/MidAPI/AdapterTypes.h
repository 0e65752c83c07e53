// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "Utils/Exception.h"
#include "Utils/Export.h"
#include "Utils/FirmwareTypes.h"

namespace ma {

/// The boot protocol that an adapter port starts with.
enum class BootType : std::uint32_t {
    None = 0,  ///< the adapter's default: no boot protocol is preferred
    PXE = 1,
    iSCSI = 2,
    FCoE = 3,
    UEFI = 4,
};

/// What prepareFlashImage() answers. Callers take every value above 6 like 0.
enum PrepareStatus : int {
    Prepared = 0,           ///< the output buffer holds the image to write
    InvalidParameter = 1,   ///< no such adapter, a file that is empty or too large, or no intact image
    ImageNotSupported = 2,  ///< made for another card, or the adapter cannot be updated at all
    ImageIsOlder = 3,       ///< older than what is installed; the output is filled all the same
    ImageTypesDiffer = 4,   ///< other image types than the adapter carries; the output is filled all the same
    ImageNotApplicable = 5,  ///< a requested type is not in the file, or is no component that the driver
                             ///< takes; or nothing in it can be installed
    UnspecifiedError = 6,    ///< the adapter could not be read, is being written to, or may not be written to
};

/// What can be said of an image file before it is written.
struct ImageVerdict {
    PrepareStatus status = PrepareStatus::Prepared;  ///< what prepareFlashImage() answers
    std::string reason = {};  ///< a sentence for people; empty for PrepareStatus::Prepared
    /// What is left to the adapter, which judges the file in the write; each the rest of a sentence that
    /// begins with "It could not be checked".
    std::vector<std::string> unchecked = {};
    /// The file names the cards that it is for, and this is one of them.
    bool isForCard = false;
    /// A version of what the file brings, beside that in the flash.
    struct Version {
        std::string name;     ///< as the driver calls it: "fw.mgmt"
        std::string inFlash;  ///< in force already, or after a reset
        std::string inFile;

        bool operator==(const Version&) const = default;
    };
    /// Versions of all that the file brings; none where the driver or the file does not tell them all.
    std::vector<Version> versions = {};
};

/// Error codes that writeFlashImage() and updateCapabilityWord() leave behind. A simulated fault may leave
/// any; other failures of the system or a driver leave their errno value, where that is above these.
enum WriteError : std::uint32_t {
    NoError = 0,
    UnknownAdapter = 1,
    BadImage = 2,
    NotUpdatable = 3,
    Busy = 5,          ///< another process or thread writes to this adapter; the text says which
    DeviceFailed = 6,  ///< the device, or the files that stand for it, failed; the text says why
};

/// Vendor and device of a PCI function, and of its subsystem.
struct PciIds {
    std::uint16_t vendor = 0;
    std::uint16_t device = 0;
    std::uint16_t subsystemVendor = 0;
    std::uint16_t subsystemDevice = 0;
};

/// A version as the adapter's driver tells it, under the driver's own name: "fw.mgmt". The texts are free;
/// one that the driver does not tell is empty.
struct NamedVersion {
    std::string name;
    std::string fixed = {};         ///< of the board itself: never changes
    std::string running = {};       ///< in force now
    std::string stored = {};        ///< in the flash, in force after the reset that ResetNeeded names
    utils::FirmwareType type = {};  ///< the image type that it is the version of, if there is one

    /// What was written waits for a reset.
    bool isPending() const { return !running.empty() && !stored.empty() && running != stored; }

    bool operator==(const NamedVersion&) const = default;
};

/// What it takes until the firmware in the flash is the one that runs.
enum class ResetNeeded {
    None,        ///< it runs already
    Reload,      ///< the driver can activate it while the machine runs
    Reboot,      ///< the machine has to start anew
    PowerCycle,  ///< the machine has to be without power for a moment
    Unknown,     ///< the adapter does not tell
};

/// What AdapterInfo::backend is of adapters that are files, and of the machine's own.
inline constexpr const char* kSimulatorBackend = "simulator";
inline constexpr const char* kDevlinkBackend = "devlink";

/// What is known of an adapter port beside its firmware update. What a backend cannot tell stays as it is
/// here.
struct AdapterInfo {
    std::array<std::uint8_t, 6> permanentMac{};
    std::uint64_t speed = 0;  ///< bits per second, 0 when unknown
    bool linkUp = false;
    PciIds ids = {};
    std::vector<utils::FirmwareVersionInfo> components = {};  ///< in ascending order of type
    std::string description = {};
    std::string backend = {};                 ///< the name of the one that reaches it: "simulator", "devlink"
    std::string driver = {};                  ///< the kernel's
    std::string serialNumber = {};            ///< of the device
    std::string boardSerialNumber = {};       ///< of the board that carries it
    std::vector<NamedVersion> versions = {};  ///< in the driver's order, each name once
    ResetNeeded resetNeeded = ResetNeeded::None;
    std::vector<std::string> interfaces = {};  ///< the network interfaces that run over the port
    /// Who is writing to its card, for a person: "process 812 (quenxctl)"; empty where nobody is, as far as
    /// one can tell.
    std::string writer = {};
};

/// Which adapters are wanted. What is left open here, the environment may say; see ma::selectBackend().
struct BackendChoice {
    std::optional<std::string> backend = {};      ///< a backend's name, or "auto"
    std::optional<std::string> description = {};  ///< the file that describes simulated adapters
    std::optional<std::string> state = {};        ///< the folder in which those keep their flash
};

/// What an operation throws that has no other way to report a failure. The text is a whole sentence for
/// people; at most 511 characters are kept.
class QUENX_EXPORT AdapterError : public utils::Exception {
  public:
    explicit AdapterError(const std::string& text);
    ~AdapterError() override;
};

}  // namespace ma
