#include "Providers/SoftwareInventory/FirmwareCatalog.h"

#include <sys/stat.h>

#include "MidAPI/Image/OptionRom.h"
#include "MidAPI/Image/RomFormat.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Os/Linux/linux.h"

namespace inventory {

namespace {

/// Larger than any chain of images of one card; keeps a stray disk image out of memory.
constexpr std::int64_t MAX_FILE_SIZE = 256LL * 1024 * 1024;

std::int64_t nanoseconds(const timespec& time) {
    return static_cast<std::int64_t>(time.tv_sec) * 1'000'000'000 + time.tv_nsec;
}

bool hasSignature(std::span<const std::uint8_t> bytes) {
    return bytes[0] == (ma::rom::kSignature & 0xff) && bytes[1] == ma::rom::kSignature >> 8;
}

/// The bytes of a file that begins as a ROM does; otherwise nothing, and the reason.
std::vector<std::uint8_t> readRom(const std::string& path, std::int64_t size, std::string& problem) {
    std::vector<std::uint8_t> bytes(2);
    if (size > MAX_FILE_SIZE) {
        problem = "it is too large for an option ROM";
    } else if (os::readFile(path, bytes) != bytes.size()) {
        problem = "it is empty or cannot be read";
    } else if (!hasSignature(bytes)) {
        problem = "it is no option ROM";
    } else {
        bytes.resize(static_cast<std::size_t>(size));
        if (os::readFile(path, bytes) == bytes.size()) return bytes;
        problem = "it cannot be read to its end";
    }
    return {};
}

}  // namespace

bool FirmwareCatalog::lookAt(const std::string& path, Stamp& stamp) {
    struct stat info {};
    if (::stat(path.c_str(), &info) != 0) return true;
    if (!S_ISREG(info.st_mode)) return false;
    stamp = {info.st_dev, info.st_ino, info.st_size, nanoseconds(info.st_mtim), nanoseconds(info.st_ctim)};
    return true;
}

std::shared_ptr<const FirmwareFile> FirmwareCatalog::read(const std::string& path, std::int64_t size) {
    QUENX_DEBUG("Reading firmware file '%s'", path.c_str());
    std::string problem;
    const std::vector<std::uint8_t> bytes = readRom(path, size, problem);
    if (problem.empty()) {
        const ma::RomFile rom = ma::parseOptionRom(bytes);
        if (!rom.error) return std::make_shared<FirmwareFile>(FirmwareFile{path, describeImage(bytes, rom)});
        problem = *rom.error;
    }
    QUENX_ERROR("Firmware file '%s' is skipped: %s", path.c_str(), problem.c_str());
    return nullptr;
}

FirmwareCatalog::Files FirmwareCatalog::scan() {
    const utils::StringArray directories = utils::SMASHv2Config::getInstance()->getFirmwareFilesPaths();
    const utils::Mutex::AutoLocker lock(m_mutex);
    Files files;
    Entries found;
    for (const std::string& directory : directories) {
        for (const std::string& name : os::listDirectory(directory)) {
            const std::string path = directory + "/" + name;
            Stamp stamp;
            if (found.contains(path) || !lookAt(path, stamp)) continue;
            const auto old = m_known.find(path);
            const bool isKnown = old != m_known.end() && old->second.stamp == stamp;
            const Entry& entry = found[path] = {stamp, isKnown ? old->second.file : read(path, stamp.size)};
            if (entry.file != nullptr) files.push_back(entry.file);
        }
    }
    m_known = std::move(found);
    return files;
}

}  // namespace inventory
