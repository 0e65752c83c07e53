// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <sys/types.h>

#include <cstdint>
#include <span>
#include <stdexcept>
#include <string>
#include <variant>
#include <vector>

#include "History/Database.h"
#include "History/Record.h"

namespace history {

/// The history cannot be used; what() says why, and what to do.
class HistoryError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/// The file of a history: records in a table "updates" of an SQLite database. Several processes may work on
/// one file; an object is for one thread. Operations throw HistoryError, and DatabaseError for a file that
/// cannot be written or is damaged.
class Store {
  public:
    /// Records removed because there were too many.
    struct Pruned {
        std::int64_t first = 0;
        std::int64_t last = 0;  ///< 0 when none were
    };

    /// Opens the file in a folder of this user's, and makes both where they are missing. The caller holds the
    /// folder's lock.
    explicit Store(const std::string& folder);

    /// False when the file has been taken away or exchanged since it was opened.
    bool isStillThere() const;
    /// Reads the whole file. Throws DatabaseError when something is wrong with it.
    void check();

    /// Writes to the medium, and changes nothing.
    void prove();
    /// Whether what is changed from now on need not be on the medium when the change ends: see
    /// Database::syncEachChange().
    void syncLater(bool wanted) { m_database.syncEachChange(!wanted || !m_isLogged); }

    /// Adds the records, all or none, and gives them their ids.
    /// @param most  how many records are kept
    Pruned add(std::span<Record> records, std::int64_t most);
    /// Puts what is known now in the place of a record of the same owner, unless its update has ended.
    void update(const Record& record);
    /// Takes away the record of an update that did not begin after all.
    void remove(const Record& record);
    /// Whether the record of a running update is in this file.
    bool holds(const Record& record);
    void setProgress(std::int64_t id, std::int64_t percent);
    void setActive(std::int64_t id, std::int64_t time);

    std::vector<Record> find(const Filter& filter);
    std::int64_t count() { return m_database.number("SELECT count(*) FROM updates"); }
    std::vector<Record> running();
    /// The last one of each adapter that was written, if its firmware has not been seen to run.
    std::vector<Record> waiting();

    static std::string fileIn(const std::string& folder) { return folder + "/history.db"; }

  private:
    void prepare();
    Pruned prune(std::int64_t most);
    using Parameters = std::vector<std::variant<std::int64_t, std::string>>;
    std::vector<Record> select(const std::string& condition, const Parameters& parameters = {});

    const std::string m_path;
    dev_t m_device = 0;
    ino_t m_inode = 0;
    Database m_database;
    bool m_isLogged = false;  ///< with the older journal a change that is not synced could spoil the file
};

/// Makes a folder for a history, with the one above it, unless it is there, and sees that it is this user's
/// alone. Returns its path without links. Throws what says what is wrong with it.
std::string openFolder(const std::string& path);

/// Moves a damaged file out of the way, and returns its new name. The caller holds the folder's lock.
std::string moveAside(const std::string& folder);

}  // namespace history
