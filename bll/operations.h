// Inside the service: the context an operation runs in, the registry of
// operations by name, refusals, and the shared machinery that keeps most
// operations a few lines long.
#pragma once

#include <cstdint>
#include <functional>
#include <initializer_list>
#include <span>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

#include "bll/database.h"
#include "platform/automation/variant.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace pelta::bll {

// Refusal codes answered as "BllError".
namespace bllerr {
inline constexpr int32_t DuplicateCode = 10;
inline constexpr int32_t DuplicateName = 11;
inline constexpr int32_t ConcurrentChange = 18;
inline constexpr int32_t ExistingLinks = 19;
inline constexpr int32_t DuplicateValues = 20;
inline constexpr int32_t NoRights = 24;
}  // namespace bllerr

// A refusal of the business logic: the operation's writes are rolled back and
// the response carries "BllError" and the texts set here.
class Refusal : public std::exception {
public:
    explicit Refusal(int32_t code) : code_(code) {}
    Refusal& with(std::string name, Variant value) {
        props_.emplace_back(std::move(name), std::move(value));
        return *this;
    }
    int32_t code() const noexcept { return code_; }
    const std::vector<std::pair<std::string, Variant>>& properties() const noexcept {
        return props_;
    }
    const char* what() const noexcept override { return "business-logic refusal"; }

private:
    int32_t code_;
    std::vector<std::pair<std::string, Variant>> props_;
};

struct OperationContext {
    Database& db;
    const PropertyBag& request;
    PropertyBag& response;
    std::string userId;
    Date now;
    // The rights flags of the current user on a screen.
    std::function<int32_t(std::string_view screen)> rightsOf;

    // Raises Refusal 24 unless the user holds `flag` on `screen`.
    void require(std::string_view screen, int32_t flag) const;
    // A request property as text ("" when missing or Null).
    std::string text(std::string_view name) const;
    bool flag(std::string_view name) const;
    // A recordset-valued request property, or null.
    Ref<Recordset> recordset(std::string_view name) const;
};

using OperationFn = void (*)(OperationContext&);

struct OperationDef {
    OperationFn fn = nullptr;
    bool writes = false;  // runs in a writing transaction
};

// Operations by name (compared exactly, as the callers spell them).
class OperationRegistry {
public:
    void add(std::string name, OperationFn fn, bool writes);
    const OperationDef* find(std::string_view name) const;

private:
    std::unordered_map<std::string, OperationDef> ops_;
};

// Every operation of the service.
const OperationRegistry& operations();

// Registration by area (one function per source file).
void registerSecurityOperations(OperationRegistry& r);
void registerCurrencyOperations(OperationRegistry& r);
void registerPartnerOperations(OperationRegistry& r);
void registerItemOperations(OperationRegistry& r);
void registerItemDetailOperations(OperationRegistry& r);
void registerItemPricingOperations(OperationRegistry& r);

// --- Lists ---------------------------------------------------------------

// A list a screen shows: its SELECT (without WHERE/ORDER BY), the key
// expression for refreshing one row, and the order.
struct ListDef {
    std::string select;
    std::string keyExpr;
    std::string orderBy;
};
// Lists by screen name ("ctxRatios"), for "NeedList".
void registerList(std::string screen, ListDef def);
const ListDef* findList(std::string_view screen);

// Runs `sql` with `params` bound by position and reads every row into an open
// recordset. Fields follow the declared types of the result columns;
// `fields` gives the shape of columns that are expressions (matched by name).
// Rows come back unmodified.
// An empty, open recordset of the given shape: what a list whose table belongs
// to another part of the system answers.
FieldDef field(const char* name, FieldType type);
Ref<Recordset> emptyList(std::initializer_list<FieldDef> fields);
// An empty reference list of ID, Code and Name.
Ref<Recordset> emptyKeyed();
// Text as typed: Empty, Null and text of spaces and tabs are blank; trimmed
// drops the spaces and tabs around it.
bool isBlank(const Variant& v);
std::string trimmed(const Variant& v);

Ref<Recordset> readRecordset(Database& db, std::string_view sql,
                             std::span<const Variant> params = {},
                             std::span<const FieldDef> fields = {});
// The list of a screen: every row, or only the row of `key`.
Ref<Recordset> readList(Database& db, const ListDef& list);
Ref<Recordset> readListRow(Database& db, const ListDef& list, const std::string& key);
// Puts "ListResult" into the response when the request's "NeedList" names a
// known list.
void answerListResult(OperationContext& ctx, const std::string& key);

// --- Writing -------------------------------------------------------------

// How the rows of a recordset are written into one table.
struct TableWrite {
    std::string table;
    std::string key = "ID";
    // The field whose value names the offending row ("BllRowID") when a row
    // is refused; the key when empty.
    std::string rowIdField;
    // CU, CD on insert; LU, LD on insert and update.
    bool audit = false;
    // Updates require the stored LD to equal the LD the row was read with.
    bool checkLastChange = false;
    // Values that every written row takes (a parent key, copied head fields).
    std::vector<std::pair<std::string, Variant>> fixed;
    // Fields kept in a column of another name: {field, column}. A field named
    // like such a column is not written when the mapped field is there.
    std::vector<std::pair<std::string, std::string>> columnOf;
    // Columns the service keeps itself: never written from the rows.
    std::vector<std::string> readOnly;
    // Updates and deletes reach only the rows that satisfy `scope`, in which
    // "{}" stands for `scopeValue` ("Itm_ID = {}"): a row outside it counts as
    // gone (18), so a key of another owner's row changes nothing.
    std::string scope;
    Variant scopeValue;
    // Columns computed for every new and modified row: `derive` gets the
    // recordset on the row and answers their values in the order of
    // `derived`. A derived column is not also written from a field.
    std::vector<std::string> derived;
    std::function<std::vector<Variant>(Recordset& row)> derive;
    // Which pending rows this write takes; the others stay pending for a
    // later write (children deleted before their parents, added after).
    bool deletes = true;
    bool updates = true;
    bool inserts = true;
};

struct WriteResult {
    std::vector<std::string> keys;  // keys of the rows inserted or updated, in order
    bool changed = false;           // any row inserted, updated or deleted
};

// Writes the pending rows of `rs` by their status: deleted rows first, then
// modified, then new (new rows with an empty key get a new key). Columns of
// the recordset that the table lacks are ignored; an empty value of a NOT
// NULL column with a declared default takes the default. Violations raise
// Refusal.
WriteResult writeRows(OperationContext& ctx, Recordset& rs, const TableWrite& spec);
// Stamps LU, LD of an unchanged head whose rows changed, with the same check
// of the last change. Raises Refusal 18 when the head changed meanwhile.
void touchRow(OperationContext& ctx, Recordset& head, const TableWrite& spec);

// Deletes the records whose keys the request property `keyField` holds (one
// key, or several joined by U+0001). Keys no longer there are skipped.
void deleteByKeys(OperationContext& ctx, const std::string& table, const std::string& keyField);

// The keys of a U+0001-joined key text.
std::vector<std::string> splitKeys(std::string_view keys);

}  // namespace pelta::bll
