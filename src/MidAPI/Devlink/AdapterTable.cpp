// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/AdapterTable.h"

#include <linux/devlink.h>

#include <system_error>

#include "MidAPI/Devlink/Activator.h"
#include "MidAPI/Devlink/CardLock.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/LockHolder.h"

namespace ma::devlink {

using utils::Mutex;

namespace {

constexpr const char* kSomebody = "another process";

}  // namespace

AdapterTable::AdapterTable(std::shared_ptr<Machine> machine, std::string lockFolder)
    : m_machine(std::move(machine)), m_lockFolder(std::move(lockFolder)) {}

bool areOnOneCard(const KnownFunction& left, const KnownFunction& right) {
    const auto isSame = [](const std::string& a, const std::string& b) { return !a.empty() && a == b; };
    return left.pci.card() == right.pci.card() || isSame(left.info.serialNumber, right.info.serialNumber) ||
           isSame(left.info.boardSerialNumber, right.info.boardSerialNumber);
}

utils::StringArray AdapterTable::names() {
    if (const auto names = walk()) return *names;
    const Mutex::AutoLocker lock(m_mutex);
    if (!m_names.empty()) return m_names;
    throw AdapterError(
        "The PCI devices of this machine cannot be listed (/sys/bus/pci/devices); this process "
        "may have too many files open.");
}

bool AdapterTable::hasSeen(const std::string& name) {
    const auto isThere = [&] {
        const Mutex::AutoLocker lock(m_mutex);
        return m_seen.contains(name);
    };
    if (isThere()) return true;
    names();  // it may have come since
    return isThere();
}

std::optional<KnownFunction> AdapterTable::find(const std::string& name, Ask ask) {
    readNotifications();
    if (!hasSeen(name)) return std::nullopt;
    if (ask == Ask::Anew || ask == Ask::AnewAsHolder) {
        const Mutex::AutoLocker lock(m_mutex);
        if (const auto entry = m_entries.find(name); entry != m_entries.end()) outdate(entry->second);
    }
    auto found = look(name);
    if (!found) {
        walk();  // it may have come again
        found = look(name);
    }
    if (!found) return std::nullopt;
    // The kernel tells that somebody is flashing it, but not who.
    if (found->known.writer == kSomebody && ask != Ask::AnewAsHolder)
        if (auto holder = findLockHolder(found->known.pci); !holder.empty()) found->known.writer = holder;
    if (!found->mustBeAsked) return found->known;
    if (ask != Ask::AnewAsHolder) found->known.writer = findLockHolder(found->known.pci);
    if (!found->known.writer.empty() || ask == Ask::Never) return found->known;
    this->ask(name, *found);
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
    if (isFlashedElsewhere) found.known.writer = kSomebody;
    if (ownFlashes > 0) found.known.writer = os::describeThisProcess();
    if (!found.known.writer.empty()) found.mustBeAsked = false;
    return found;
}

/// Takes in what sysfs shows, and lets go of what it no longer does, unless this process is flashing it.
/// Nothing, and no change, where it cannot be read.
std::optional<utils::StringArray> AdapterTable::walk() {
    const auto functions = findPciFunctions(*m_machine);
    if (!functions) return std::nullopt;
    const Mutex::AutoLocker lock(m_mutex);
    std::map<std::string, Entry> entries;
    m_names.clear();
    for (const PciFunction& function : *functions) {
        Entry entry;
        if (auto before = m_entries.extract(function.address)) entry = std::move(before.mapped());
        // Another driver knows other things of the device.
        if (entry.known.pci.driver != function.driver) outdate(entry);
        entry.known.pci = function;
        entries.emplace(function.address, std::move(entry));
        m_names.push_back(function.address);
        m_seen.insert(function.address);
    }
    std::erase_if(m_entries, [](const auto& each) { return each.second.ownFlashes == 0; });
    entries.merge(m_entries);
    m_entries = std::move(entries);
    return m_names;
}

void AdapterTable::ask(const std::string& name, const Found& found) {
    KnownFunction known = found.known;
    askDevice(known);
    const Mutex::AutoLocker lock(m_mutex);
    const auto entry = m_entries.find(name);
    if (entry == m_entries.end()) return;
    if (!known.infoError.empty() && entry->second.known.infoError != known.infoError)
        QUENX_ERROR("adapter %s: %s", name.c_str(), known.infoError.c_str());
    entry->second.known.flash = known.flash;
    entry->second.known.info = known.info;
    entry->second.known.infoError = known.infoError;
    entry->second.known.offersActivation = known.offersActivation;
    // What was told in between may be newer than the answers.
    const bool isKnown = known.flash.flashable != Flashable::Unknown && known.infoError.empty();
    if (isKnown && entry->second.changes == found.changes) entry->second.isOutOfDate = false;
}

void AdapterTable::askDevice(KnownFunction& known) try {
    known.infoError.clear();
    known.flash = {Flashable::Absent, "this kernel has no devlink"};
    DevlinkConnection connection(*m_machine);
    ToldInfo told;
    if (connection.family().number != 0) {
        listen(connection.family());
        known.flash = askFlashable(connection, known.pci.address);
        if (known.flash.flashable != Flashable::Absent) told = askInfo(connection, known.pci.address);
        known.offersActivation = offersActivation(connection, known.pci.address);
    }
    // Its serial numbers are told no less by what is known already.
    if (told.error.empty()) known.info = std::move(told.info);
    known.infoError = std::move(told.error);
} catch (const std::exception& failure) {
    known.flash = {Flashable::Unknown, failure.what()};
    known.infoError = failure.what();
}

/// Before the first question, so that no change after its answer is missed.
void AdapterTable::listen(const Family& family) {
    const Mutex::AutoLocker lock(m_mutex);
    if (!m_notifications) m_notifications = std::make_unique<Notifications>(*m_machine, family);
}

void AdapterTable::readNotifications() noexcept try {
    const Mutex::AutoLocker lock(m_mutex);
    if (!m_notifications) return;
    bool lostSome = false;
    while (const auto batch = m_notifications->next(std::chrono::milliseconds(0))) {
        lostSome = lostSome || batch->lostSome;
        note(*batch);
    }
    // The end of a flash may be among them: it would have come behind what was read.
    for (auto& [name, entry] : m_entries) {
        if (!lostSome) break;
        entry.isFlashedElsewhere = false;
        outdate(entry);
    }
} catch (const std::exception& error) {
    QUENX_ERROR("what devlink tells cannot be read: %s", error.what());
}

void AdapterTable::note(const Notifications::Batch& batch) {
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
                [[fallthrough]];
            // A reset of the card takes the ports of all its functions along.
            case DEVLINK_CMD_PORT_NEW:
            case DEVLINK_CMD_PORT_DEL:
                outdateCard(entry.known);
                break;
            default:
                break;
        }
    }
}

/// The functions of a card share its flash, or parts of it.
void AdapterTable::outdateCard(const KnownFunction& function) {
    for (auto& [name, entry] : m_entries)
        if (areOnOneCard(entry.known, function)) outdate(entry);
}

std::string AdapterTable::findFlashedElsewhere(const KnownFunction& function) {
    readNotifications();
    const Mutex::AutoLocker lock(m_mutex);
    for (const auto& [name, entry] : m_entries)
        if (entry.isFlashedElsewhere && areOnOneCard(entry.known, function)) return name;
    return {};
}

void AdapterTable::outdate(Entry& entry) {
    entry.isOutOfDate = true;
    ++entry.changes;
}

/// Another process of this product may have been flashing the card before this one began to listen. While
/// somebody holds it, there is his note in the lock's file; who may not read it may not flash, either.
std::string AdapterTable::findLockHolder(const PciFunction& function) try {
    const std::string path = CardLock::path(m_lockFolder, function);
    if (m_machine->readFile(path).value_or("").empty()) return {};
    const auto lock = m_machine->lock(path, std::chrono::milliseconds(0));
    return lock->isHeld() ? "" : lock->holder();
} catch (const std::exception&) {
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
    m_table.outdateCard(entry->second.known);
}

}  // namespace ma::devlink
