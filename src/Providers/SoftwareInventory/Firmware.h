// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "MidAPI/Image/OptionRom.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Providers/SoftwareInventory/Devices.h"
#include "Utils/Os/Linux/Mutex.h"

namespace inventory {

/// A part of a firmware: an image of one type, or what a driver has a version of.
struct FirmwareComponent {
    std::string type = {};  ///< "IMG_PXE"; empty for what is of no type
    std::uint32_t version = 0;
    std::string name = {};  ///< by which the driver tells the version; empty for an image
    std::string text = {};  ///< the version as the driver tells it; empty for an image

    /// What stands for it in texts.
    const std::string& label() const { return type.empty() ? name : type; }
    std::string versionText() const { return text.empty() ? std::to_string(version) : text; }

    bool operator==(const FirmwareComponent&) const = default;
};

/// What a software identity says, wherever the firmware is.
struct Firmware {
    std::string identifier;
    SoftwareIdentity::TypeCode typeCode = SoftwareIdentity::FirmwareImage;
    std::string adapter;                        ///< on which it is installed; empty for a file
    std::string backend = {};                   ///< that reaches the adapter
    std::string ids;                            ///< vendor and device, as "1af4:1041"
    std::vector<FirmwareComponent> components;  ///< in ascending order of type
    std::string manufacturer = {};              ///< empty when the image names none
    std::string product = {};                   ///< likewise
    /// What it waits for, having been written to the adapter; nothing for what runs, and for a file.
    std::optional<ma::ResetNeeded> waitsFor = {};

    bool operator==(const Firmware&) const = default;
};

/// The firmware in a file of intact ROM images. Its identifier is made of the ids and the content, so that a
/// copy of the file, or the file under another name, is the same firmware.
Firmware describeImage(std::span<const std::uint8_t> file, const ma::RomFile& rom);

/// What is installed on the ports, one firmware for each component, so that each has its own version, and
/// behind it, where another version waits for a reset, that one. A port that does not answer has none.
std::vector<Firmware> readInstalled(const std::vector<Port>& ports);

/// A file of intact ROM images, and what is in it.
struct FirmwareFile {
    std::string path;
    Firmware firmware;

    bool operator==(const FirmwareFile&) const = default;
};

/// The option-ROM files in the configured firmware directories. A file is read once and again only when it
/// has changed; one that is broken is left out, with one log line when that is found out. So is one that
/// cannot be read, which is tried again at each look. Thread-safe.
class FirmwareCatalog {
  public:
    using Files = std::vector<std::shared_ptr<const FirmwareFile>>;

    /// The files that there are now, directory by directory in the configured order, by name in each.
    Files scan();

  private:
    /// What changes with a file's content or with the right to read it. All zero for a file that is not
    /// there.
    struct Stamp {
        std::uint64_t device = 0;
        std::uint64_t inode = 0;
        std::int64_t size = 0;
        std::int64_t modified = 0;  ///< nanoseconds, as is the next
        std::int64_t changed = 0;

        bool operator==(const Stamp&) const = default;
    };
    struct Entry {
        Stamp stamp;
        std::shared_ptr<const FirmwareFile> file = nullptr;  ///< null for one that is left out
        bool isUnread = false;                               ///< what is in it is not known yet

        /// Whether the file has to be read for this stamp.
        bool isOutdated(const Stamp& now) const { return isUnread || stamp != now; }
    };
    using Entries = std::map<std::string, Entry>;

    /// Takes the file's stamp. False for a directory, a device and the like.
    static bool takeStamp(const std::string& path, Stamp& stamp);
    /// @param before  what was known of the file; null when it is new
    static Entry read(const std::string& path, const Stamp& stamp, const Entry* before);

    utils::Mutex m_mutex;
    Entries m_known QUENX_GUARDED_BY(m_mutex);
};

}  // namespace inventory
