// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Firmware.h"

#include <sys/stat.h>

#include <algorithm>
#include <cinttypes>

#include "MidAPI/Image/RomFormat.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/SMASHv2Config.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace inventory {

namespace {

/// 64-bit FNV-1a: tells files apart that are kept side by side, but does not protect against a forger.
std::uint64_t hashOf(std::span<const std::uint8_t> bytes) {
    std::uint64_t hash = 0xcbf29ce484222325ULL;
    for (const std::uint8_t byte : bytes)
        hash = (hash ^ byte) * 0x100000001b3ULL;
    return hash;
}

std::vector<FirmwareComponent> namedComponents(const std::vector<utils::FirmwareVersionInfo>& components) {
    std::vector<FirmwareComponent> result;
    for (const utils::FirmwareVersionInfo& component : components) {
        const std::string_view type = ma::firmwareTypeName(component.type);
        if (!type.empty()) result.push_back({.type = std::string(type), .version = component.version});
    }
    return result;
}

/// The texts that the driver tells of a component's versions. Where it tells none, there is only the number.
const ma::NamedVersion* findVersion(const ma::AdapterInfo& info, const FirmwareComponent& component) {
    const auto found = std::ranges::find_if(info.versions, [&](const ma::NamedVersion& version) {
        return ma::firmwareTypeName(version.type) == component.type;
    });
    return found == info.versions.end() ? nullptr : &*found;
}

/// What is installed on a port, in the order of the types, and behind them what is of no type.
std::vector<FirmwareComponent> installedComponents(const ma::AdapterInfo& info) {
    std::vector<FirmwareComponent> result = namedComponents(info.components);
    for (FirmwareComponent& component : result) {
        if (const ma::NamedVersion* version = findVersion(info, component)) {
            component.name = version->name;
            component.text = version->running;
        }
    }
    for (const ma::NamedVersion& version : info.versions) {
        if (version.type == utils::FirmwareType::None && !version.running.empty())
            result.push_back({.name = version.name, .text = version.running});
    }
    return result;
}

void addInstalled(std::vector<Firmware>& installed, const Port& port, const ma::AdapterInfo& info) {
    for (FirmwareComponent& component : installedComponents(info)) {
        Firmware firmware{.identifier = port.adapter + ":" + component.label(),
                          .typeCode = SoftwareIdentity::InstalledComponent,
                          .adapter = port.adapter,
                          .backend = info.backend,
                          .ids = ma::formatIds(info.ids.vendor, info.ids.device),
                          .components = {component}};
        installed.push_back(firmware);
        const auto version = std::ranges::find(info.versions, component.name, &ma::NamedVersion::name);
        if (version == info.versions.end() || !version->isPending()) continue;
        firmware.identifier += ":stored";
        firmware.waitsFor = info.resetNeeded;
        // The number is that of the version that runs.
        firmware.components.front().version = 0;
        firmware.components.front().text = version->stored;
        installed.push_back(std::move(firmware));
    }
}

/// Larger than any chain of images of one card; keeps a stray disk image out of memory.
constexpr std::int64_t kMaxFileSize = 256LL * 1024 * 1024;

std::int64_t nanoseconds(const timespec& time) {
    return static_cast<std::int64_t>(time.tv_sec) * 1'000'000'000 + time.tv_nsec;
}

/// The bytes of a file that begins as a ROM does; otherwise nothing, and the reason.
/// @param isUnread  set when the file may have more than could be read
std::vector<std::uint8_t> readRom(const std::string& path, std::int64_t size, std::string& problem,
                                  bool& isUnread) {
    // Two bytes tell most other files apart, however large those are.
    std::vector<std::uint8_t> bytes(2);
    if (size > kMaxFileSize) {
        problem = "it is too large for an option ROM";
    } else if (os::readFile(path, bytes) != bytes.size()) {
        problem = "it is empty or cannot be read";
        isUnread = size >= 2;
    } else if (ma::readLe16(bytes, 0) != ma::rom::kSignature) {
        problem = "it is not an option ROM";
    } else {
        bytes.resize(static_cast<std::size_t>(size));
        if (os::readFile(path, bytes) == bytes.size()) return bytes;
        problem = "it cannot be read to its end";
        isUnread = true;
    }
    return {};
}

}  // namespace

Firmware describeImage(std::span<const std::uint8_t> file, const ma::RomFile& rom) {
    Firmware firmware;
    const ma::RomImage& first = rom.images.front();
    firmware.identifier = fmt("%04x-%04x-%016" PRIx64, first.vendorId, first.deviceId, hashOf(file));
    firmware.ids = ma::formatIds(first.vendorId, first.deviceId);
    firmware.components = namedComponents(rom.components());
    for (const ma::RomImage& image : rom.images) {
        if (firmware.manufacturer.empty()) firmware.manufacturer = image.manufacturer;
        if (firmware.product.empty()) firmware.product = image.product;
    }
    return firmware;
}

std::vector<Firmware> readInstalled(const std::vector<Port>& ports) {
    std::vector<Firmware> installed;
    for (const Port& port : ports) {
        const std::optional<ma::AdapterInfo> info = readInfo(port.adapter);
        // Components are updated one by one, so each has an identity with a version of its own.
        if (info) addInstalled(installed, port, *info);
    }
    return installed;
}

bool FirmwareCatalog::takeStamp(const std::string& path, Stamp& stamp) {
    struct stat info {};
    // One that is not there any more keeps its empty stamp, and reading it finds out.
    if (::stat(path.c_str(), &info) != 0) return true;
    if (!S_ISREG(info.st_mode)) return false;
    stamp = {info.st_dev, info.st_ino, info.st_size, nanoseconds(info.st_mtim), nanoseconds(info.st_ctim)};
    return true;
}

FirmwareCatalog::Entry FirmwareCatalog::read(const std::string& path, const Stamp& stamp,
                                             const Entry* before) {
    QUENX_DEBUG("Reading firmware file '%s'", path.c_str());
    Entry entry{stamp};
    std::string problem;
    const std::vector<std::uint8_t> bytes = readRom(path, stamp.size, problem, entry.isUnread);
    if (problem.empty()) {
        const ma::RomFile rom = ma::parseOptionRom(bytes);
        if (!rom.error) {
            entry.file = std::make_shared<FirmwareFile>(FirmwareFile{path, describeImage(bytes, rom)});
            return entry;
        }
        problem = *rom.error;
    }
    const bool isKnown = before != nullptr && before->isUnread && entry.isUnread && before->stamp == stamp;
    if (!isKnown) QUENX_ERROR("Firmware file '%s' is skipped: %s", path.c_str(), problem.c_str());
    return entry;
}

FirmwareCatalog::Files FirmwareCatalog::scan() {
    const utils::StringArray directories = utils::SMASHv2Config::getInstance()->getFirmwareFilesPaths();
    // Held while files are read, so that two requests at once do not read each new file twice.
    const utils::Mutex::AutoLocker lock(m_mutex);
    Files files;
    Entries entries;
    for (const std::string& directory : directories) {
        for (const std::string& name : os::listDirectory(directory)) {
            std::string path = directory;
            path.append("/").append(name);
            Stamp stamp;
            // A directory that the configuration lists twice is served once.
            if (entries.contains(path) || !takeStamp(path, stamp)) continue;
            const auto known = m_known.find(path);
            const Entry* before = known == m_known.end() ? nullptr : &known->second;
            const bool isCurrent = before != nullptr && !before->isOutdated(stamp);
            const Entry& entry = entries[path] = isCurrent ? *before : read(path, stamp, before);
            if (entry.file != nullptr) files.push_back(entry.file);
        }
    }
    m_known = std::move(entries);
    return files;
}

}  // namespace inventory
