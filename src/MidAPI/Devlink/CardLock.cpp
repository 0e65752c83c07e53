// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/CardLock.h"

#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

void makeFolders(Machine& machine, const std::string& folder) {
    const std::string parent = folder.substr(0, folder.rfind('/'));
    if (!machine.folderExists(parent)) machine.makeFolder(parent);
    machine.makeFolder(folder);
}

/// A file's name for a serial number, in which a driver may tell anything.
std::string serialName(const std::string& serial) {
    constexpr std::size_t kLongest = 64;
    std::string name = "serial-";
    for (const char character : serial.substr(0, kLongest))
        name += utils::hexByte(static_cast<unsigned char>(character));
    return name + ".lock";
}

}  // namespace

CardLock::CardLock(Machine& machine, const std::string& folder, const PciFunction& function,
                   const DeviceInfo& info, std::chrono::milliseconds patience) {
    makeFolders(machine, folder);
    m_locks.push_back(machine.lock(path(folder, function), patience));
    // Of all functions of a board this comes second, so that no two wait for each other.
    const std::string& serial = info.boardSerialNumber.empty() ? info.serialNumber : info.boardSerialNumber;
    if (isHeld() && !serial.empty())
        m_locks.push_back(machine.lock(folder + '/' + serialName(serial), patience));
}

std::string CardLock::path(const std::string& folder, const PciFunction& function) {
    return folder + '/' + function.card() + ".lock";
}

}  // namespace ma::devlink
