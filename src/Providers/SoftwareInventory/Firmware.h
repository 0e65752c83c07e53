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
#include "Utils/Os/Linux/FolderWatch.h"
#include "Utils/Os/Linux/Mutex.h"
#include "Utils/StringArray.h"

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

/// What the configured firmware directories hold. Never changes.
struct FirmwareContent {
    std::vector<FirmwareFile> files;   ///< directory by directory in the configured order, by name in each
    std::vector<Firmware> firmware{};  ///< each that is in them, in the order of its first file

    bool operator==(const FirmwareContent&) const = default;
};

/// The option-ROM files in the configured firmware directories. A file is read once and again only when it
/// has changed; one that is broken is left out, with one log line when that is found out. So is one that
/// cannot be read, which is tried again at each look. Files are looked at one by one only when something has
/// happened in their directories, or where the system would not tell. Thread-safe.
class FirmwareCatalog {
  public:
    /// What there is now: the object of the last time while that is the same. Never null.
    std::shared_ptr<const FirmwareContent> scan();

  private:
    struct Entry {
        os::FileState state;
        std::shared_ptr<const FirmwareFile> file = nullptr;  ///< null for one that is left out
        bool isUnread = false;                               ///< what is in it is not known yet

        /// Whether the file has to be read in this state.
        bool isOutdated(const os::FileState& now) const { return isUnread || state != now; }
    };
    using Entries = std::map<std::string, Entry>;

    /// @param before  what was known of the file; null when it is new
    static Entry read(const std::string& path, const os::FileState& state, const Entry* before);

    bool isCurrent(const utils::StringArray& directories) const QUENX_REQUIRES(m_mutex);
    Entry lookAt(const std::string& path) const QUENX_REQUIRES(m_mutex);

    utils::Mutex m_mutex;
    os::FolderWatch m_watch QUENX_GUARDED_BY(m_mutex);
    Entries m_known QUENX_GUARDED_BY(m_mutex);
    std::vector<std::string> m_unwatched QUENX_GUARDED_BY(m_mutex);  ///< those of which m_watch tells nothing
    /// Null before the first scan, and after one that failed.
    std::shared_ptr<const FirmwareContent> m_content QUENX_GUARDED_BY(m_mutex);
};

}  // namespace inventory
