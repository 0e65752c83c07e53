// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/StagedImage.h"

#include <sys/random.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <system_error>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/Devlink/Machine.h"
#include "Utils/Log.h"
#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

/// Below the kernel's folder, so that what is swept cannot be anybody else's.
constexpr const char* kOwnFolder = "quenx";

/// Between the name of the card and what nobody can guess. No card has it in its name.
constexpr char kSeparator = '-';

std::string unguessable() {
    std::array<unsigned char, 16> bytes{};
    if (::getrandom(bytes.data(), bytes.size(), 0) != static_cast<ssize_t>(bytes.size()))
        throw std::system_error(errno, std::generic_category(), "cannot name a file for the image");
    std::string text;
    for (const unsigned char byte : bytes)
        text += utils::hexByte(byte);
    return text;
}

std::string freshName(std::string_view card) {
    return std::string(kOwnFolder) + '/' + std::string(card) + kSeparator + unguessable() + ".bin";
}

/// What a process has left that was killed in a flash. The kernel has read it long since.
void sweep(Machine& machine, const std::string& folder, std::string_view card) {
    for (const std::string& name : machine.listFolder(folder).value_or(utils::StringArray()))
        if (name.starts_with(std::string(card) + kSeparator)) machine.removeFile(folder + '/' + name);
}

/// A service may be allowed no more than the own folder.
bool takesImages(Machine& machine, const std::string& folder) {
    const std::string own = folder + '/' + kOwnFolder;
    return machine.folderIsWritable(machine.folderExists(own) ? own : folder);
}

}  // namespace

utils::StringArray firmwareFolders(Machine& machine) {
    utils::StringArray folders;
    const std::string chosen = machine.readFile("/sys/module/firmware_class/parameters/path").value_or("");
    if (!chosen.empty()) folders.push_back(chosen);
    const std::string release = machine.kernelRelease();
    for (const std::string folder : {"/lib/firmware/updates", "/lib/firmware"}) {
        if (!release.empty()) folders.push_back(folder + '/' + release);
        folders.push_back(folder);
    }
    return folders;
}

std::string chooseFirmwareFolder(Machine& machine, const std::string& configured) {
    const utils::StringArray folders = firmwareFolders(machine);
    if (!configured.empty() && std::ranges::find(folders, configured) == folders.end())
        throw AdapterError("The kernel does not look for firmware in " + configured +
                           ", the firmware_folder of the settings. Name one of " + utils::joined(folders) +
                           ".");
    utils::StringArray missing;
    utils::StringArray closed;
    for (const std::string& folder : configured.empty() ? folders : utils::StringArray{configured}) {
        if (takesImages(machine, folder)) return folder;
        (machine.folderExists(folder) ? closed : missing).push_back(folder);
    }
    const std::string what = "No image can be given to the kernel: ";
    if (closed.empty())
        throw AdapterError(what + "it looks for firmware in " + utils::joined(missing) +
                           (missing.size() == 1 ? ", which is not there" : ", of which none is there") +
                           ". Make the folder " + missing.back() + ".");
    throw AdapterError(what + "this process may not write to " + utils::joined(closed) + ". Make " +
                       (closed.size() == 1 ? "it" : "one of them") + " writable, or run this as root.");
}

StagedImage::StagedImage(Machine& machine, const std::string& folder, std::string_view card,
                         std::span<const std::uint8_t> image)
    : m_machine(machine), m_name(freshName(card)), m_path(folder + '/' + m_name) {
    const std::string own = folder + '/' + kOwnFolder;
    try {
        machine.makeFolder(own);
        sweep(machine, own, card);
        const os::Descriptor file = machine.createFile(m_path);
        machine.writeFile(file, image);
        machine.syncFile(file);
        machine.syncFolder(own);
    } catch (const std::system_error& error) {
        remove();
        // Which medium is full, or read-only, is what a user has to know.
        throw std::system_error(error.code(), "the image cannot be staged in " + own);
    } catch (...) {
        remove();
        throw;
    }
}

StagedImage::~StagedImage() {
    remove();
}

void StagedImage::remove() noexcept try {
    m_machine.removeFile(m_path);
} catch (const std::exception& error) {
    // The next update of this card tries again.
    QUENX_ERROR_TEXT(error.what());
}

}  // namespace ma::devlink
