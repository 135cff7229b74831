// Data access of the business-logic service: a database connection and its
// prepared statements, independent of the engine behind them. Operations see
// only these interfaces, so that another engine (a server database for many
// workstations) can be added beside SQLite without touching them.
//
// Column types. Tables declare their columns with the names below; the
// declared type decides the recordset field a value becomes and how a value is
// stored:
//   GUID            key text "{XXXXXXXX-...}"        -> FieldType::Guid
//   VARCHAR(n)      text of at most n characters      -> Text(n)
//   TEXT            text                              -> Text (unlimited)
//   LONGTEXT        long text                         -> LongText
//   INTEGER         32-bit integer                    -> Long
//   BOOLEAN         0 / 1                             -> Boolean
//   DATE            whole day, OLE Automation date    -> Date
//   DATETIME        OLE Automation date and time      -> Date
//   DECIMAL(p,s)    exact decimal, p <= 18            -> Decimal(p,s)
//   DOUBLE          binary floating point             -> Double
//   BLOB            bytes                             -> Binary
// How a DECIMAL is kept is the engine's business (SQLite: an integer scaled by
// 10^s, so that values stay exact, compare and sum exactly).
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "platform/automation/error.h"
#include "platform/automation/variant.h"
#include "platform/data/recordset.h"

namespace pelta::bll {

// A column type as declared, parsed.
struct ColumnType {
    FieldType field = FieldType::Text;
    uint32_t size = 0;      // VARCHAR(n)
    uint8_t precision = 0;  // DECIMAL(p,s)
    uint8_t scale = 0;
    bool dateOnly = false;  // DATE: stored values are whole days

    // Parses a declared type; nullopt for names outside the list above.
    static std::optional<ColumnType> parse(std::string_view declared) noexcept;
    FieldDef fieldDef(std::string name) const;
};

// Why a statement failed, as far as the service needs to tell.
enum class DbFailure : uint8_t {
    Other,
    Unique,      // a UNIQUE or PRIMARY KEY constraint
    ForeignKey,  // a FOREIGN KEY constraint
    NotNull,
    Check,
    Busy,  // locked by another connection beyond the wait time
};

// A failed database call. Number errc::Fail, source "Database"; the
// description is the engine's own message.
class DbError : public Error {
public:
    DbError(DbFailure failure, std::string message);
    DbFailure failure() const noexcept { return failure_; }
    // For Unique: the table and the columns of the violated constraint, as
    // far as the engine tells them.
    const std::string& table() const noexcept { return table_; }
    const std::vector<std::string>& columns() const noexcept { return columns_; }
    void setConstraint(std::string table, std::vector<std::string> columns);

private:
    DbFailure failure_;
    std::string table_;
    std::vector<std::string> columns_;
};

// A prepared statement. Parameter indexes are 1-based, column indexes 0-based.
class Statement {
public:
    virtual ~Statement() = default;

    // Binds a value by its own kind: Empty and Null bind NULL, Boolean 0/1,
    // numbers as integers or doubles, Date as its OLE Automation number, texts
    // and bytes as themselves. A Decimal needs the column type (below).
    virtual void bind(int index, const Variant& value) = 0;
    // Binds a value for a column of type `as` (converting it as stored).
    virtual void bind(int index, const Variant& value, const ColumnType& as) = 0;
    virtual void bind(std::string_view name, const Variant& value) = 0;
    virtual void bindText(int index, std::string_view value) = 0;
    virtual void bindInt64(int index, int64_t value) = 0;
    virtual void bindNull(int index) = 0;
    virtual int parameterIndex(std::string_view name) const = 0;

    // Steps once: true while a row is there. Raises DbError.
    virtual bool step() = 0;
    // Back to before the first step; bindings stay.
    virtual void reset() = 0;
    virtual void clearBindings() = 0;

    virtual int columnCount() const = 0;
    virtual std::string columnName(int column) const = 0;
    // The declared type of a result column that is a plain table column;
    // empty for expressions.
    virtual std::string columnDeclType(int column) const = 0;

    // Values of the current row.
    virtual bool isNull(int column) const = 0;
    virtual int64_t int64(int column) const = 0;
    virtual double real(int column) const = 0;
    // Valid until the next step, reset or column call on the same column.
    virtual std::string_view text(int column) const = 0;
    // The value as a Variant of the column type `as`.
    virtual Variant value(int column, const ColumnType& as) const = 0;
    // The value by its storage kind (integer as Long or Decimal, real as
    // Double, text as String, bytes as Bytes, NULL as Null).
    virtual Variant value(int column) const = 0;
};

// A column of a table as the schema declares it.
struct TableColumn {
    std::string name;
    std::string declared;
    ColumnType type;
    bool notNull = false;
    bool primaryKey = false;
    // The declared default as SQL text (a literal); empty when none.
    std::string defaultValue;
};

// A foreign key: `table`.`column` refers to `refTable`.`refColumn`.
struct ForeignKey {
    std::string table;
    std::string column;
    std::string refTable;
    std::string refColumn;
    bool cascades = false;  // ON DELETE CASCADE or SET NULL: never blocks a delete
};

class Database {
public:
    virtual ~Database() = default;

    virtual std::unique_ptr<Statement> prepare(std::string_view sql) = 0;
    // Runs SQL text without parameters (several statements allowed); for
    // schema changes only.
    virtual void execute(std::string_view sql) = 0;

    // Transactions do not nest. A writing transaction takes the write lock at
    // once, so that two writers never deadlock half-way.
    virtual void begin(bool write) = 0;
    virtual void commit() = 0;
    virtual void rollback() noexcept = 0;
    virtual bool inTransaction() const noexcept = 0;

    // Rows changed by the last INSERT, UPDATE or DELETE.
    virtual int64_t changes() const = 0;

    // Schema.
    virtual std::vector<std::string> tables() = 0;
    virtual std::vector<TableColumn> columns(std::string_view table) = 0;
    // Foreign keys declared by `table`.
    virtual std::vector<ForeignKey> foreignKeysOf(std::string_view table) = 0;
    // Foreign keys of every table that refer to `table`.
    std::vector<ForeignKey> foreignKeysTo(std::string_view table);
    // The identifier quoted for use in SQL text (names come from the schema,
    // never from a request).
    virtual std::string quote(std::string_view identifier) const = 0;
};

// A transaction that rolls back unless committed.
class Transaction {
public:
    Transaction(Database& db, bool write) : db_(db) { db_.begin(write); }
    Transaction(const Transaction&) = delete;
    Transaction& operator=(const Transaction&) = delete;
    ~Transaction() {
        if (!done_) db_.rollback();
    }
    void commit() {
        db_.commit();
        done_ = true;
    }

private:
    Database& db_;
    bool done_ = false;
};

// Opens (creating when missing) an SQLite database file with foreign keys
// enforced, the WAL journal, and a wait of `busyTimeoutMs` for locks.
std::unique_ptr<Database> openSqlite(const std::string& path, int busyTimeoutMs = 5000);

}  // namespace pelta::bll
