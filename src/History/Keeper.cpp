// SPDX-License-Identifier: Apache-2.0
#include "History/Keeper.h"

#include <algorithm>
#include <filesystem>
#include <map>
#include <utility>

#include "Framework/Requests/Audit.h"
#include "Framework/Requests/Reasons.h"
#include "History/KeptImages.h"
#include "History/Look.h"
#include "MidAPI/Image/OptionRom.h"
#include "MidAPI/ma.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/linux.h"

namespace history {

namespace {

// Updates wait for less; a record that comes late is better than none.
constexpr std::chrono::seconds kLockPatience{30};

constexpr std::size_t kMostRefused = 1000;  // while the disk does not answer
constexpr std::size_t kManyRefused = 200;

std::int64_t now() {
    return static_cast<std::int64_t>(os::getuSecondsSinceEpoch());
}

void identify(Record& record, const AdapterLook& look) {
    record.backend = look.backend;
    record.pciAddress = look.pciAddress;
    record.serial = look.serial;
}

void requireHeld(const os::FileLock& lock, const std::string& folder) {
    if (!lock.isHeld()) throw HistoryError(lock.holder() + " holds " + folder);
}

/// Nothing where it cannot be read.
std::optional<std::int64_t> progressOf(const std::string& adapter) try {
    return ma::getFlashImageUpdateProgress(adapter);
} catch (const std::exception&) {
    return std::nullopt;
}

/// What nobody lived to see the end of. It is not begun again: only people know whether they still want it.
void completeInterrupted(Record& record) {
    record.outcome = kInterrupted;
    record.reasonId = core::reasonCode(core::ReasonId::Interrupted);
    record.ended = now();
    record.reason = "Interrupted at " + std::to_string(record.percent.value_or(0)) + " %: " + record.front +
                    " (process " + std::to_string(record.process) + ") ended during the update. " +
                    record.adapter;
    const std::optional<AdapterLook> found = lookAt(record.adapter);
    if (!found) {
        record.reason += " cannot be read now";
        record.versionsAfter.clear();
        return;
    }
    record.reason += found->stored == record.versionsAfter ? " still has " : " now has ";
    record.versionsAfter = found->stored;
    record.reason += found->stored.empty() ? "no versions that it tells" : found->stored;
}

}  // namespace

void Keeper::say(const std::string& problem) {
    const bool isKnown = !m_problem.empty();
    m_problem = problem;
    if (isKnown) return;
    utils::writeAuditLog("[history] No record is kept of updates: " + utils::escapeForLog(problem, 400));
}

bool Keeper::withStore(const std::function<void(Store&)>& step, bool isSyncedLater) noexcept try {
    const auto attempt = [&] {
        Store& store = open();
        store.syncLater(isSyncedLater);
        step(store);
    };
    try {
        attempt();
    } catch (const DatabaseError& error) {
        if (!error.isDamage()) throw;
        replaceDamaged(error.what());
        attempt();
    }
    m_problem.clear();
    return true;
} catch (const std::exception& error) {
    // A new connection next time: what was wrong may be over then.
    m_store.reset();
    try {
        say(error.what());
    } catch (const std::bad_alloc&) {
        // As in the rest of the log: a line that cannot be built is dropped.
    }
    return false;
}

os::FileLock Keeper::lockFolder() const {
    const std::string path = m_folder + "/lock";
    return os::FileLock(path, kLockPatience);
}

bool Keeper::isThere() const {
    return std::filesystem::exists(Store::fileIn(m_folder.empty() ? m_settings.folder() : m_folder));
}

Store& Keeper::open() {
    if (!m_store || !m_store->isStillThere()) {
        m_store.reset();
        try {
            openFile();
        } catch (const DatabaseError& error) {
            if (!error.isDamage()) throw;
            replaceDamaged(error.what());
            openFile();
        }
    }
    return *m_store;
}

void Keeper::openFile() {
    m_folder = openFolder(m_folder.empty() ? m_settings.folder() : m_folder);
    const os::FileLock lock = lockFolder();
    requireHeld(lock, m_folder);
    if (!m_owner || !Owner::isAlive(m_folder, m_owner->name())) m_owner.emplace(m_folder);
    m_store.emplace(m_folder);
    // Another file knows nothing of the records of this one.
    for (const auto& update : m_running)
        if (!m_store->holds(update->record)) update->record.id = 0;
}

void Keeper::replaceDamaged(const std::string& reason) {
    m_store.reset();
    const os::FileLock lock = lockFolder();
    requireHeld(lock, m_folder);
    const std::string moved = moveAside(m_folder);
    utils::writeAuditLog("[history] The history is damaged (" + utils::escapeForLog(reason, 100) +
                         ") and has been moved to " + utils::escapeForLog(moved, 400) +
                         ". A new one begins.");
}

void Keeper::insert(Store& store, std::span<Record> records, std::int64_t most) {
    for (Record& record : records)
        record.owner = m_owner->name();
    const Store::Pruned pruned = store.add(records, most);
    if (pruned.last != 0)
        core::audit(
            {{.principal = records.front().front, .address = "local"},
             "PruneHistory",
             m_folder,
             "removed records " + std::to_string(pruned.first) + " to " + std::to_string(pruned.last)});
}

bool Keeper::refused(Record record, std::int64_t most) {
    const utils::Mutex::AutoLocker lock(m_refusedMutex);
    m_mostRecords = most;
    if (m_refused.size() < kMostRefused) m_refused.push_back(std::move(record));
    return m_refused.size() >= kManyRefused;
}

void Keeper::addRefused() {
    std::vector<Record> records;
    std::int64_t most = 0;
    {
        const utils::Mutex::AutoLocker lock(m_refusedMutex);
        records.swap(m_refused);
        most = m_mostRecords;
    }
    if (records.empty()) return;  // written with those of others
    std::map<std::string, std::optional<AdapterLook>> looks;
    for (Record& record : records) {
        if (record.adapter.empty()) continue;
        const auto [known, isNew] = looks.try_emplace(record.adapter);
        if (isNew) known->second = lookAt(record.adapter);
        if (!known->second) continue;
        identify(record, *known->second);
        record.versionsBefore = known->second->running;
    }
    // Anybody who may ask can be refused as often as he likes: none of that may keep the disk busy, and with
    // it the updates of others.
    m_isUnsynced |= withStore([&](Store& store) { insert(store, records, most); }, true);
}

void Keeper::sync() {
    if (std::exchange(m_isUnsynced, false)) prove();
}

bool Keeper::begin(const std::shared_ptr<RunningUpdate>& update) {
    addRefused();
    Record& record = update->record;
    if (const auto look = lookAt(record.adapter)) {
        identify(record, *look);
        record.versionsBefore = look->running;
        record.versionsAfter = look->stored;  // until it ends
    }
    m_running.push_back(update);
    return withStore([&](Store& store) {
        completeOfDead(store);
        insert(store, {&record, 1}, update->most);
    });
}

void Keeper::withdraw(const std::shared_ptr<RunningUpdate>& update) {
    std::erase(m_running, update);
    if (update->record.id != 0) withStore([&](Store& store) { store.remove(update->record); });
}

void Keeper::end(const std::shared_ptr<RunningUpdate>& update) {
    Record& record = update->record;
    const std::optional<AdapterLook> look = lookAt(record.adapter);
    record.versionsAfter = look && look->isStoredKnown ? look->stored : "";
    if (record.outcome == kWritten && look && look->isStoredKnown && look->running == look->stored)
        record.active = record.ended;
    withStore([&](Store& store) {
        if (record.id == 0)
            insert(store, {&record, 1}, update->most);  // the disk may have been full at the beginning
        else
            store.update(record);
    });
    std::erase(m_running, update);
}

void Keeper::keepImageOf(const RunningUpdate& update) noexcept try {
    const ma::PciIds ids = ma::getAdapterInfo(update.record.adapter).ids;
    keepImage(update.keepFolder, ma::formatIds(ids.vendor, ids.device), update.record);
} catch (const std::exception& error) {
    try {
        utils::writeAuditLog("[history] An image is not kept: " + utils::escapeForLog(error.what(), 400));
    } catch (const std::bad_alloc&) {
        // As in the rest of the log: a line that cannot be built is dropped.
    }
}

std::string Keeper::prove() noexcept {
    return withStore([](Store& store) { store.prove(); }) ? "" : m_problem;
}

bool Keeper::watch() {
    const bool hasSynced = m_isUnsynced;
    sync();
    for (const auto& update : m_running) {
        Record& record = update->record;
        const auto percent = record.id == 0 ? std::nullopt : progressOf(record.adapter);
        if (percent && record.percent != percent) {
            record.percent = percent;
            withStore([&](Store& store) { store.setProgress(record.id, *percent); });
        }
    }
    return hasSynced || !m_running.empty();
}

void Keeper::completeOfDead(Store& store) const {
    std::vector<Record> found = store.running();
    std::erase_if(found, [&](const Record& each) { return each.owner == m_owner->name(); });
    if (found.empty()) return;
    const os::FileLock lock = lockFolder();
    if (!lock.isHeld()) return;  // who holds it does the same
    Owner::sweep(m_folder);
    std::erase_if(found, [&](const Record& each) { return Owner::isAlive(m_folder, each.owner); });
    // Whoever died may have left more behind.
    if (!found.empty()) store.check();
    for (Record& record : found) {
        completeInterrupted(record);
        store.update(record);
    }
}

void Keeper::noteActive(Store& store) {
    for (const Record& record : store.waiting()) {
        const std::optional<AdapterLook> look = lookAt(record.adapter);
        if (look && look->serial == record.serial && !record.versionsAfter.empty() &&
            look->running == record.versionsAfter)
            store.setActive(record.id, now());
    }
}

void Keeper::look() {
    const auto lookAround = [&](Store& store) {
        completeOfDead(store);
        noteActive(store);
    };
    try {
        if (!isThere()) return;
    } catch (const std::exception&) {
        return;  // told when there is something to keep
    }
    withStore(lookAround);
}

std::int64_t Keeper::count() {
    addRefused();
    std::int64_t records = 0;
    if (isThere() && !withStore([&](Store& store) { records = store.count(); }))
        throw HistoryError(m_problem);
    return records;
}

std::vector<Record> Keeper::find(const Filter& filter) {
    addRefused();
    std::vector<Record> records;
    if (!isThere()) return records;
    const bool isDone = withStore([&](Store& store) {
        completeOfDead(store);
        noteActive(store);
        records = store.find(filter);
    });
    if (!isDone) throw HistoryError(m_problem);
    return records;
}

}  // namespace history
