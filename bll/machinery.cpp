// Shared machinery of the operations: reading lists and records into
// recordsets, writing recordsets back by row status, deleting by key, and
// turning constraint failures of the database into refusals.
#include <algorithm>
#include <cctype>
#include <map>
#include <mutex>

#include "bll/operations.h"
#include "platform/automation/guid.h"

namespace pelta::bll {

namespace {

bool sameName(std::string_view a, std::string_view b) noexcept {
    if (a.size() != b.size()) return false;
    for (size_t i = 0; i < a.size(); ++i) {
        if (std::tolower(static_cast<unsigned char>(a[i])) !=
            std::tolower(static_cast<unsigned char>(b[i])))
            return false;
    }
    return true;
}

bool isAuditColumn(std::string_view name) noexcept {
    return sameName(name, "CU") || sameName(name, "CD") || sameName(name, "LU") ||
           sameName(name, "LD");
}

std::map<std::string, ListDef, std::less<>>& listTable() {
    static std::map<std::string, ListDef, std::less<>> lists;
    return lists;
}

// The shape of a result column without a declared type, from its first value.
FieldDef fieldFromValue(std::string name, const Variant& v) {
    FieldDef f;
    f.name = std::move(name);
    switch (v.type()) {
        case VarType::Long:
            f.type = FieldType::Long;
            break;
        case VarType::Decimal:
            f.type = FieldType::Decimal;
            break;
        case VarType::Double:
            f.type = FieldType::Double;
            break;
        case VarType::Bytes:
            f.type = FieldType::Binary;
            break;
        default:
            f.type = FieldType::Text;
            break;
    }
    return f;
}

bool isBlankKey(const Variant& v) {
    return v.isEmpty() || v.isNull() || (v.isString() && v.str().empty());
}

Variant rowValue(Recordset& rs, int field, bool deleted) {
    if (field < 0) return Variant::null();
    return deleted ? rs.originalValue(static_cast<size_t>(field))
                   : rs.value(static_cast<size_t>(field));
}

// A refusal for a unique constraint: 10 for the code, 11 for the name, 20
// for any other set of columns.
Refusal uniqueRefusal(const DbError& e, const std::string& table, const Variant& rowId) {
    const auto& cols = e.columns();
    int32_t code = bllerr::DuplicateValues;
    if (cols.size() == 1 && sameName(cols[0], "Code")) code = bllerr::DuplicateCode;
    if (cols.size() == 1 && sameName(cols[0], "Name")) code = bllerr::DuplicateName;
    Refusal r(code);
    std::string columns;
    for (const auto& c : cols)
        columns += (columns.empty() ? "" : ", ") + c;
    r.with("BllTable", e.table().empty() ? table : e.table())
        .with("BllColumn", columns)
        .with("BllSqlError", std::string(e.description()));
    if (!isBlankKey(rowId)) r.with("BllRowID", rowId);
    return r;
}

// Which reference of a row being written points nowhere.
Refusal brokenLinkRefusal(Database& db, const DbError& e, const std::string& table,
                          const std::vector<std::pair<std::string, Variant>>& values,
                          const Variant& rowId) {
    Refusal r(bllerr::ExistingLinks);
    for (const ForeignKey& fk : db.foreignKeysOf(table)) {
        auto it = std::find_if(values.begin(), values.end(),
                               [&](const auto& p) { return sameName(p.first, fk.column); });
        if (it == values.end() || isBlankKey(it->second)) continue;
        auto st = db.prepare("SELECT 1 FROM " + db.quote(fk.refTable) + " WHERE " +
                             db.quote(fk.refColumn) + " = ?1");
        st->bind(1, it->second.isString() ? it->second : Variant(it->second.toString()));
        if (!st->step()) {
            r.with("BllTable", fk.refTable).with("BllColumn", fk.column);
            break;
        }
    }
    r.with("BllSqlError", std::string(e.description()));
    if (!isBlankKey(rowId)) r.with("BllRowID", rowId);
    return r;
}

// Which table still refers to the record of `key`.
Refusal existingLinksRefusal(Database& db, const DbError& e, const std::string& table,
                             const std::string& key) {
    Refusal r(bllerr::ExistingLinks);
    for (const ForeignKey& fk : db.foreignKeysTo(table)) {
        if (fk.cascades) continue;
        auto st = db.prepare("SELECT 1 FROM " + db.quote(fk.table) + " WHERE " +
                             db.quote(fk.column) + " = ?1 LIMIT 1");
        st->bindText(1, key);
        if (st->step()) {
            // The referred column names the kind of link: "ID" reads as links
            // from the table named.
            r.with("BllTable", fk.table).with("BllColumn", fk.refColumn);
            break;
        }
    }
    r.with("BllSqlError", std::string(e.description())).with("BllRowID", key);
    return r;
}

}  // namespace

// --- Context and registry ---------------------------------------------------

void OperationContext::require(std::string_view screen, int32_t flag) const {
    if ((rightsOf(screen) & flag) != flag) throw Refusal(bllerr::NoRights);
}

std::string OperationContext::text(std::string_view name) const {
    Variant v = request.readProperty(name);
    if (v.isEmpty() || v.isNull()) return {};
    return v.toString();
}

bool OperationContext::flag(std::string_view name) const {
    Variant v = request.readProperty(name);
    if (v.isEmpty() || v.isNull()) return false;
    return v.toBool();
}

Ref<Recordset> OperationContext::recordset(std::string_view name) const {
    Variant v = request.readProperty(name);
    if (!v.isObject()) return {};
    return Ref<Recordset>(query<Recordset>(v.object()));
}

void OperationRegistry::add(std::string name, OperationFn fn, bool writes) {
    ops_[std::move(name)] = OperationDef{fn, writes};
}

const OperationDef* OperationRegistry::find(std::string_view name) const {
    auto it = ops_.find(std::string(name));
    return it == ops_.end() ? nullptr : &it->second;
}

const OperationRegistry& operations() {
    static const OperationRegistry registry = [] {
        OperationRegistry r;
        registerSecurityOperations(r);
        registerCurrencyOperations(r);
        registerPartnerOperations(r);
        registerItemOperations(r);
        return r;
    }();
    return registry;
}

// --- Lists ------------------------------------------------------------------

void registerList(std::string screen, ListDef def) {
    listTable()[std::move(screen)] = std::move(def);
}

const ListDef* findList(std::string_view screen) {
    operations();  // lists are registered with the operations
    auto& lists = listTable();
    auto it = lists.find(screen);
    return it == lists.end() ? nullptr : &it->second;
}

FieldDef field(const char* name, FieldType type) {
    FieldDef f;
    f.name = name;
    f.type = type;
    return f;
}

Ref<Recordset> emptyList(std::initializer_list<FieldDef> fields) {
    auto rs = makeRef<Recordset>();
    for (const FieldDef& f : fields)
        rs->appendField(f);
    rs->open();
    return rs;
}

bool isBlank(const Variant& v) {
    if (v.isEmpty() || v.isNull()) return true;
    if (!v.isString()) return false;
    return v.str().find_first_not_of(" \t") == std::string::npos;
}

std::string trimmed(const Variant& v) {
    if (isBlank(v)) return {};
    std::string s = v.toString();
    const size_t b = s.find_first_not_of(" \t");
    return s.substr(b, s.find_last_not_of(" \t") - b + 1);
}

Ref<Recordset> emptyKeyed() {
    return emptyList({field("ID", FieldType::Guid), field("Code", FieldType::Text),
                      field("Name", FieldType::Text)});
}

Ref<Recordset> readRecordset(Database& db, std::string_view sql, std::span<const Variant> params,
                             std::span<const FieldDef> fields) {
    auto st = db.prepare(sql);
    for (size_t i = 0; i < params.size(); ++i)
        st->bind(static_cast<int>(i + 1), params[i]);

    const int n = st->columnCount();
    std::vector<ColumnType> types(static_cast<size_t>(n));
    std::vector<bool> typed(static_cast<size_t>(n), false);
    auto rs = makeRef<Recordset>();
    bool hasRow = st->step();
    for (int c = 0; c < n; ++c) {
        std::string name = st->columnName(c);
        auto given = std::find_if(fields.begin(), fields.end(),
                                  [&](const FieldDef& f) { return sameName(f.name, name); });
        if (given != fields.end()) {
            FieldDef f = *given;
            f.name = name;
            types[c].field = f.type;
            types[c].size = f.definedSize;
            types[c].precision = f.precision;
            types[c].scale = f.scale;
            typed[c] = true;
            rs->appendField(std::move(f));
            continue;
        }
        if (auto t = ColumnType::parse(st->columnDeclType(c))) {
            types[c] = *t;
            typed[c] = true;
            rs->appendField(t->fieldDef(std::move(name)));
            continue;
        }
        FieldDef f = fieldFromValue(std::move(name), hasRow ? st->value(c) : Variant());
        types[c].field = f.type;
        rs->appendField(std::move(f));
    }
    rs->open();
    while (hasRow) {
        rs->addNew();
        for (int c = 0; c < n; ++c) {
            if (st->isNull(c)) continue;  // a new row starts as Nulls
            rs->setValue(static_cast<size_t>(c), typed[c] ? st->value(c, types[c]) : st->value(c));
        }
        rs->update();
        hasRow = st->step();
    }
    rs->updateBatch();
    if (rs->recordCount() > 0) rs->moveFirst();
    return rs;
}

Ref<Recordset> readList(Database& db, const ListDef& list) {
    std::string sql = list.select;
    if (!list.orderBy.empty()) sql += " ORDER BY " + list.orderBy;
    return readRecordset(db, sql);
}

Ref<Recordset> readListRow(Database& db, const ListDef& list, const std::string& key) {
    Variant params[] = {Variant(key)};
    return readRecordset(db, list.select + " WHERE " + list.keyExpr + " = ?1", params);
}

void answerListResult(OperationContext& ctx, const std::string& key) {
    std::string screen = ctx.text("NeedList");
    if (screen.empty()) return;
    if (const ListDef* list = findList(screen))
        ctx.response.writeProperty("ListResult", Variant(readListRow(ctx.db, *list, key)));
}

// --- Writing ----------------------------------------------------------------

namespace {

struct WritePlan {
    std::vector<TableColumn> columns;
    // Recordset field -> table column, for the columns the rows carry.
    std::vector<std::pair<int, const TableColumn*>> mapped;
    std::vector<std::pair<const TableColumn*, Variant>> fixed;
    std::vector<const TableColumn*> derived;
    const TableColumn* key = nullptr;
    const TableColumn* ld = nullptr;
    int keyField = -1;
    int rowIdField = -1;
    int ldField = -1;
    bool audit = false;
};

const TableColumn* findColumn(const std::vector<TableColumn>& cols, std::string_view name) {
    for (const auto& c : cols) {
        if (sameName(c.name, name)) return &c;
    }
    return nullptr;
}

WritePlan planWrite(Database& db, Recordset& rs, const TableWrite& spec) {
    WritePlan p;
    p.columns = db.columns(spec.table);
    if (p.columns.empty()) raise(errc::InvalidProcedureCall, "No table " + spec.table, "Database");
    p.key = findColumn(p.columns, spec.key);
    if (!p.key) raise(errc::InvalidProcedureCall, "No key " + spec.key, "Database");
    p.keyField = rs.fieldIndex(spec.key);
    p.rowIdField = rs.fieldIndex(spec.rowIdField.empty() ? spec.key : spec.rowIdField);
    p.audit = spec.audit && findColumn(p.columns, "LD");
    p.ld = p.audit ? findColumn(p.columns, "LD") : nullptr;
    p.ldField = rs.fieldIndex("LD");
    for (const auto& [name, value] : spec.fixed) {
        const TableColumn* c = findColumn(p.columns, name);
        if (!c) raise(errc::InvalidProcedureCall, "No column " + name, "Database");
        p.fixed.emplace_back(c, value);
    }
    for (const std::string& name : spec.derived) {
        const TableColumn* c = findColumn(p.columns, name);
        if (!c) raise(errc::InvalidProcedureCall, "No column " + name, "Database");
        p.derived.push_back(c);
    }
    if (!spec.derived.empty() && !spec.derive)
        raise(errc::InvalidProcedureCall, "Derived columns without a rule", "Database");
    for (size_t f = 0; f < rs.fieldCount(); ++f) {
        const std::string& name = rs.fieldDef(f).name;
        std::string column = name;
        bool shadowed = false;
        for (const auto& [field, col] : spec.columnOf) {
            if (sameName(field, name)) column = col;
            // The stored name beside the field that maps to it: the field wins.
            if (sameName(col, name) && !sameName(field, name) && rs.fieldIndex(field) >= 0)
                shadowed = true;
        }
        if (shadowed) continue;
        const TableColumn* c = findColumn(p.columns, column);
        if (!c || c == p.key || (p.audit && isAuditColumn(c->name))) continue;
        auto isNamed = [&](const std::string& n) { return sameName(n, c->name); };
        if (std::any_of(spec.readOnly.begin(), spec.readOnly.end(), isNamed)) continue;
        if (std::any_of(p.fixed.begin(), p.fixed.end(),
                        [&](const auto& fx) { return fx.first == c; }) ||
            std::find(p.derived.begin(), p.derived.end(), c) != p.derived.end() ||
            std::any_of(p.mapped.begin(), p.mapped.end(),
                        [&](const auto& m) { return m.second == c; }))
            continue;
        p.mapped.emplace_back(static_cast<int>(f), c);
    }
    return p;
}

// The placeholder of a value for `c`: an empty value of a NOT NULL column
// with a declared default takes the default (schema text, never a request's).
std::string placeholder(const TableColumn& c, int index) {
    const std::string mark = "?" + std::to_string(index);
    if (!c.notNull || c.defaultValue.empty()) return mark;
    return "COALESCE(" + mark + ", " + c.defaultValue + ")";
}

// The scope condition with its placeholder numbered `index`; empty without a
// scope.
std::string scopeCondition(const TableWrite& spec, int index) {
    if (spec.scope.empty()) return {};
    std::string out = spec.scope;
    const std::string mark = "?" + std::to_string(index);
    for (size_t at = out.find("{}"); at != std::string::npos; at = out.find("{}", at))
        out.replace(at, 2, mark);
    return " AND (" + out + ")";
}

// The derived values of the current row, checked against the declared columns.
std::vector<Variant> derivedValues(const TableWrite& spec, const WritePlan& p, Recordset& rs) {
    if (p.derived.empty()) return {};
    std::vector<Variant> values = spec.derive(rs);
    if (values.size() != p.derived.size())
        raise(errc::InvalidProcedureCall, "Derived values do not match their columns", "Database");
    return values;
}

// Runs a write statement, turning constraint failures into refusals.
void runWrite(OperationContext& ctx, Statement& st, const TableWrite& spec,
              const std::vector<std::pair<std::string, Variant>>& values, const Variant& rowId) {
    try {
        st.step();
    } catch (const DbError& e) {
        if (e.failure() == DbFailure::Unique) throw uniqueRefusal(e, spec.table, rowId);
        if (e.failure() == DbFailure::ForeignKey)
            throw brokenLinkRefusal(ctx.db, e, spec.table, values, rowId);
        throw;
    }
}

Refusal concurrentChange(const TableWrite& spec, const Variant& rowId) {
    Refusal r(bllerr::ConcurrentChange);
    r.with("BllTable", spec.table)
        .with("BllSqlError", std::string("The row was changed or deleted by another user"));
    if (!isBlankKey(rowId)) r.with("BllRowID", rowId);
    return r;
}

// A new last-change time that differs from the one read, however close the
// two writes are.
Date nextLastChange(Date now, const Variant& readLd) {
    constexpr double kMillisecond = 1.0 / 86400000.0;
    if (readLd.type() == VarType::Date && now.oa <= readLd.rawDouble())
        return Date{readLd.rawDouble() + kMillisecond};
    return now;
}

}  // namespace

WriteResult writeRows(OperationContext& ctx, Recordset& rs, const TableWrite& spec) {
    WriteResult result;
    WritePlan p = planWrite(ctx.db, rs, spec);
    const ColumnType guidType = ColumnType::parse("GUID").value();
    const ColumnType stampType = ColumnType::parse("DATETIME").value();

    rs.setFilter(FilterGroup::Pending);
    auto forEach = [&](RowStatus wanted, auto&& fn) {
        if (rs.recordCount() == 0) return;
        for (rs.moveFirst(); !rs.eof(); rs.moveNext()) {
            if (rs.status() == wanted) fn();
        }
    };

    // Deleted rows.
    if (p.keyField >= 0 && spec.deletes) {
        auto del = ctx.db.prepare("DELETE FROM " + ctx.db.quote(spec.table) + " WHERE " +
                                  ctx.db.quote(p.key->name) + " = ?1" + scopeCondition(spec, 2));
        forEach(RowStatus::Deleted, [&] {
            Variant key = rowValue(rs, p.keyField, true);
            Variant rowId = rowValue(rs, p.rowIdField, true);
            del->reset();
            del->bind(1, key, p.key->type);
            if (!spec.scope.empty()) del->bind(2, spec.scopeValue);
            try {
                del->step();
            } catch (const DbError& e) {
                if (e.failure() == DbFailure::ForeignKey)
                    throw existingLinksRefusal(ctx.db, e, spec.table, key.toString());
                throw;
            }
            if (ctx.db.changes() == 0) throw concurrentChange(spec, rowId);
            result.changed = true;
        });
    }

    // Modified rows.
    if (spec.updates) {
        std::string sql = "UPDATE " + ctx.db.quote(spec.table) + " SET ";
        int n = 0;
        auto set = [&](const TableColumn* c, const std::string& col) {
            if (n) sql += ", ";
            ++n;
            sql += ctx.db.quote(col) + " = " + (c ? placeholder(*c, n) : "?" + std::to_string(n));
        };
        for (auto& m : p.mapped)
            set(m.second, m.second->name);
        for (auto& fx : p.fixed)
            set(fx.first, fx.first->name);
        for (const TableColumn* c : p.derived)
            set(c, c->name);
        if (p.audit) {
            set(nullptr, "LU");
            set(nullptr, "LD");
        }
        sql += " WHERE " + ctx.db.quote(p.key->name) + " = ?" + std::to_string(n + 1);
        const bool checkLd = spec.checkLastChange && p.ld && p.ldField >= 0;
        if (checkLd) sql += " AND " + ctx.db.quote(p.ld->name) + " IS ?" + std::to_string(n + 2);
        const int scopeIndex = n + (checkLd ? 3 : 2);
        sql += scopeCondition(spec, scopeIndex);
        std::unique_ptr<Statement> upd;
        forEach(RowStatus::Modified, [&] {
            if (!upd) upd = ctx.db.prepare(sql);
            upd->reset();
            std::vector<std::pair<std::string, Variant>> values;
            int i = 0;
            for (auto& [field, col] : p.mapped) {
                Variant v = rs.value(static_cast<size_t>(field));
                upd->bind(++i, v, col->type);
                values.emplace_back(col->name, std::move(v));
            }
            for (auto& [col, v] : p.fixed) {
                upd->bind(++i, v, col->type);
                values.emplace_back(col->name, v);
            }
            std::vector<Variant> derivedNow = derivedValues(spec, p, rs);
            for (size_t d = 0; d < p.derived.size(); ++d) {
                upd->bind(++i, derivedNow[d], p.derived[d]->type);
                values.emplace_back(p.derived[d]->name, derivedNow[d]);
            }
            Variant readLd =
                p.ldField >= 0 ? rs.originalValue(static_cast<size_t>(p.ldField)) : Variant::null();
            if (p.audit) {
                upd->bind(++i, Variant(ctx.userId), guidType);
                upd->bind(++i, Variant(nextLastChange(ctx.now, readLd)), stampType);
            }
            Variant key = p.keyField >= 0 ? rs.value(static_cast<size_t>(p.keyField)) : Variant();
            upd->bind(++i, key, p.key->type);
            if (checkLd) upd->bind(++i, readLd, stampType);
            if (!spec.scope.empty()) upd->bind(scopeIndex, spec.scopeValue);
            Variant rowId = rowValue(rs, p.rowIdField, false);
            runWrite(ctx, *upd, spec, values, rowId);
            if (ctx.db.changes() == 0) throw concurrentChange(spec, rowId);
            result.keys.push_back(key.toString());
            result.changed = true;
        });
    }

    // New rows.
    if (spec.inserts) {
        std::string cols, marks;
        int n = 0;
        auto add = [&](const TableColumn* c, const std::string& col) {
            if (n) {
                cols += ", ";
                marks += ", ";
            }
            ++n;
            cols += ctx.db.quote(col);
            marks += c ? placeholder(*c, n) : "?" + std::to_string(n);
        };
        add(nullptr, p.key->name);
        for (auto& m : p.mapped)
            add(m.second, m.second->name);
        for (auto& fx : p.fixed)
            add(fx.first, fx.first->name);
        for (const TableColumn* c : p.derived)
            add(c, c->name);
        if (p.audit) {
            for (const char* col : {"CU", "CD", "LU", "LD"})
                add(nullptr, col);
        }
        std::string sql =
            "INSERT INTO " + ctx.db.quote(spec.table) + " (" + cols + ") VALUES (" + marks + ")";
        std::unique_ptr<Statement> ins;
        forEach(RowStatus::New, [&] {
            if (!ins) ins = ctx.db.prepare(sql);
            ins->reset();
            Variant key = p.keyField >= 0 ? rs.value(static_cast<size_t>(p.keyField)) : Variant();
            if (isBlankKey(key)) key = Variant(newGuidString());
            std::vector<std::pair<std::string, Variant>> values;
            int i = 0;
            ins->bind(++i, key, p.key->type);
            for (auto& [field, col] : p.mapped) {
                Variant v = rs.value(static_cast<size_t>(field));
                ins->bind(++i, v, col->type);
                values.emplace_back(col->name, std::move(v));
            }
            for (auto& [col, v] : p.fixed) {
                ins->bind(++i, v, col->type);
                values.emplace_back(col->name, v);
            }
            std::vector<Variant> derivedNow = derivedValues(spec, p, rs);
            for (size_t d = 0; d < p.derived.size(); ++d) {
                ins->bind(++i, derivedNow[d], p.derived[d]->type);
                values.emplace_back(p.derived[d]->name, derivedNow[d]);
            }
            if (p.audit) {
                for (int k = 0; k < 2; ++k) {
                    ins->bind(++i, Variant(ctx.userId), guidType);
                    ins->bind(++i, Variant(ctx.now), stampType);
                }
            }
            Variant rowId = p.rowIdField == p.keyField ? key : rowValue(rs, p.rowIdField, false);
            runWrite(ctx, *ins, spec, values, rowId);
            result.keys.push_back(key.toString());
            result.changed = true;
        });
    }
    rs.clearFilter();
    return result;
}

void touchRow(OperationContext& ctx, Recordset& head, const TableWrite& spec) {
    int keyField = head.fieldIndex(spec.key);
    int ldField = head.fieldIndex("LD");
    if (keyField < 0 || head.recordCount() == 0) return;
    head.moveFirst();
    Variant key = head.value(static_cast<size_t>(keyField));
    Variant readLd =
        ldField >= 0 ? head.originalValue(static_cast<size_t>(ldField)) : Variant::null();
    std::string sql = "UPDATE " + ctx.db.quote(spec.table) + " SET LU = ?1, LD = ?2 WHERE " +
                      ctx.db.quote(spec.key) + " = ?3";
    if (spec.checkLastChange && ldField >= 0) sql += " AND LD IS ?4";
    auto st = ctx.db.prepare(sql);
    const ColumnType stampType = ColumnType::parse("DATETIME").value();
    st->bind(1, Variant(ctx.userId));
    st->bind(2, Variant(nextLastChange(ctx.now, readLd)), stampType);
    st->bind(3, key);
    if (spec.checkLastChange && ldField >= 0) st->bind(4, readLd, stampType);
    st->step();
    if (ctx.db.changes() == 0) throw concurrentChange(spec, key);
}

std::vector<std::string> splitKeys(std::string_view keys) {
    std::vector<std::string> out;
    while (!keys.empty()) {
        size_t sep = keys.find('\x01');
        std::string_view k = keys.substr(0, sep);
        if (!k.empty()) out.emplace_back(k);
        if (sep == std::string_view::npos) break;
        keys.remove_prefix(sep + 1);
    }
    return out;
}

void deleteByKeys(OperationContext& ctx, const std::string& table, const std::string& keyField) {
    auto st = ctx.db.prepare("DELETE FROM " + ctx.db.quote(table) + " WHERE " +
                             ctx.db.quote(keyField) + " = ?1");
    for (const std::string& key : splitKeys(ctx.text(keyField))) {
        st->reset();
        st->bindText(1, key);
        try {
            st->step();
        } catch (const DbError& e) {
            if (e.failure() == DbFailure::ForeignKey)
                throw existingLinksRefusal(ctx.db, e, table, key);
            throw;
        }
    }
}

}  // namespace pelta::bll
