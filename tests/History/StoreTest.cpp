// SPDX-License-Identifier: Apache-2.0
#include "History/Store.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <filesystem>
#include <fstream>

#include "History/Owner.h"
#include "Support/TempFolder.h"
#include "Utils/Utils.h"

namespace {

using history::Filter;
using history::Record;
using history::Store;

Record recordThat(const std::string& outcome, std::int64_t begun = 0, const std::string& adapter = "") {
    Record record;
    record.outcome = outcome;
    record.begun = begun;
    record.adapter = adapter;
    return record;
}

class StoreTest : public ::testing::Test {
  protected:
    std::int64_t add(Record record, std::int64_t most = 1000) {
        m_store.add({&record, 1}, most);
        return record.id;
    }
    std::string ids(const Filter& filter) {
        std::vector<std::string> texts;
        for (const Record& record : m_store.find(filter))
            texts.push_back(std::to_string(record.id));
        return utils::joined(texts, " ");
    }

    const test::TempFolder m_folder;
    const std::string m_path = history::openFolder(m_folder / "history/");
    Store m_store{m_path};
};

/// All that a record holds, but its number.
auto everythingOf(const Record& record) {
    return std::tie(record.begun, record.ended, record.active, record.duration, record.outcome,
                    record.returnValue, record.errorCode, record.reason, record.reasonId, record.percent,
                    record.user, record.address, record.front, record.process, record.owner, record.boot,
                    record.host, record.target, record.adapter, record.backend, record.pciAddress,
                    record.serial, record.uri, record.sha256, record.signedBy, record.bytes,
                    record.imageVersions, record.types, record.options, record.optionValues,
                    record.versionsBefore, record.versionsAfter, record.job);
}

// Processes of earlier and later versions write into the same file.
TEST_F(StoreTest, KeepsTheLayoutOfTheFile) {
    history::Database file(Store::fileIn(m_path));
    EXPECT_EQ(
        file.text("SELECT group_concat(sql, char(10)) FROM (SELECT sql FROM sqlite_master WHERE sql NOT NULL"
                  " AND name NOT LIKE 'sqlite%' ORDER BY rowid)"),
        "CREATE TABLE updates(id INTEGER PRIMARY KEY AUTOINCREMENT, begun INTEGER, ended INTEGER, "
        "active INTEGER, duration_microseconds INTEGER, outcome TEXT, return_value INTEGER, "
        "error_code INTEGER, reason TEXT, percent_complete INTEGER, user TEXT, address TEXT, front TEXT, "
        "process INTEGER, owner TEXT, boot TEXT, host TEXT, target TEXT, adapter TEXT, backend TEXT, "
        "pci_address TEXT, serial_number TEXT, uri TEXT, sha256 TEXT, bytes INTEGER, image_versions TEXT, "
        "types TEXT, options TEXT, option_values TEXT, versions_before TEXT, versions_after TEXT, job TEXT, "
        "reason_id TEXT, signed_by TEXT)\n"
        "CREATE INDEX by_time ON updates(begun)\n"
        "CREATE INDEX by_adapter ON updates(adapter, id)\n"
        "CREATE INDEX by_pci_address ON updates(pci_address, id)\n"
        "CREATE INDEX failures ON updates(id) WHERE outcome NOT IN ('running', 'written')\n"
        "CREATE INDEX running ON updates(id) WHERE outcome = 'running'\n"
        "CREATE INDEX waiting ON updates(id) WHERE outcome = 'written' AND active IS NULL");
    EXPECT_EQ(file.number("PRAGMA user_version"), 1);
    EXPECT_EQ(file.text("PRAGMA journal_mode") + file.text("PRAGMA synchronous"), "wal2");
}

TEST_F(StoreTest, GivesBackAllThatItWasGiven) {
    const Record empty;
    Record full = recordThat("refused", 1);
    full.ended = 2;
    full.active = 3;
    full.duration = 4;
    full.returnValue = 5;
    full.errorCode = 6;
    full.percent = 7;
    full.process = 8;
    full.bytes = 9;
    int number = 9;
    for (std::string* text :
         {&full.reason,         &full.reasonId,      &full.user,   &full.address, &full.front,
          &full.owner,          &full.boot,          &full.host,   &full.target,  &full.adapter,
          &full.backend,        &full.pciAddress,    &full.serial, &full.uri,     &full.sha256,
          &full.signedBy,       &full.imageVersions, &full.types,  &full.options, &full.optionValues,
          &full.versionsBefore, &full.versionsAfter, &full.job})
        *text = "text " + std::to_string(++number);
    add(full);
    add(empty);
    const std::vector<Record> found = m_store.find({});
    ASSERT_EQ(found.size(), 2U);
    EXPECT_EQ(everythingOf(found[1]), everythingOf(full));
    EXPECT_EQ(everythingOf(found[0]), everythingOf(empty));
    EXPECT_EQ(ids({}), "2 1");
}

TEST_F(StoreTest, FindsWhatIsAskedForAtItsBounds) {
    for (const std::int64_t begun : {10, 20, 15, 30})  // the clock was set back once
        add(recordThat(begun == 20 ? "written" : "refused", begun, "eth0"));
    Record running = recordThat("running", 40, "eth1");
    running.pciAddress = "eth0";
    running.versionsAfter = "x";
    add(running);
    EXPECT_EQ(ids({.since = 15}), "5 4 3 2");
    EXPECT_EQ(ids({.since = 16}), "5 4 2");
    EXPECT_EQ(ids({.since = 41}), "");
    EXPECT_EQ(ids({.after = 3}), "4 5");
    EXPECT_EQ(ids({.since = 20, .after = 2}), "4 5");
    EXPECT_EQ(ids({.adapter = "eth0", .most = 2}), "5 4");
    EXPECT_EQ(ids({.adapter = "eth1", .since = 40}), "5");
    EXPECT_EQ(ids({.failedOnly = true}), "4 3 1");
    EXPECT_EQ(m_store.find({}).at(0).versionsAfter, "");
    EXPECT_EQ(m_store.running().at(0).versionsAfter, "x");
    ASSERT_EQ(m_store.waiting().size(), 1U);
    add(recordThat("written", 0, "eth0"));
    ASSERT_EQ(m_store.waiting().size(), 1U);
    EXPECT_EQ(m_store.waiting()[0].id, 6);
    m_store.setActive(6, 50);
    m_store.setActive(6, 60);
    EXPECT_EQ(m_store.find({}).at(0).active, 50);
    EXPECT_TRUE(m_store.waiting().empty());
}

TEST_F(StoreTest, RemovesAHundredthMoreThanItMust) {
    constexpr std::int64_t kMost = 200;
    m_store.syncLater(true);  // only so that it is fast
    add(recordThat("running"));
    for (std::int64_t i = 1; i < kMost; ++i)
        add(recordThat("refused"), kMost);
    EXPECT_EQ(m_store.count(), kMost);
    Record last = recordThat("refused");
    const Store::Pruned pruned = m_store.add({&last, 1}, kMost);
    EXPECT_EQ(pruned.first, 1);
    EXPECT_EQ(pruned.last, 3);
    EXPECT_EQ(m_store.count(), kMost - 1);  // the running one stays
}

TEST_F(StoreTest, ChangesOnlyWhatIsItsOwn) {
    Record mine = recordThat("running");
    mine.owner = "me";
    m_store.add({&mine, 1}, 1000);
    Record others = mine;
    others.owner = "other";
    EXPECT_TRUE(m_store.holds(mine));
    EXPECT_FALSE(m_store.holds(others));
    others.outcome = "failed";
    m_store.update(others);
    m_store.remove(others);
    m_store.setProgress(mine.id, 55);
    EXPECT_EQ(m_store.running().at(0).percent, 55);
    for (const char* outcome : {"interrupted", "written", "failed"}) {
        mine.outcome = outcome;
        m_store.update(mine);
    }
    m_store.setProgress(mine.id, 56);
    EXPECT_EQ(m_store.find({}).at(0).outcome, "written");
    EXPECT_FALSE(m_store.find({}).at(0).percent);
    m_store.remove(mine);
    EXPECT_EQ(m_store.count(), 0);
}

TEST_F(StoreTest, MovesADamagedFileAsideWithItsJournal) {
    add(recordThat("refused"));
    EXPECT_TRUE(m_store.isStillThere());
    const std::string moved = history::moveAside(m_path);
    EXPECT_FALSE(m_store.isStillThere());
    EXPECT_TRUE(moved.starts_with(m_path + "/history.db.damaged-"));
    EXPECT_TRUE(std::filesystem::exists(moved) && std::filesystem::exists(moved + "-wal"));
    EXPECT_FALSE(std::filesystem::exists(m_path + "/history.db-wal"));
}

TEST_F(StoreTest, TakesNoFileThatOthersReach) {
    const std::string file = Store::fileIn(m_path);
    ::chmod(file.c_str(), 0644);
    const Store again(m_path);
    struct stat status {};
    ASSERT_EQ(::stat(file.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777U, 0600U);
    ASSERT_EQ(::link(file.c_str(), (m_folder / "second").c_str()), 0);
    EXPECT_THROW(Store{m_path}, history::HistoryError);
}

TEST(OwnerTest, LivesAsLongAsItsFile) {
    const test::TempFolder folder;
    std::string name;
    {
        const history::Owner owner(folder.path());
        name = owner.name();
        EXPECT_TRUE(name.starts_with("owner-" + std::to_string(::getpid()) + "-")) << name;
        history::Owner::sweep(folder.path());  // a lock is held by this process, too
        EXPECT_TRUE(history::Owner::isAlive(folder.path(), name));
    }
    EXPECT_FALSE(history::Owner::isAlive(folder.path(), name));
    folder.write("owner-1-2", "");
    folder.write("other", "");
    EXPECT_TRUE(history::Owner::isAlive(folder.path(), "owner-1-2"));
    for (const char* none : {"other", "owner-/../other", ""})
        EXPECT_FALSE(history::Owner::isAlive(folder.path(), none)) << none;
    history::Owner::sweep(folder.path());
    EXPECT_FALSE(history::Owner::isAlive(folder.path(), "owner-1-2"));
    EXPECT_TRUE(std::filesystem::exists(folder / "other"));
}

}  // namespace
