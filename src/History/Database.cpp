// SPDX-License-Identifier: Apache-2.0
#include "History/Database.h"

#include <sqlite3.h>

#include <utility>

namespace history {

namespace {

constexpr int kBusyTimeout = 30'000;  // ms that other writers are waited for
constexpr int kPrimaryCode = 0xFF;
constexpr std::size_t kMostIdle = 16;  // more texts than a front that keeps records uses

void require(int code, sqlite3* database) {
    if (code == SQLITE_OK) return;
    throw DatabaseError(code, database == nullptr ? sqlite3_errstr(code) : sqlite3_errmsg(database));
}

}  // namespace

bool DatabaseError::isDamage() const {
    const int primary = m_code & kPrimaryCode;
    return primary == SQLITE_CORRUPT || primary == SQLITE_NOTADB;
}

void Database::Close::operator()(sqlite3* database) const {
    sqlite3_close(database);
}

Database::Database(const std::string& path) {
    sqlite3* opened = nullptr;
    const int code = sqlite3_open_v2(
        path.c_str(), &opened, SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_NOFOLLOW, nullptr);
    m_database.reset(opened);
    require(code, opened);
    sqlite3_busy_timeout(opened, kBusyTimeout);
    // A schema that somebody has tampered with calls nothing, and damage shows instead of going on.
    execute("PRAGMA trusted_schema = OFF; PRAGMA cell_size_check = ON; PRAGMA synchronous = FULL");
    // A daemon keeps its connection for good. Unless told, each keeps two MiB of pages, which the system's
    // own cache has as well.
    execute("PRAGMA cache_size = -256");
}

void Database::execute(const std::string& sql) {
    require(sqlite3_exec(m_database.get(), sql.c_str(), nullptr, nullptr, nullptr), m_database.get());
}

void Database::syncEachChange(bool wanted) {
    if (wanted == m_syncsEachChange) return;
    execute(wanted ? "PRAGMA synchronous = FULL" : "PRAGMA synchronous = NORMAL");
    m_syncsEachChange = wanted;
}

std::int64_t Database::number(const std::string& sql) {
    Statement statement(*this, sql);
    return statement.step() ? statement.number(0).value_or(0) : 0;
}

std::string Database::text(const std::string& sql) {
    Statement statement(*this, sql);
    return statement.step() ? statement.text(0) : "";
}

std::int64_t Database::lastId() const {
    return sqlite3_last_insert_rowid(m_database.get());
}

int Database::changes() const {
    return sqlite3_changes(m_database.get());
}

void Database::Finalize::operator()(sqlite3_stmt* statement) const {
    sqlite3_finalize(statement);
}

Database::Prepared Database::take(const std::string& sql) {
    if (auto idle = m_idle.extract(sql)) return std::move(idle.mapped());
    sqlite3_stmt* prepared = nullptr;
    require(sqlite3_prepare_v2(m_database.get(), sql.c_str(), -1, &prepared, nullptr), m_database.get());
    return Prepared(prepared);
}

void Database::giveBack(const std::string& sql, Prepared statement) noexcept try {
    // One that has failed is not used again.
    if (m_idle.size() >= kMostIdle || sqlite3_reset(statement.get()) != SQLITE_OK) return;
    sqlite3_clear_bindings(statement.get());
    m_idle.try_emplace(sql, std::move(statement));
} catch (const std::bad_alloc&) {
    // It is prepared anew the next time.
}

Statement::Statement(Database& database, std::string sql)
    : m_database(database), m_sql(std::move(sql)), m_statement(database.take(m_sql)) {}

Statement::~Statement() {
    m_database.giveBack(m_sql, std::move(m_statement));
}

void Statement::bind(int parameter, std::int64_t number) {
    require(sqlite3_bind_int64(m_statement.get(), parameter, number), m_database.m_database.get());
}

void Statement::bind(int parameter, const std::string& text) {
    if (text.empty()) return;
    require(sqlite3_bind_text64(m_statement.get(), parameter, text.data(), text.size(), SQLITE_TRANSIENT,
                                SQLITE_UTF8),
            m_database.m_database.get());
}

void Statement::bind(int parameter, const std::optional<std::int64_t>& number) {
    if (number) bind(parameter, *number);
}

bool Statement::step() {
    const int code = sqlite3_step(m_statement.get());
    if (code == SQLITE_ROW) return true;
    if (code != SQLITE_DONE) require(code, m_database.m_database.get());
    return false;
}

std::optional<std::int64_t> Statement::number(int column) const {
    if (sqlite3_column_type(m_statement.get(), column) == SQLITE_NULL) return std::nullopt;
    return sqlite3_column_int64(m_statement.get(), column);
}

std::string Statement::text(int column) const {
    const unsigned char* text = sqlite3_column_text(m_statement.get(), column);
    const auto length = static_cast<std::size_t>(sqlite3_column_bytes(m_statement.get(), column));
    return text == nullptr ? "" : std::string(reinterpret_cast<const char*>(text), length);
}

Transaction::Transaction(Database& database) : m_database(database) {
    // At once for writing: one that begins as a reader cannot wait for its turn.
    Statement(m_database, "BEGIN IMMEDIATE").step();
}

Transaction::~Transaction() {
    if (!m_isOpen) return;
    try {
        m_database.execute("ROLLBACK");
    } catch (const DatabaseError&) {
        // SQLite has done so by itself where the failure was one of the file.
    }
}

void Transaction::commit() {
    Statement(m_database, "COMMIT").step();
    m_isOpen = false;
}

}  // namespace history
