// SPDX-License-Identifier: Apache-2.0
#include "Providers/SoftwareInventory/Firmware.h"

#include <algorithm>
#include <cinttypes>
#include <set>
#include <utility>

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

utils::StringArray pathsIn(const utils::StringArray& directories) {
    utils::StringArray paths;
    for (const std::string& directory : directories) {
        for (const std::string& name : os::listDirectory(directory))
            paths.push_back(std::string(directory).append("/").append(name));
    }
    return paths;
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

FirmwareCatalog::Entry FirmwareCatalog::read(const std::string& path, const os::FileState& state,
                                             const Entry* before) {
    QUENX_DEBUG("Reading firmware file '%s'", path.c_str());
    Entry entry{state};
    std::string problem;
    const std::vector<std::uint8_t> bytes = readRom(path, state.size, problem, entry.isUnread);
    if (problem.empty()) {
        const ma::RomFile rom = ma::parseOptionRom(bytes);
        if (!rom.error) {
            entry.file = std::make_shared<FirmwareFile>(FirmwareFile{path, describeImage(bytes, rom)});
            return entry;
        }
        problem = *rom.error;
    }
    const bool isKnown = before != nullptr && before->isUnread && entry.isUnread && before->state == state;
    if (!isKnown) QUENX_ERROR("Firmware file '%s' is skipped: %s", path.c_str(), problem.c_str());
    return entry;
}

bool FirmwareCatalog::isCurrent(const utils::StringArray& directories) const {
    if (m_content == nullptr || !m_watch.isQuiet(directories)) return false;
    for (const std::string& path : m_unwatched)
        if (m_known.at(path).isOutdated(os::stateOf(path))) return false;
    return true;
}

FirmwareCatalog::Entry FirmwareCatalog::lookAt(const std::string& path) const {
    const os::FileState state = os::stateOf(path);
    const auto known = m_known.find(path);
    const Entry* before = known == m_known.end() ? nullptr : &known->second;
    if (before != nullptr && !before->isOutdated(state)) return *before;
    return state.isOther ? Entry{state} : read(path, state, before);
}

namespace {

/// Those that are configured, and that of each image that was sent.
utils::StringArray imageDirectories() {
    utils::SMASHv2Config* const config = utils::SMASHv2Config::getInstance();
    utils::StringArray directories = config->getFirmwareFilesPaths();
    const std::string uploads = config->getUploadDirectory();
    if (uploads.empty()) return directories;
    for (const std::string& image : os::listDirectory(uploads))
        directories.push_back(uploads + "/" + image);
    return directories;
}

}  // namespace

std::shared_ptr<const FirmwareContent> FirmwareCatalog::scan() {
    const utils::StringArray directories = imageDirectories();
    // Held while files are read, so that two requests at once do not read each new file twice.
    const utils::Mutex::AutoLocker lock(m_mutex);
    if (isCurrent(directories)) return m_content;
    const std::shared_ptr<const FirmwareContent> before = std::exchange(m_content, nullptr);
    // First, so that what changes while the files are looked at makes another scan.
    m_watch.watch(directories);
    Entries entries;
    std::vector<std::string> unwatched;
    std::set<std::string> identifiers;
    FirmwareContent content;
    for (const std::string& path : pathsIn(directories)) {
        // A directory that the configuration lists twice is served once.
        const auto [place, isNew] = entries.try_emplace(path);
        if (!isNew) continue;
        const Entry& entry = place->second = lookAt(path);
        if (entry.isUnread || !m_watch.sees(entry.state)) unwatched.push_back(path);
        if (entry.file == nullptr) continue;
        content.files.push_back(*entry.file);
        // Equal files are one firmware with several resources.
        if (identifiers.insert(entry.file->firmware.identifier).second)
            content.firmware.push_back(entry.file->firmware);
    }
    m_known = std::move(entries);
    m_unwatched = std::move(unwatched);
    const bool isSame = before != nullptr && *before == content;
    m_content = isSame ? before : std::make_shared<FirmwareContent>(std::move(content));
    return m_content;
}

}  // namespace inventory
