// SPDX-License-Identifier: Apache-2.0
#include "History/Store.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <system_error>

#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/linux.h"

namespace history {

namespace {

/// Raised by changes after which a process of an earlier version would write what is wrong. Further columns
/// are none.
constexpr std::int64_t kSchema = 1;

using Field = std::variant<std::int64_t Record::*, Record::Number Record::*, std::string Record::*>;

struct Column {
    const char* name;
    Field field;
};

// In the order in which they are made; later versions add theirs at the end.
constexpr Column kColumns[] = {
    {"begun", &Record::begun},
    {"ended", &Record::ended},
    {"active", &Record::active},
    {"duration_microseconds", &Record::duration},
    {"outcome", &Record::outcome},
    {"return_value", &Record::returnValue},
    {"error_code", &Record::errorCode},
    {"reason", &Record::reason},
    {"percent_complete", &Record::percent},
    {"user", &Record::user},
    {"address", &Record::address},
    {"front", &Record::front},
    {"process", &Record::process},
    {"owner", &Record::owner},
    {"boot", &Record::boot},
    {"host", &Record::host},
    {"target", &Record::target},
    {"adapter", &Record::adapter},
    {"backend", &Record::backend},
    {"pci_address", &Record::pciAddress},
    {"serial_number", &Record::serial},
    {"uri", &Record::uri},
    {"sha256", &Record::sha256},
    {"bytes", &Record::bytes},
    {"image_versions", &Record::imageVersions},
    {"types", &Record::types},
    {"options", &Record::options},
    {"option_values", &Record::optionValues},
    {"versions_before", &Record::versionsBefore},
    {"versions_after", &Record::versionsAfter},
    {"job", &Record::job},
    {"reason_id", &Record::reasonId},
    {"signed_by", &Record::signedBy},
};
constexpr int kColumnCount = static_cast<int>(std::size(kColumns));

/// Each query below has one that holds just the rows that it wants.
constexpr const char* kIndexes =
    "CREATE INDEX by_time ON updates(begun);"
    "CREATE INDEX by_adapter ON updates(adapter, id);"
    "CREATE INDEX by_pci_address ON updates(pci_address, id);"
    "CREATE INDEX failures ON updates(id) WHERE outcome NOT IN ('running', 'written');"
    "CREATE INDEX running ON updates(id) WHERE outcome = 'running';"
    "CREATE INDEX waiting ON updates(id) WHERE outcome = 'written' AND active IS NULL;";

std::string columnNames() {
    std::string names;
    for (const Column& column : kColumns)
        names += (names.empty() ? "" : ", ") + std::string(column.name);
    return names;
}

std::string tableSql() {
    std::string sql = "CREATE TABLE updates(id INTEGER PRIMARY KEY AUTOINCREMENT";
    for (const Column& column : kColumns) {
        const bool isText = std::holds_alternative<std::string Record::*>(column.field);
        sql += std::string(", ") + column.name + (isText ? " TEXT" : " INTEGER");
    }
    return sql + ");" + kIndexes;
}

std::string insertSql() {
    std::string places = "?1";
    for (int i = 2; i <= kColumnCount; ++i)
        places += ", ?" + std::to_string(i);
    return "INSERT INTO updates(" + columnNames() + ") VALUES(" + places + ")";
}

/// Binds the columns, in their order, as the parameters from 1 on.
void bindColumns(Statement& statement, const Record& record) {
    for (int i = 0; i < kColumnCount; ++i)
        std::visit([&](auto member) { statement.bind(i + 1, record.*member); }, kColumns[i].field);
}

struct ColumnReader {
    const Statement& row;
    Record& record;
    int column;

    void operator()(std::int64_t Record::*member) const { record.*member = row.number(column).value_or(0); }
    void operator()(Record::Number Record::*member) const { record.*member = row.number(column); }
    void operator()(std::string Record::*member) const { record.*member = row.text(column); }
};

/// The file of this user's alone. It is looked at by its name: to close a file that SQLite has open would
/// drop the locks of this process on it.
struct stat requireOwn(const std::string& path) {
    struct stat status {};
    if (::lstat(path.c_str(), &status) != 0)
        throw std::system_error(errno, std::generic_category(), "cannot use " + path);
    if (!S_ISREG(status.st_mode) || status.st_nlink > 1)
        throw HistoryError("cannot use " + path + ": it is a link, or no regular file; remove it");
    if (status.st_uid != ::geteuid()) throw os::ForeignFile(path, status.st_uid, "cannot use");
    if ((status.st_mode & (S_IRWXG | S_IRWXO)) != 0 && ::chmod(path.c_str(), S_IRUSR | S_IWUSR) != 0)
        throw std::system_error(errno, std::generic_category(), "cannot close to others " + path);
    return status;
}

/// The path of the file, which is there then.
std::string madeFile(const std::string& folder) {
    const std::string path = Store::fileIn(folder);
    struct stat status {};
    if (::lstat(path.c_str(), &status) != 0 && errno == ENOENT)
        const os::Descriptor made(os::openOwnFile(path, O_RDWR, "cannot make"));
    return path;
}

}  // namespace

Store::Store(const std::string& folder) : m_path(madeFile(folder)), m_database((requireOwn(m_path), m_path)) {
    const struct stat status = requireOwn(m_path);
    m_device = status.st_dev;
    m_inode = status.st_ino;
    prepare();
}

void Store::prepare() {
    const std::int64_t version = m_database.number("PRAGMA user_version");
    if (version > kSchema)
        throw HistoryError(m_path + " was written by a newer version (schema " + std::to_string(version) +
                           "; this one knows " + std::to_string(kSchema) +
                           "). Use that version, or move the file away.");
    // Where the file system cannot share memory SQLite stays with its older journal, which is as safe.
    m_isLogged = m_database.text("PRAGMA journal_mode = WAL") == "wal";
    if (version == kSchema) return;
    Transaction transaction(m_database);
    m_database.execute(tableSql() + "PRAGMA user_version = " + std::to_string(kSchema));
    transaction.commit();
}

bool Store::isStillThere() const {
    struct stat status {};
    return ::lstat(m_path.c_str(), &status) == 0 && status.st_dev == m_device && status.st_ino == m_inode;
}

void Store::check() {
    const std::string result = m_database.text("PRAGMA quick_check(1)");
    constexpr int kCorrupt = 11;  // SQLITE_CORRUPT
    if (result != "ok") throw DatabaseError(kCorrupt, result);
}

void Store::prove() {
    Transaction transaction(m_database);
    // SQLite writes this number to the file, whatever it was.
    m_database.execute("PRAGMA user_version = " + std::to_string(kSchema));
    transaction.commit();
}

Store::Pruned Store::add(std::span<Record> records, std::int64_t most) {
    Transaction transaction(m_database);
    static const std::string kSql = insertSql();
    for (Record& record : records) {
        Statement insert(m_database, kSql);
        bindColumns(insert, record);
        insert.step();
        record.id = m_database.lastId();
    }
    const Pruned pruned = prune(most);
    transaction.commit();
    return pruned;
}

Store::Pruned Store::prune(std::int64_t most) {
    const std::int64_t first = m_database.number("SELECT min(id) FROM updates");
    const std::int64_t last = m_database.number("SELECT max(id) FROM updates");
    // By ids, which have hardly any gaps: to count the rows would take longer with each.
    if (last - first < most) return {};
    // A hundredth more than must be, so that not every record removes another.
    const std::int64_t until = last - most + most / 100;
    Statement remove(m_database, "DELETE FROM updates WHERE id <= ?1 AND outcome <> 'running'");
    remove.bind(1, until);
    remove.step();
    return m_database.changes() == 0 ? Pruned{} : Pruned{first, until};
}

void Store::update(const Record& record) {
    std::string sql = "UPDATE updates SET ";
    for (int i = 0; i < kColumnCount; ++i)
        sql += (i == 0 ? "" : ", ") + std::string(kColumns[i].name) + " = ?" + std::to_string(i + 1);
    Statement statement(m_database, sql + " WHERE outcome IN ('running', 'interrupted') AND id = ?" +
                                        std::to_string(kColumnCount + 1) + " AND owner = ?" +
                                        std::to_string(kColumnCount + 2));
    bindColumns(statement, record);
    // Whoever took this process for dead was wrong: it knows best how its update has ended.
    statement.bind(kColumnCount + 1, record.id);
    statement.bind(kColumnCount + 2, record.owner);
    statement.step();
}

void Store::remove(const Record& record) {
    Statement statement(m_database, "DELETE FROM updates WHERE id = ?1 AND owner = ?2");
    statement.bind(1, record.id);
    statement.bind(2, record.owner);
    statement.step();
}

bool Store::holds(const Record& record) {
    Statement statement(m_database, "SELECT 1 FROM updates WHERE id = ?1 AND owner = ?2");
    statement.bind(1, record.id);
    statement.bind(2, record.owner);
    return statement.step();
}

void Store::setProgress(std::int64_t id, std::int64_t percent) {
    Statement statement(m_database,
                        "UPDATE updates SET percent_complete = ?1 WHERE id = ?2 AND outcome = 'running'");
    statement.bind(1, percent);
    statement.bind(2, id);
    statement.step();
}

void Store::setActive(std::int64_t id, std::int64_t time) {
    Statement statement(m_database, "UPDATE updates SET active = ?1 WHERE id = ?2 AND active IS NULL");
    statement.bind(1, time);
    statement.bind(2, id);
    statement.step();
}

std::vector<Record> Store::select(const std::string& condition, const Parameters& parameters) {
    Statement statement(m_database, "SELECT id, " + columnNames() + " FROM updates WHERE " + condition);
    for (std::size_t i = 0; i < parameters.size(); ++i)
        std::visit([&](const auto& value) { statement.bind(static_cast<int>(i + 1), value); }, parameters[i]);
    std::vector<Record> records;
    while (statement.step()) {
        Record& record = records.emplace_back();
        record.id = statement.number(0).value_or(0);
        for (int i = 0; i < kColumnCount; ++i)
            std::visit(ColumnReader{statement, record, i + 1}, kColumns[i].field);
    }
    return records;
}

std::vector<Record> Store::find(const Filter& filter) {
    std::string condition = "id > ?1";
    Parameters parameters{filter.after.value_or(0)};
    if (filter.since) {
        parameters.emplace_back(*filter.since);
        // The first id of that time, found by its index, bounds the search; the time itself tells where the
        // clock was set back.
        condition = "id > max(?1, (SELECT min(+id) FROM updates WHERE begun >= ?2) - 1) AND begun >= ?2";
    }
    if (!filter.adapter.empty()) {
        parameters.emplace_back(filter.adapter);
        const std::string place = " = ?" + std::to_string(parameters.size());
        condition += " AND (adapter" + place + " OR pci_address" + place + ")";
    }
    if (filter.failedOnly) condition += " AND outcome NOT IN ('running', 'written')";
    condition += std::string(" ORDER BY id") + (filter.after ? "" : " DESC");
    std::vector<Record> found = select(condition + " LIMIT " + std::to_string(filter.most), parameters);
    for (Record& record : found)
        if (record.isRunning()) record.versionsAfter.clear();  // what the flash holds until it ends
    return found;
}

std::vector<Record> Store::running() {
    return select("outcome = 'running'");
}

std::vector<Record> Store::waiting() {
    return select(
        "outcome = 'written' AND active IS NULL AND id = (SELECT max(id) FROM updates AS later "
        "WHERE later.adapter = updates.adapter AND later.outcome = 'written')");
}

std::string openFolder(const std::string& path) {
    namespace fs = std::filesystem;
    fs::path asked = fs::absolute(path).lexically_normal();
    if (!asked.has_filename()) asked = asked.parent_path();
    // The folder itself may be no link, but there may be one on the way to it.
    for (const fs::path& each : {asked.parent_path(), asked})
        if (::mkdir(each.c_str(), S_IRWXU) != 0 && errno != EEXIST)
            throw std::system_error(errno, std::generic_category(),
                                    "cannot make the folder " + each.string());
    const std::string folder = (fs::canonical(asked.parent_path()) / asked.filename()).string();
    if (!os::closeFolderToOthers(folder)) throw HistoryError("cannot use the folder " + folder);
    return folder;
}

std::string moveAside(const std::string& folder) {
    const std::string path = Store::fileIn(folder);
    const std::string moved = path + ".damaged-" + std::to_string(os::getuSecondsSinceEpoch());
    std::error_code ignored;
    // The journal belongs to the file, and would spoil a new one.
    std::filesystem::rename(path + "-wal", moved + "-wal", ignored);
    std::filesystem::remove(path + "-shm", ignored);
    std::filesystem::rename(path, moved);
    return moved;
}

}  // namespace history
