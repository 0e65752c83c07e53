// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/AdapterTable.h"

#include <linux/devlink.h>

#include <system_error>

#include "MidAPI/Devlink/Activator.h"
#include "MidAPI/Devlink/CardLock.h"
#include "Utils/Log.h"

namespace ma::devlink {

using utils::Mutex;

AdapterTable::AdapterTable(std::shared_ptr<Machine> machine, std::string lockFolder)
    : m_machine(std::move(machine)), m_lockFolder(std::move(lockFolder)) {}

utils::StringArray AdapterTable::names() {
    utils::StringArray names;
    for (const PciFunction& function : walk())
        names.push_back(function.address);
    return names;
}

std::optional<KnownFunction> AdapterTable::find(const std::string& name) {
    readNotifications();
    auto found = look(name);
    if (!found) {
        walk();  // it may have come since
        found = look(name);
    }
    if (!found) return std::nullopt;
    if (!found->mustBeAsked) return found->known;
    found->known.writer = findLockHolder(found->known.pci);
    if (!found->known.writer.empty()) return found->known;
    ask(name, *found);
    found = look(name);
    return found ? std::optional(found->known) : std::nullopt;
}

std::shared_ptr<Progress> AdapterTable::progressOf(const std::string& name) {
    const auto found = look(name);
    return found ? found->known.progress : nullptr;
}

std::optional<AdapterTable::Found> AdapterTable::look(const std::string& name) {
    const Mutex::AutoLocker lock(m_mutex);
    const auto entry = m_entries.find(name);
    if (entry == m_entries.end()) return std::nullopt;
    const auto& [known, isOutOfDate, isFlashedElsewhere, ownFlashes, changes] = entry->second;
    Found found{known, isOutOfDate, changes};
    if (isFlashedElsewhere) found.known.writer = "another process";
    if (ownFlashes > 0) found.known.writer = "this process";
    if (!found.known.writer.empty()) found.mustBeAsked = false;
    return found;
}

/// Takes in what sysfs shows, and lets go of what it no longer does.
std::vector<PciFunction> AdapterTable::walk() {
    std::vector<PciFunction> functions = findPciFunctions(*m_machine);
    const Mutex::AutoLocker lock(m_mutex);
    std::map<std::string, Entry> entries;
    for (const PciFunction& function : functions) {
        Entry entry;
        if (auto before = m_entries.extract(function.address)) entry = std::move(before.mapped());
        // Another driver knows other things of the device.
        if (entry.known.pci.driver != function.driver) outdate(entry);
        entry.known.pci = function;
        entries.emplace(function.address, std::move(entry));
    }
    m_entries = std::move(entries);
    return functions;
}

void AdapterTable::ask(const std::string& name, const Found& found) {
    KnownFunction known = found.known;
    askDevice(known);
    const Mutex::AutoLocker lock(m_mutex);
    const auto entry = m_entries.find(name);
    if (entry == m_entries.end()) return;
    if (entry->second.known.flash.reason != known.flash.reason && known.flash.flashable == Flashable::Unknown)
        QUENX_ERROR("adapter %s: %s", name.c_str(), known.flash.reason.c_str());
    entry->second.known.flash = known.flash;
    entry->second.known.info = known.info;
    entry->second.known.offersActivation = known.offersActivation;
    // What was told in between may be newer than the answers.
    const bool isKnown = known.flash.flashable != Flashable::Unknown;
    if (isKnown && entry->second.changes == found.changes) entry->second.isOutOfDate = false;
}

void AdapterTable::askDevice(KnownFunction& known) try {
    known.info = {};
    known.flash = {Flashable::Absent, "this kernel has no devlink"};
    DevlinkConnection connection(*m_machine);
    if (connection.family().number == 0) return;
    listen(connection.family());
    known.flash = askFlashable(connection, known.pci.address);
    const Answer info = askInfo(connection, known.pci.address);
    // A driver need not tell anything of its device.
    if (!info.isLost && info.result.error == 0) known.info = readDeviceInfo(info.attributes);
    known.offersActivation = offersActivation(connection, known.pci.address);
} catch (const std::system_error& failure) {
    known.flash = {Flashable::Unknown, failure.what()};
}

/// Before the first question, so that no change after its answer is missed.
void AdapterTable::listen(const Family& family) {
    const Mutex::AutoLocker lock(m_mutex);
    if (!m_notifications) m_notifications = std::make_unique<Notifications>(*m_machine, family);
}

void AdapterTable::readNotifications() noexcept try {
    const Mutex::AutoLocker lock(m_mutex);
    if (!m_notifications) return;
    while (const auto batch = m_notifications->next(std::chrono::milliseconds(0)))
        note(*batch);
} catch (const std::exception& error) {
    QUENX_ERROR("what devlink tells cannot be read: %s", error.what());
}

void AdapterTable::note(const Notifications::Batch& batch) {
    for (auto& [name, entry] : m_entries) {
        if (!batch.lostSome) continue;
        // The end of a flash may be among them.
        entry.isFlashedElsewhere = false;
        outdate(entry);
    }
    for (const Notification& message : batch.messages) {
        const auto found = m_entries.find(message.device);
        if (found == m_entries.end()) continue;
        Entry& entry = found->second;
        switch (message.command) {
            case DEVLINK_CMD_FLASH_UPDATE:
            case DEVLINK_CMD_FLASH_UPDATE_STATUS:
                entry.isFlashedElsewhere = true;
                break;
            case DEVLINK_CMD_FLASH_UPDATE_END:
            case DEVLINK_CMD_NEW:
            case DEVLINK_CMD_DEL:
                entry.isFlashedElsewhere = false;
                outdate(entry);
                break;
            default:
                break;
        }
    }
}

void AdapterTable::outdate(Entry& entry) {
    entry.isOutOfDate = true;
    ++entry.changes;
}

/// Another process of this product may have been flashing the card before this one began to listen. While
/// somebody holds it, there is his number in the lock's file; who may not read it may not flash, either.
std::string AdapterTable::findLockHolder(const PciFunction& function) try {
    const std::string path = CardLock::path(m_lockFolder, function);
    if (m_machine->readFile(path).value_or("").empty()) return {};
    const auto lock = m_machine->lock(path, std::chrono::milliseconds(0));
    return lock->isHeld() ? "" : lock->holder();
} catch (const std::system_error&) {
    return {};
}

AdapterTable::FlashScope::FlashScope(AdapterTable& table, std::string name)
    : m_table(table), m_name(std::move(name)) {
    const Mutex::AutoLocker lock(m_table.m_mutex);
    const auto entry = m_table.m_entries.find(m_name);
    if (entry != m_table.m_entries.end()) ++entry->second.ownFlashes;
}

AdapterTable::FlashScope::~FlashScope() {
    const Mutex::AutoLocker lock(m_table.m_mutex);
    const auto entry = m_table.m_entries.find(m_name);
    if (entry == m_table.m_entries.end() || entry->second.ownFlashes == 0) return;
    --entry->second.ownFlashes;
    outdate(entry->second);
}

}  // namespace ma::devlink
