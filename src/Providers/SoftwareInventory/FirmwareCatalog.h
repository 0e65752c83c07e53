#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "Providers/SoftwareInventory/Firmware.h"
#include "Utils/Os/Linux/Mutex.h"

namespace inventory {

/// A file of intact ROM images, and what is in it.
struct FirmwareFile {
    std::string path;
    Firmware firmware;

    bool operator==(const FirmwareFile&) const = default;
};

/// The option-ROM files in the configured firmware directories. A file is read once and again only when it
/// has changed; one that is broken or cannot be read is left out, with one log line when that is found out.
/// Thread-safe.
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
        std::shared_ptr<const FirmwareFile> file;  ///< null for one that is left out
    };
    using Entries = std::map<std::string, Entry>;

    /// False for a directory, a device and the like.
    static bool lookAt(const std::string& path, Stamp& stamp);
    static std::shared_ptr<const FirmwareFile> read(const std::string& path, std::int64_t size);

    utils::Mutex m_mutex;
    Entries m_known QUENX_GUARDED_BY(m_mutex);
};

}  // namespace inventory
