// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>

struct sqlite3;
struct sqlite3_stmt;

namespace history {

/// A failure of SQLite, in its words.
class DatabaseError : public std::runtime_error {
  public:
    DatabaseError(int code, const std::string& what) : std::runtime_error(what), m_code(code) {}
    /// The file is no database, or a damaged one.
    bool isDamage() const;

  private:
    int m_code;
};

/// A connection to a database file. Used by one thread of one process. Operations throw DatabaseError.
class Database {
  public:
    /// The file has to be there, may be empty, and must not be reached over a link.
    explicit Database(const std::string& path);

    void execute(const std::string& sql);
    /// Whether each change is on the medium when it ends, as it is at first, or only soon after: the power
    /// may take it then, but the death of this process does not, and either all of it is there or nothing.
    /// The next change that is on the medium brings those before it there.
    void syncEachChange(bool wanted);
    /// The first column of the first row; 0 without one.
    std::int64_t number(const std::string& sql);
    std::string text(const std::string& sql);
    std::int64_t lastId() const;
    /// How many rows the last statement changed.
    int changes() const;

  private:
    friend class Statement;
    struct Close {
        void operator()(sqlite3* database) const;
    };
    struct Finalize {
        void operator()(sqlite3_stmt* statement) const;
    };
    using Prepared = std::unique_ptr<sqlite3_stmt, Finalize>;

    Prepared take(const std::string& sql);
    void giveBack(const std::string& sql, Prepared statement) noexcept;

    std::unique_ptr<sqlite3, Close> m_database;
    bool m_syncsEachChange = true;
    /// Those that nobody uses, by their texts: to read a text takes longer than to carry it out. SQLite reads
    /// one again by itself when the schema has changed.
    std::map<std::string, Prepared> m_idle;
};

/// A statement with its parameters, which are counted from 1, as columns are from 0.
class Statement {
  public:
    Statement(Database& database, std::string sql);
    ~Statement();
    Statement(const Statement&) = delete;
    Statement& operator=(const Statement&) = delete;

    void bind(int parameter, std::int64_t number);
    void bind(int parameter, const std::string& text);  ///< an empty one as no value
    void bind(int parameter, const std::optional<std::int64_t>& number);

    /// The next row; false when there is none.
    bool step();
    std::optional<std::int64_t> number(int column) const;
    std::string text(int column) const;

  private:
    Database& m_database;
    std::string m_sql;
    Database::Prepared m_statement;
};

/// Either all changes of a scope, or none: without commit() none.
class Transaction {
  public:
    /// Waits for other writers, within bounds.
    explicit Transaction(Database& database);
    ~Transaction();
    Transaction(const Transaction&) = delete;
    Transaction& operator=(const Transaction&) = delete;
    void commit();

  private:
    Database& m_database;
    bool m_isOpen = true;
};

}  // namespace history
