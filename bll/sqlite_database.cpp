// The SQLite engine behind the Database interface.
#include <sqlite3.h>

#include <charconv>
#include <cmath>
#include <cstring>

#include "bll/database.h"

namespace pelta::bll {

namespace {

bool startsWithNoCase(std::string_view s, std::string_view prefix) noexcept {
    if (s.size() < prefix.size()) return false;
    for (size_t i = 0; i < prefix.size(); ++i) {
        char a = s[i], b = prefix[i];
        if (a >= 'a' && a <= 'z') a = static_cast<char>(a - 'a' + 'A');
        if (a != b) return false;
    }
    return true;
}

// "(n)" or "(p,s)" after a type name.
bool parseArgs(std::string_view rest, int& a, int& b, bool& hasB) noexcept {
    hasB = false;
    while (!rest.empty() && rest.front() == ' ')
        rest.remove_prefix(1);
    if (rest.empty() || rest.front() != '(') return false;
    rest.remove_prefix(1);
    auto num = [&](int& out) {
        while (!rest.empty() && rest.front() == ' ')
            rest.remove_prefix(1);
        auto [p, ec] = std::from_chars(rest.data(), rest.data() + rest.size(), out);
        if (ec != std::errc() || out < 0) return false;
        rest.remove_prefix(static_cast<size_t>(p - rest.data()));
        while (!rest.empty() && rest.front() == ' ')
            rest.remove_prefix(1);
        return true;
    };
    if (!num(a)) return false;
    if (!rest.empty() && rest.front() == ',') {
        rest.remove_prefix(1);
        if (!num(b)) return false;
        hasB = true;
    }
    return rest == ")";
}

// 10^n for n <= 18.
int64_t pow10(int n) noexcept {
    int64_t v = 1;
    while (n-- > 0)
        v *= 10;
    return v;
}

DbFailure failureOf(int extended) noexcept {
    switch (extended) {
        case SQLITE_CONSTRAINT_UNIQUE:
        case SQLITE_CONSTRAINT_PRIMARYKEY:
            return DbFailure::Unique;
        case SQLITE_CONSTRAINT_FOREIGNKEY:
            return DbFailure::ForeignKey;
        case SQLITE_CONSTRAINT_NOTNULL:
            return DbFailure::NotNull;
        case SQLITE_CONSTRAINT_CHECK:
            return DbFailure::Check;
        default:
            break;
    }
    if ((extended & 0xFF) == SQLITE_BUSY || (extended & 0xFF) == SQLITE_LOCKED)
        return DbFailure::Busy;
    return DbFailure::Other;
}

// "UNIQUE constraint failed: t.a, t.b" names the table and the columns.
void parseUniqueMessage(DbError& e) {
    std::string_view msg = e.description();
    size_t colon = msg.find(": ");
    if (colon == std::string_view::npos) return;
    std::string_view rest = msg.substr(colon + 2);
    if (rest.starts_with("index ")) return;
    std::string table;
    std::vector<std::string> columns;
    while (!rest.empty()) {
        size_t comma = rest.find(", ");
        std::string_view item = rest.substr(0, comma);
        size_t dot = item.find('.');
        if (dot == std::string_view::npos) return;
        table = item.substr(0, dot);
        columns.emplace_back(item.substr(dot + 1));
        if (comma == std::string_view::npos) break;
        rest.remove_prefix(comma + 2);
    }
    e.setConstraint(std::move(table), std::move(columns));
}

[[noreturn]] void fail(sqlite3* db, int rc) {
    int ext = db ? sqlite3_extended_errcode(db) : rc;
    std::string msg = db ? sqlite3_errmsg(db) : sqlite3_errstr(rc);
    DbError e(failureOf(ext), std::move(msg));
    if (e.failure() == DbFailure::Unique) parseUniqueMessage(e);
    throw e;
}

Variant decimalFromScaled(int64_t scaled, int scale) {
    bool neg = scaled < 0;
    uint64_t mag =
        neg ? uint64_t(0) - static_cast<uint64_t>(scaled) : static_cast<uint64_t>(scaled);
    return Variant(Decimal::fromParts(mag, 0, scale, neg));
}

class SqliteStatement final : public Statement {
public:
    SqliteStatement(sqlite3* db, sqlite3_stmt* st) : db_(db), st_(st) {}
    ~SqliteStatement() override { sqlite3_finalize(st_); }

    void bind(int index, const Variant& v) override {
        int rc = SQLITE_OK;
        switch (v.type()) {
            case VarType::Empty:
            case VarType::Null:
            case VarType::Missing:
                rc = sqlite3_bind_null(st_, index);
                break;
            case VarType::Boolean:
                rc = sqlite3_bind_int(st_, index, v.rawBool() ? 1 : 0);
                break;
            case VarType::Byte:
            case VarType::Integer:
            case VarType::Long:
            case VarType::Currency:
                rc = v.type() == VarType::Currency ? sqlite3_bind_int64(st_, index, v.rawCurrency())
                                                   : sqlite3_bind_int64(st_, index, v.toInt64());
                break;
            case VarType::Double:
            case VarType::Date:
                rc = sqlite3_bind_double(st_, index, v.rawDouble());
                break;
            case VarType::String:
                bindText(index, v.str());
                return;
            case VarType::Bytes: {
                const Bytes& b = v.bytes();
                rc = sqlite3_bind_blob64(st_, index, b.data(), b.size(), SQLITE_TRANSIENT);
                break;
            }
            case VarType::Decimal:
                raise(errc::InvalidProcedureCall,
                      "A decimal value is bound with the type of its column", "Database");
            default:
                raise(errc::TypeMismatch, "Value of kind " + typeName(v) + " cannot be bound",
                      "Database");
        }
        if (rc != SQLITE_OK) fail(db_, rc);
    }

    void bind(int index, const Variant& v, const ColumnType& as) override {
        if (v.isEmpty() || v.isNull() || v.isMissing()) return bindNull(index);
        switch (as.field) {
            case FieldType::Boolean:
                return bindInt64(index, v.toBool() ? 1 : 0);
            case FieldType::Long:
                return bindInt64(index, v.toLong());
            case FieldType::Decimal: {
                Decimal d = v.toDecimal().round(as.scale);
                Decimal scaled = d * Decimal(pow10(as.scale));
                return bindInt64(index, scaled.toInt64());
            }
            case FieldType::Date: {
                double oa = v.toDate().oa;
                if (as.dateOnly) oa = std::floor(oa);
                int rc = sqlite3_bind_double(st_, index, oa);
                if (rc != SQLITE_OK) fail(db_, rc);
                return;
            }
            case FieldType::Double: {
                int rc = sqlite3_bind_double(st_, index, v.toDouble());
                if (rc != SQLITE_OK) fail(db_, rc);
                return;
            }
            case FieldType::Binary:
                if (v.isBytes()) return bind(index, v);
                return bindText(index, v.toString());
            case FieldType::Currency:
                return bindInt64(index, v.toCurrency().scaled);
            default:
                return bindText(index, v.toString());
        }
    }

    void bind(std::string_view name, const Variant& v) override {
        bind(parameterIndexChecked(name), v);
    }
    void bindText(int index, std::string_view s) override {
        int rc = sqlite3_bind_text64(st_, index, s.data(), s.size(), SQLITE_TRANSIENT, SQLITE_UTF8);
        if (rc != SQLITE_OK) fail(db_, rc);
    }
    void bindInt64(int index, int64_t v) override {
        int rc = sqlite3_bind_int64(st_, index, v);
        if (rc != SQLITE_OK) fail(db_, rc);
    }
    void bindNull(int index) override {
        int rc = sqlite3_bind_null(st_, index);
        if (rc != SQLITE_OK) fail(db_, rc);
    }
    int parameterIndex(std::string_view name) const override {
        return sqlite3_bind_parameter_index(st_, std::string(name).c_str());
    }

    bool step() override {
        int rc = sqlite3_step(st_);
        if (rc == SQLITE_ROW) return true;
        if (rc == SQLITE_DONE) return false;
        sqlite3_reset(st_);
        fail(db_, rc);
    }
    void reset() override { sqlite3_reset(st_); }
    void clearBindings() override { sqlite3_clear_bindings(st_); }

    int columnCount() const override { return sqlite3_column_count(st_); }
    std::string columnName(int c) const override {
        const char* n = sqlite3_column_name(st_, c);
        return n ? n : "";
    }
    std::string columnDeclType(int c) const override {
        const char* t = sqlite3_column_decltype(st_, c);
        return t ? t : "";
    }

    bool isNull(int c) const override { return sqlite3_column_type(st_, c) == SQLITE_NULL; }
    int64_t int64(int c) const override { return sqlite3_column_int64(st_, c); }
    double real(int c) const override { return sqlite3_column_double(st_, c); }
    std::string_view text(int c) const override {
        auto* p = reinterpret_cast<const char*>(sqlite3_column_text(st_, c));
        if (!p) return {};
        return {p, static_cast<size_t>(sqlite3_column_bytes(st_, c))};
    }

    Variant value(int c, const ColumnType& as) const override {
        int kind = sqlite3_column_type(st_, c);
        if (kind == SQLITE_NULL) return Variant::null();
        switch (as.field) {
            case FieldType::Boolean:
                return Variant(sqlite3_column_int64(st_, c) != 0);
            case FieldType::Long:
                return Variant(static_cast<int32_t>(sqlite3_column_int64(st_, c)));
            case FieldType::Decimal:
                if (kind == SQLITE_INTEGER)
                    return decimalFromScaled(sqlite3_column_int64(st_, c), as.scale);
                return Variant(Decimal::fromDouble(sqlite3_column_double(st_, c)));
            case FieldType::Date:
                return Variant(Date{sqlite3_column_double(st_, c)});
            case FieldType::Double:
                return Variant(sqlite3_column_double(st_, c));
            case FieldType::Currency:
                return Variant(Currency{sqlite3_column_int64(st_, c)});
            case FieldType::Binary: {
                auto* p = static_cast<const uint8_t*>(sqlite3_column_blob(st_, c));
                int n = sqlite3_column_bytes(st_, c);
                return Variant(Bytes(p, p + n));
            }
            default:
                return Variant(std::string(text(c)));
        }
    }

    Variant value(int c) const override {
        switch (sqlite3_column_type(st_, c)) {
            case SQLITE_NULL:
                return Variant::null();
            case SQLITE_INTEGER:
                return Variant::fromInt64(sqlite3_column_int64(st_, c));
            case SQLITE_FLOAT:
                return Variant(sqlite3_column_double(st_, c));
            case SQLITE_BLOB: {
                auto* p = static_cast<const uint8_t*>(sqlite3_column_blob(st_, c));
                int n = sqlite3_column_bytes(st_, c);
                return Variant(Bytes(p, p + n));
            }
            default:
                return Variant(std::string(text(c)));
        }
    }

private:
    int parameterIndexChecked(std::string_view name) const {
        int i = parameterIndex(name);
        if (i == 0)
            raise(errc::InvalidProcedureCall, "No parameter " + std::string(name), "Database");
        return i;
    }

    sqlite3* db_;
    sqlite3_stmt* st_;
};

class SqliteDatabase final : public Database {
public:
    explicit SqliteDatabase(sqlite3* db) : db_(db) {}
    ~SqliteDatabase() override {
        if (inTx_) rollback();
        sqlite3_close_v2(db_);
    }

    std::unique_ptr<Statement> prepare(std::string_view sql) override {
        sqlite3_stmt* st = nullptr;
        int rc = sqlite3_prepare_v3(db_, sql.data(), static_cast<int>(sql.size()),
                                    SQLITE_PREPARE_PERSISTENT, &st, nullptr);
        if (rc != SQLITE_OK) fail(db_, rc);
        if (!st) raise(errc::InvalidProcedureCall, "Empty statement", "Database");
        return std::make_unique<SqliteStatement>(db_, st);
    }

    void execute(std::string_view sql) override {
        std::string text(sql);
        char* err = nullptr;
        int rc = sqlite3_exec(db_, text.c_str(), nullptr, nullptr, &err);
        if (rc != SQLITE_OK) {
            std::string msg = err ? err : sqlite3_errstr(rc);
            sqlite3_free(err);
            throw DbError(failureOf(sqlite3_extended_errcode(db_)), std::move(msg));
        }
    }

    void begin(bool write) override {
        if (inTx_) raise(errc::InvalidProcedureCall, "Transaction already open", "Database");
        execute(write ? "BEGIN IMMEDIATE" : "BEGIN");
        inTx_ = true;
    }
    void commit() override {
        execute("COMMIT");
        inTx_ = false;
    }
    void rollback() noexcept override {
        if (!sqlite3_get_autocommit(db_)) sqlite3_exec(db_, "ROLLBACK", nullptr, nullptr, nullptr);
        inTx_ = false;
    }
    bool inTransaction() const noexcept override { return inTx_; }

    int64_t changes() const override { return sqlite3_changes64(db_); }

    std::vector<std::string> tables() override {
        auto st = prepare(
            "SELECT name FROM sqlite_schema WHERE type = 'table' AND name NOT LIKE 'sqlite\\_%' "
            "ESCAPE '\\' ORDER BY name");
        std::vector<std::string> out;
        while (st->step())
            out.emplace_back(st->text(0));
        return out;
    }

    std::vector<TableColumn> columns(std::string_view table) override {
        auto st =
            prepare("SELECT name, type, \"notnull\", pk, dflt_value FROM pragma_table_info(?1)");
        st->bindText(1, table);
        std::vector<TableColumn> out;
        while (st->step()) {
            TableColumn c;
            c.name = st->text(0);
            c.declared = st->text(1);
            c.type = ColumnType::parse(c.declared).value_or(ColumnType{});
            c.notNull = st->int64(2) != 0;
            c.primaryKey = st->int64(3) != 0;
            if (!st->isNull(4)) c.defaultValue = st->text(4);
            out.push_back(std::move(c));
        }
        return out;
    }

    std::vector<ForeignKey> foreignKeysOf(std::string_view table) override {
        auto st = prepare(
            "SELECT \"from\", \"table\", \"to\", on_delete FROM pragma_foreign_key_list(?1)");
        st->bindText(1, table);
        std::vector<ForeignKey> out;
        while (st->step()) {
            ForeignKey fk;
            fk.table = table;
            fk.column = st->text(0);
            fk.refTable = st->text(1);
            fk.refColumn = st->isNull(2) ? std::string("ID") : std::string(st->text(2));
            std::string_view action = st->text(3);
            fk.cascades = action == "CASCADE" || action == "SET NULL" || action == "SET DEFAULT";
            out.push_back(std::move(fk));
        }
        return out;
    }

    std::string quote(std::string_view id) const override {
        std::string q = "\"";
        for (char ch : id) {
            if (ch == '"') q += '"';
            q += ch;
        }
        q += '"';
        return q;
    }

private:
    sqlite3* db_;
    bool inTx_ = false;
};

}  // namespace

std::optional<ColumnType> ColumnType::parse(std::string_view d) noexcept {
    ColumnType t;
    int a = 0, b = 0;
    bool hasB = false;
    auto is = [&](std::string_view name) {
        return d.size() == name.size() && startsWithNoCase(d, name);
    };
    if (is("GUID")) {
        t.field = FieldType::Guid;
    } else if (startsWithNoCase(d, "VARCHAR")) {
        if (!parseArgs(d.substr(7), a, b, hasB) || hasB) return std::nullopt;
        t.field = FieldType::Text;
        t.size = static_cast<uint32_t>(a);
    } else if (is("TEXT")) {
        t.field = FieldType::Text;
    } else if (is("LONGTEXT")) {
        t.field = FieldType::LongText;
    } else if (is("INTEGER") || is("INT")) {
        t.field = FieldType::Long;
    } else if (is("BOOLEAN")) {
        t.field = FieldType::Boolean;
    } else if (is("DATE")) {
        t.field = FieldType::Date;
        t.dateOnly = true;
    } else if (is("DATETIME")) {
        t.field = FieldType::Date;
    } else if (startsWithNoCase(d, "DECIMAL")) {
        if (!parseArgs(d.substr(7), a, b, hasB) || !hasB) return std::nullopt;
        if (a < 1 || a > 18 || b > a) return std::nullopt;
        t.field = FieldType::Decimal;
        t.precision = static_cast<uint8_t>(a);
        t.scale = static_cast<uint8_t>(b);
    } else if (is("DOUBLE") || is("REAL")) {
        t.field = FieldType::Double;
    } else if (is("BLOB")) {
        t.field = FieldType::Binary;
    } else {
        return std::nullopt;
    }
    return t;
}

FieldDef ColumnType::fieldDef(std::string name) const {
    FieldDef f;
    f.name = std::move(name);
    f.type = field;
    f.definedSize = size;
    f.precision = precision;
    f.scale = scale;
    return f;
}

DbError::DbError(DbFailure failure, std::string message)
    : Error(errc::Fail, "Database", std::move(message)), failure_(failure) {}

void DbError::setConstraint(std::string table, std::vector<std::string> columns) {
    table_ = std::move(table);
    columns_ = std::move(columns);
}

std::vector<ForeignKey> Database::foreignKeysTo(std::string_view table) {
    std::vector<ForeignKey> out;
    for (const std::string& t : tables()) {
        for (ForeignKey& fk : foreignKeysOf(t)) {
            if (sqlite3_stricmp(fk.refTable.c_str(), std::string(table).c_str()) == 0)
                out.push_back(std::move(fk));
        }
    }
    return out;
}

std::unique_ptr<Database> openSqlite(const std::string& path, int busyTimeoutMs) {
    sqlite3* db = nullptr;
    int rc =
        sqlite3_open_v2(path.c_str(), &db,
                        SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_NOMUTEX, nullptr);
    if (rc != SQLITE_OK) {
        std::string msg = db ? sqlite3_errmsg(db) : sqlite3_errstr(rc);
        sqlite3_close_v2(db);
        throw DbError(DbFailure::Other, "Cannot open database " + path + ": " + msg);
    }
    sqlite3_extended_result_codes(db, 1);
    sqlite3_busy_timeout(db, busyTimeoutMs);
    auto out = std::make_unique<SqliteDatabase>(db);
    out->execute("PRAGMA foreign_keys = ON");
    auto st = out->prepare("PRAGMA journal_mode = WAL");
    st->step();
    st.reset();
    out->execute("PRAGMA synchronous = NORMAL");
    return out;
}

}  // namespace pelta::bll
