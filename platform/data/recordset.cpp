#include "platform/data/recordset.h"

#include <algorithm>
#include <limits>

#include "platform/automation/error.h"
#include "platform/automation/guid.h"
#include "platform/data/collation.h"
#include "platform/data/filter.h"
#include "platform/data/recordset_impl.h"

namespace pelta {

namespace rsimpl {

void raiseRs(int32_t number, std::string description) {
    throw Error(number, "Recordset", std::move(description));
}

bool isTextType(FieldType t) noexcept {
    return t == FieldType::Text || t == FieldType::LongText || t == FieldType::Binary;
}

void Column::reserve(size_t rows) {
    nulls.reserve((rows + 63) / 64);
    switch (type) {
        case FieldType::Boolean:
            b.reserve(rows);
            break;
        case FieldType::Long:
            i32.reserve(rows);
            break;
        case FieldType::Double:
        case FieldType::Date:
            f64.reserve(rows);
            break;
        case FieldType::Currency:
            i64.reserve(rows);
            break;
        case FieldType::Decimal:
            dec.reserve(rows);
            break;
        case FieldType::Guid:
            guid.reserve(rows);
            break;
        default:
            spans.reserve(rows);
            break;
    }
}

void Column::appendNull() {
    size_t row;
    switch (type) {
        case FieldType::Boolean:
            row = b.size(), b.push_back(0);
            break;
        case FieldType::Long:
            row = i32.size(), i32.push_back(0);
            break;
        case FieldType::Double:
        case FieldType::Date:
            row = f64.size(), f64.push_back(0);
            break;
        case FieldType::Currency:
            row = i64.size(), i64.push_back(0);
            break;
        case FieldType::Decimal:
            row = dec.size(), dec.emplace_back();
            break;
        case FieldType::Guid:
            row = guid.size(), guid.push_back({});
            break;
        default:
            row = spans.size(), spans.push_back({0, 0});
            break;
    }
    if ((row >> 6) >= nulls.size()) nulls.push_back(0);
    setNull(static_cast<uint32_t>(row), true);
}

void Column::setText(uint32_t row, std::string_view v) {
    TextSpan& s = spans[row];
    if (v.size() <= s.length && s.length > 0) {
        // Overwrite in place; the tail becomes garbage.
        std::copy(v.begin(), v.end(), arena.begin() + s.offset);
        garbage += s.length - v.size();
        s.length = static_cast<uint32_t>(v.size());
        return;
    }
    if (arena.size() + v.size() > std::numeric_limits<uint32_t>::max())
        raiseRs(rserr::MultipleStep, "The text storage of the recordset is full");
    garbage += s.length;
    s.offset = static_cast<uint32_t>(arena.size());
    s.length = static_cast<uint32_t>(v.size());
    arena.append(v);
}

int Table::find(std::string_view name) const noexcept {
    for (size_t i = 0; i < defs.size(); ++i) {
        try {
            if (equalsIgnoreCase(defs[i].name, name)) return static_cast<int>(i);
        } catch (...) {
            return -1;
        }
    }
    return -1;
}

void Table::addField(FieldDef def) {
    if (open) raiseRs(rserr::ObjectOpen, "Fields cannot be appended to an open recordset");
    if (def.name.empty()) raiseRs(rserr::InvalidArgument, "A field needs a name");
    if (find(def.name) >= 0)
        raiseRs(rserr::ObjectInCollection, "The recordset already has a field '" + def.name + "'");
    if (static_cast<uint8_t>(def.type) > static_cast<uint8_t>(FieldType::Binary))
        raiseRs(rserr::InvalidArgument, "Unknown field type for '" + def.name + "'");
    if (def.type == FieldType::Decimal) {
        if (def.precision == 0) def.precision = Decimal::kMaxScale;
        if (def.precision > Decimal::kMaxScale || def.scale > def.precision)
            raiseRs(rserr::InvalidArgument,
                    "Invalid precision or scale of the decimal field '" + def.name + "'");
    } else {
        def.precision = 0;
        def.scale = 0;
    }
    Column c;
    c.type = def.type;
    defs.push_back(std::move(def));
    cols.push_back(std::move(c));
}

void Table::openEmpty() {
    if (open) raiseRs(rserr::ObjectOpen, "The recordset is already open");
    decimalLimit.assign(defs.size(), Decimal());
    for (size_t i = 0; i < defs.size(); ++i) {
        if (defs[i].type != FieldType::Decimal) continue;
        int digits = defs[i].precision - defs[i].scale;
        auto limit = Decimal::parse("1" + std::string(static_cast<size_t>(digits), '0'));
        decimalLimit[i] = limit ? *limit : Decimal();
    }
    open = true;
}

uint32_t Table::appendRow() {
    if (status.size() >= std::numeric_limits<uint32_t>::max() - 1)
        raiseRs(rserr::IllegalOperation, "The recordset cannot hold more rows");
    for (auto& c : cols)
        c.appendNull();
    status.push_back(static_cast<uint8_t>(RowStatus::New));
    return static_cast<uint32_t>(status.size() - 1);
}

Variant Table::get(size_t field, uint32_t row) const {
    const Column& c = cols[field];
    if (c.isNull(row)) return Variant::null();
    switch (c.type) {
        case FieldType::Boolean:
            return Variant(c.b[row] != 0);
        case FieldType::Long:
            return Variant(c.i32[row]);
        case FieldType::Double:
            return Variant(c.f64[row]);
        case FieldType::Currency:
            return Variant(Currency{c.i64[row]});
        case FieldType::Decimal:
            return Variant(c.dec[row]);
        case FieldType::Date:
            return Variant(Date{c.f64[row]});
        case FieldType::Guid:
            return Variant(Guid{c.guid[row]}.toString());
        case FieldType::Text:
        case FieldType::LongText:
            return Variant(std::string(c.text(row)));
        case FieldType::Binary: {
            auto t = c.text(row);
            return Variant(Bytes(t.begin(), t.end()));
        }
    }
    return Variant::null();
}

namespace {
size_t countChars(std::string_view s) {
    size_t n = 0;
    for (char ch : s)
        if ((static_cast<uint8_t>(ch) & 0xC0) != 0x80) ++n;
    return n;
}
}  // namespace

void Table::set(size_t field, uint32_t row, const Variant& v) {
    Column& c = cols[field];
    const FieldDef& d = defs[field];
    auto fail = [&](const std::string& why) -> void {
        raiseRs(rserr::MultipleStep, "Field '" + d.name + "': " + why);
    };
    if (v.isNull() || v.isEmpty()) {
        if (!d.nullable) fail("the field cannot be Null");
        c.setNull(row, true);
        return;
    }
    try {
        switch (c.type) {
            case FieldType::Boolean:
                c.b[row] = v.toBool() ? 1 : 0;
                break;
            case FieldType::Long:
                c.i32[row] = v.toLong();
                break;
            case FieldType::Double:
                c.f64[row] = v.toDouble();
                break;
            case FieldType::Currency:
                c.i64[row] = v.toCurrency().scaled;
                break;
            case FieldType::Decimal: {
                Decimal x = v.toDecimal().round(d.scale);
                if (d.precision < Decimal::kMaxScale && x.abs() >= decimalLimit[field])
                    fail("the value " + x.toString() + " exceeds the precision " +
                         std::to_string(d.precision) + "," + std::to_string(d.scale));
                c.dec[row] = x;
                break;
            }
            case FieldType::Date:
                c.f64[row] = v.toDate().oa;
                break;
            case FieldType::Guid: {
                std::optional<Guid> g;
                if (v.isString()) g = Guid::parse(v.str());
                if (!g) fail("not a GUID");
                c.guid[row] = g->bytes;
                break;
            }
            case FieldType::Text:
            case FieldType::LongText: {
                std::string s = v.toString();
                if (c.type == FieldType::Text && d.definedSize && s.size() > d.definedSize &&
                    countChars(s) > d.definedSize)
                    fail("the text is longer than " + std::to_string(d.definedSize) +
                         " characters");
                c.setText(row, s);
                break;
            }
            case FieldType::Binary: {
                if (v.isBytes()) {
                    const Bytes& b = v.bytes();
                    if (d.definedSize && b.size() > d.definedSize)
                        fail("more than " + std::to_string(d.definedSize) + " bytes");
                    c.setText(row, {reinterpret_cast<const char*>(b.data()), b.size()});
                } else {
                    fail("not a byte array");
                }
                break;
            }
        }
    } catch (const Error& e) {
        if (e.number() == rserr::MultipleStep) throw;
        fail(e.description());
    }
    c.setNull(row, false);
}

Variant Table::original(size_t field, uint32_t row) const {
    if (status[row] == static_cast<uint8_t>(RowStatus::New)) return Variant::null();
    auto it = originals.find(row);
    if (it != originals.end()) return it->second[field];
    return get(field, row);
}

std::vector<Variant> Table::rowValues(uint32_t row) const {
    std::vector<Variant> v;
    v.reserve(defs.size());
    for (size_t f = 0; f < defs.size(); ++f)
        v.push_back(get(f, row));
    return v;
}

void Table::restoreRow(uint32_t row, const std::vector<Variant>& values) {
    for (size_t f = 0; f < defs.size() && f < values.size(); ++f) {
        if (values[f].isNull()) {
            cols[f].setNull(row, true);  // as it was, even where Null is not allowed
        } else {
            set(f, row, values[f]);
        }
    }
}

Variant makeBookmark(uint32_t row) {
    return Variant(static_cast<double>(row) + 1.0);
}

bool bookmarkRow(const Table& t, const Variant& bm, uint32_t& row) {
    double d;
    if (bm.type() == VarType::Double)
        d = bm.rawDouble();
    else if (bm.type() == VarType::Long)
        d = bm.rawLong();
    else
        return false;
    if (!(d >= 1.0) || d > static_cast<double>(t.slots()) || d != static_cast<double>(int64_t(d)))
        return false;
    row = static_cast<uint32_t>(d) - 1;
    return t.status[row] != kRemoved;
}

// Sorting lives in recordset_sort.cpp.
std::vector<uint32_t> sortRows(const Table& t, std::vector<uint32_t> rows,
                               const std::vector<SortKeySpec>& keys);

}  // namespace rsimpl

using namespace rsimpl;

namespace {

constexpr uint8_t kUnmodified = static_cast<uint8_t>(RowStatus::Unmodified);
constexpr uint8_t kNew = static_cast<uint8_t>(RowStatus::New);
constexpr uint8_t kModified = static_cast<uint8_t>(RowStatus::Modified);
constexpr uint8_t kDeleted = static_cast<uint8_t>(RowStatus::Deleted);

bool visible(const Table& t, const View& v, uint32_t r) {
    uint8_t st = t.status[r];
    if (st == kRemoved) return false;
    if (v.kind == FilterKind::Pending) return st != kUnmodified;
    return st != kDeleted;
}

// Rebuilds the view from its filter and sort; the cursor on the first row.
void rebuild(const Table& t, View& v) {
    std::vector<uint32_t> base;
    base.reserve(t.slots());
    if (v.sorted) {
        for (uint32_t r : v.sortOrder)
            if (visible(t, v, r)) base.push_back(r);
    } else {
        for (uint32_t r = 0; r < t.slots(); ++r)
            if (visible(t, v, r)) base.push_back(r);
    }
    std::vector<uint32_t> ids;
    switch (v.kind) {
        case FilterKind::None:
        case FilterKind::Pending:
            ids.swap(base);
            break;
        case FilterKind::Criteria:
            ids.reserve(base.size() / 4);
            v.compiled->select(t, base, ids);
            break;
        case FilterKind::Bookmarks: {
            std::vector<uint8_t> want(t.slots());
            for (const Variant& bm : v.bookmarkList) {
                uint32_t r;
                if (bookmarkRow(t, bm, r)) want[r] = 1;
            }
            for (uint32_t r : base)
                if (want[r]) ids.push_back(r);
            break;
        }
    }
    v.ids.swap(ids);
    v.slotsSeen = t.slots();
    v.epochSeen = t.epoch;
    v.resetSeen = t.resetEpoch;
    v.compact = true;
    v.posValid = false;
    v.ghost = false;
    v.pos = 0;
}

int64_t positionOf(const Table& t, View& v, uint32_t row);

// Takes in rows added through other recordsets over the same table, and
// notes removals; after rows came back, rebuilds keeping the current row.
void sync(const Table& t, View& v) {
    if (v.resetSeen != t.resetEpoch) {
        const bool onRow = !v.ghost && v.pos >= 0 && v.pos < static_cast<int64_t>(v.ids.size());
        const uint32_t row = onRow ? v.ids[static_cast<size_t>(v.pos)] : 0;
        rebuild(t, v);
        if (onRow && visible(t, v, row)) {
            int64_t p = positionOf(t, v, row);
            if (p >= 0) v.pos = p;
        }
        return;
    }
    if (v.slotsSeen < t.slots()) {
        const bool atEof = v.pos >= static_cast<int64_t>(v.ids.size());
        for (uint32_t r = v.slotsSeen; r < t.slots(); ++r) {
            if (t.status[r] == kRemoved) continue;
            if (v.sorted) v.sortOrder.push_back(r);
            bool take = true;
            if (v.kind == FilterKind::Criteria)
                take = v.compiled->matches(t, r);
            else if (v.kind == FilterKind::Bookmarks)
                take = false;
            if (take) v.ids.push_back(r);
        }
        if (atEof) v.pos = static_cast<int64_t>(v.ids.size());
        v.slotsSeen = t.slots();
        v.posValid = false;
    }
    if (v.epochSeen != t.epoch) {
        v.epochSeen = t.epoch;
        v.compact = false;
    }
}

// Drops rows that are no longer visible, keeping the cursor where it was.
void compactView(const Table& t, View& v) {
    sync(t, v);
    if (v.compact) return;
    std::vector<uint32_t> ids;
    ids.reserve(v.ids.size());
    const int64_t size = static_cast<int64_t>(v.ids.size());
    int64_t newPos = v.pos < 0 ? -1 : -2;
    for (int64_t i = 0; i < size; ++i) {
        uint32_t r = v.ids[static_cast<size_t>(i)];
        if (i == v.pos) {
            newPos = static_cast<int64_t>(ids.size());
            if (!visible(t, v, r)) v.ghost = true;
        }
        if (visible(t, v, r)) ids.push_back(r);
    }
    if (newPos == -2) newPos = static_cast<int64_t>(ids.size());
    v.ids.swap(ids);
    v.pos = newPos;
    v.compact = true;
    v.posValid = false;
}

void skipForward(const Table& t, View& v) {
    const int64_t size = static_cast<int64_t>(v.ids.size());
    while (v.pos < size && !visible(t, v, v.ids[static_cast<size_t>(v.pos)]))
        ++v.pos;
}

void skipBackward(const Table& t, View& v) {
    while (v.pos >= 0 && !visible(t, v, v.ids[static_cast<size_t>(v.pos)]))
        --v.pos;
}

void toFirst(const Table& t, View& v) {
    v.ghost = false;
    v.pos = 0;
    skipForward(t, v);
    if (v.pos >= static_cast<int64_t>(v.ids.size())) {
        compactView(t, v);
        v.pos = static_cast<int64_t>(v.ids.size());
    }
}

// Position of `row` in the view, or -1.
int64_t positionOf(const Table& t, View& v, uint32_t row) {
    compactView(t, v);
    if (!v.posValid) {
        v.posOf.assign(t.slots(), 0);
        for (size_t i = 0; i < v.ids.size(); ++i)
            v.posOf[v.ids[i]] = static_cast<uint32_t>(i + 1);
        v.posValid = true;
    }
    if (row >= v.posOf.size() || v.posOf[row] == 0) return -1;
    return static_cast<int64_t>(v.posOf[row]) - 1;
}

void requireOpen(const Table& t) {
    if (!t.open)
        raiseRs(rserr::ObjectClosed, "Operation is not allowed when the recordset is closed");
}

}  // namespace

// ---------------------------------------------------------------------------

const FieldDef& FieldAccess::def() const {
    return rs_->fieldDef(index_);
}
Variant FieldAccess::value() const {
    return rs_->value(index_);
}
void FieldAccess::setValue(const Variant& v) const {
    rs_->setValue(index_, v);
}
Variant FieldAccess::originalValue() const {
    return rs_->originalValue(index_);
}
bool FieldAccess::isNull() const {
    return rs_->table_->cols[index_].isNull(rs_->currentRow());
}

Recordset::Recordset() : table_(std::make_shared<Table>()), view_(std::make_unique<View>()) {}
Recordset::Recordset(std::shared_ptr<Table> table)
    : table_(std::move(table)), view_(std::make_unique<View>()) {}
Recordset::~Recordset() = default;

void Recordset::appendField(FieldDef def) {
    table_->addField(std::move(def));
}

void Recordset::appendField(std::string name, FieldType type, uint32_t definedSize, bool nullable) {
    FieldDef d;
    d.name = std::move(name);
    d.type = type;
    d.definedSize = definedSize;
    d.nullable = nullable;
    table_->addField(std::move(d));
}

void Recordset::appendDecimalField(std::string name, uint8_t precision, uint8_t scale,
                                   bool nullable) {
    FieldDef d;
    d.name = std::move(name);
    d.type = FieldType::Decimal;
    d.precision = precision;
    d.scale = scale;
    d.nullable = nullable;
    table_->addField(std::move(d));
}

void Recordset::open() {
    table_->openEmpty();
    rebuildView();
}

bool Recordset::isOpen() const noexcept {
    return table_->open;
}
size_t Recordset::fieldCount() const noexcept {
    return table_->defs.size();
}

const FieldDef& Recordset::fieldDef(size_t index) const {
    if (index >= table_->defs.size())
        raiseRs(rserr::ItemNotFound, "No field at index " + std::to_string(index));
    return table_->defs[index];
}

int Recordset::fieldIndex(std::string_view name) const noexcept {
    return table_->find(name);
}

namespace {
size_t requireField(const Table& t, std::string_view name) {
    int i = t.find(name);
    if (i < 0)
        raiseRs(rserr::ItemNotFound,
                "Item cannot be found in the collection: field '" + std::string(name) + "'");
    return static_cast<size_t>(i);
}
size_t requireIndex(const Table& t, size_t index) {
    if (index >= t.defs.size())
        raiseRs(rserr::ItemNotFound, "No field at index " + std::to_string(index));
    return index;
}
}  // namespace

FieldAccess Recordset::field(std::string_view name) {
    return FieldAccess(*this, requireField(*table_, name));
}
FieldAccess Recordset::field(size_t index) {
    return FieldAccess(*this, requireIndex(*table_, index));
}

uint32_t Recordset::currentRow() const {
    requireOpen(*table_);
    View& v = *view_;
    sync(*table_, v);
    if (v.ghost || v.pos < 0 || v.pos >= static_cast<int64_t>(v.ids.size()))
        raiseRs(rserr::NoCurrentRecord,
                "Either BOF or EOF is True, or the current record has been deleted");
    uint32_t r = v.ids[static_cast<size_t>(v.pos)];
    if (table_->status[r] == kRemoved)
        raiseRs(rserr::NoCurrentRecord, "The current record has been deleted");
    return r;
}

Variant Recordset::value(size_t field) const {
    requireIndex(*table_, field);
    return table_->get(field, currentRow());
}
Variant Recordset::value(std::string_view field) const {
    return table_->get(requireField(*table_, field), currentRow());
}

Variant Recordset::originalValue(size_t field) const {
    requireIndex(*table_, field);
    return table_->original(field, currentRow());
}
Variant Recordset::originalValue(std::string_view field) const {
    return table_->original(requireField(*table_, field), currentRow());
}

uint32_t Recordset::editableRow() {
    uint32_t r = currentRow();
    View& v = *view_;
    if (v.edit != EditMode::None && v.editRow == r) return r;
    if (v.edit != EditMode::None) finishPendingEdit();
    if (table_->status[r] == kDeleted)
        raiseRs(rserr::IllegalOperation, "The current record is deleted");
    v.edit = EditMode::InProgress;
    v.editRow = r;
    v.editBackup = table_->rowValues(r);
    return r;
}

void Recordset::setValue(size_t field, const Variant& val) {
    requireIndex(*table_, field);
    table_->set(field, editableRow(), val);
}
void Recordset::setValue(std::string_view field, const Variant& val) {
    size_t f = requireField(*table_, field);
    table_->set(f, editableRow(), val);
}

// --- Cursor ------------------------------------------------------------------

bool Recordset::bof() const noexcept {
    const View& v = *view_;
    try {
        sync(*table_, *view_);
    } catch (...) {
    }
    return v.pos < 0 || v.ids.empty();
}

bool Recordset::eof() const noexcept {
    const View& v = *view_;
    try {
        sync(*table_, *view_);
    } catch (...) {
    }
    return (v.pos >= static_cast<int64_t>(v.ids.size()) && !v.ghost) || v.ids.empty();
}

void Recordset::finishPendingEdit() {
    if (view_->edit != EditMode::None) update();
}

void Recordset::moveFirst() {
    requireOpen(*table_);
    finishPendingEdit();
    sync(*table_, *view_);
    toFirst(*table_, *view_);
}

void Recordset::moveLast() {
    requireOpen(*table_);
    finishPendingEdit();
    View& v = *view_;
    sync(*table_, v);
    v.ghost = false;
    v.pos = static_cast<int64_t>(v.ids.size()) - 1;
    skipBackward(*table_, v);
    if (v.pos < 0) {
        compactView(*table_, v);
        v.pos = v.ids.empty() ? 0 : -1;
    }
}

void Recordset::moveNext() {
    requireOpen(*table_);
    finishPendingEdit();
    View& v = *view_;
    sync(*table_, v);
    if (v.pos >= static_cast<int64_t>(v.ids.size()) && !v.ghost)
        raiseRs(rserr::NoCurrentRecord, "MoveNext: the recordset is at EOF");
    if (v.ghost)
        v.ghost = false;
    else
        ++v.pos;
    skipForward(*table_, v);
}

void Recordset::movePrevious() {
    requireOpen(*table_);
    finishPendingEdit();
    View& v = *view_;
    sync(*table_, v);
    if (v.pos < 0) raiseRs(rserr::NoCurrentRecord, "MovePrevious: the recordset is at BOF");
    v.ghost = false;
    --v.pos;
    skipBackward(*table_, v);
}

void Recordset::move(int64_t n, const Variant& start) {
    requireOpen(*table_);
    finishPendingEdit();
    View& v = *view_;
    compactView(*table_, v);
    const int64_t size = static_cast<int64_t>(v.ids.size());
    int64_t target;
    if (!start.isEmpty() && !start.isMissing()) {
        uint32_t row;
        int64_t p = bookmarkRow(*table_, start, row) ? positionOf(*table_, v, row) : -1;
        if (p < 0) raiseRs(rserr::InvalidArgument, "Move: the start bookmark is not valid");
        target = p + n;
    } else {
        if (!v.ghost && ((n > 0 && v.pos >= size) || (n < 0 && v.pos < 0)))
            raiseRs(rserr::NoCurrentRecord, "Move: the recordset is at BOF or EOF");
        if (v.ghost)
            target = n > 0 ? v.pos + n - 1 : v.pos + n;
        else
            target = v.pos + n;
    }
    v.ghost = false;
    if (target < 0)
        v.pos = -1;
    else if (target >= size)
        v.pos = size;
    else
        v.pos = target;
}

int64_t Recordset::absolutePosition() const {
    requireOpen(*table_);
    View& v = *view_;
    compactView(*table_, v);
    if (v.ghost) return kPosUnknown;
    if (v.pos < 0) return kPosBof;
    if (v.pos >= static_cast<int64_t>(v.ids.size())) return kPosEof;
    return v.pos + 1;
}

void Recordset::setAbsolutePosition(int64_t position) {
    requireOpen(*table_);
    finishPendingEdit();
    View& v = *view_;
    compactView(*table_, v);
    if (position < 1 || position > static_cast<int64_t>(v.ids.size()))
        raiseRs(rserr::InvalidArgument,
                "AbsolutePosition " + std::to_string(position) + " is out of range");
    v.ghost = false;
    v.pos = position - 1;
}

int64_t Recordset::recordCount() const {
    requireOpen(*table_);
    compactView(*table_, *view_);
    return static_cast<int64_t>(view_->ids.size());
}

Variant Recordset::bookmark() const {
    return makeBookmark(currentRow());
}

void Recordset::setBookmark(const Variant& bm) {
    requireOpen(*table_);
    finishPendingEdit();
    uint32_t row;
    if (!bookmarkRow(*table_, bm, row))
        raiseRs(rserr::InvalidArgument, "The bookmark is not valid for this recordset");
    int64_t p = positionOf(*table_, *view_, row);
    if (p < 0) raiseRs(rserr::InvalidArgument, "The bookmark's row is not in the current view");
    view_->ghost = false;
    view_->pos = p;
}

int Recordset::compareBookmarks(const Variant& a, const Variant& b) const {
    requireOpen(*table_);
    uint32_t ra, rb;
    int64_t pa = -1, pb = -1;
    if (bookmarkRow(*table_, a, ra)) pa = positionOf(*table_, *view_, ra);
    if (bookmarkRow(*table_, b, rb)) pb = positionOf(*table_, *view_, rb);
    if (pa < 0 || pb < 0)
        raiseRs(rserr::InvalidArgument, "The bookmarks cannot be compared in the current view");
    return pa < pb ? -1 : pa > pb ? 1 : 0;
}

// --- Editing -----------------------------------------------------------------

void Recordset::addNew() {
    requireOpen(*table_);
    finishPendingEdit();
    View& v = *view_;
    sync(*table_, v);
    uint32_t r = table_->appendRow();
    v.ids.push_back(r);
    if (v.sorted) v.sortOrder.push_back(r);
    v.slotsSeen = table_->slots();
    v.posValid = false;
    v.ghost = false;
    v.pos = static_cast<int64_t>(v.ids.size()) - 1;
    v.edit = EditMode::Add;
    v.editRow = r;
    v.editBackup.clear();
}

void Recordset::update() {
    requireOpen(*table_);
    View& v = *view_;
    if (v.edit == EditMode::None) return;
    const uint32_t r = v.editRow;
    if (v.edit == EditMode::InProgress && table_->status[r] == kUnmodified) {
        table_->status[r] = kModified;
        table_->originals.emplace(r, std::move(v.editBackup));
    }
    v.edit = EditMode::None;
    v.editBackup.clear();
}

void Recordset::cancelUpdate() {
    requireOpen(*table_);
    View& v = *view_;
    const uint32_t r = v.editRow;
    if (v.edit == EditMode::InProgress) {
        if (table_->status[r] != kRemoved) table_->restoreRow(r, v.editBackup);
    } else if (v.edit == EditMode::Add) {
        if (table_->status[r] != kRemoved) {
            table_->status[r] = kRemoved;
            ++table_->epoch;
        }
        v.edit = EditMode::None;
        moveLast();
        return;
    }
    v.edit = EditMode::None;
    v.editBackup.clear();
}

void Recordset::deleteRecord() {
    requireOpen(*table_);
    View& v = *view_;
    if (v.edit == EditMode::InProgress) cancelUpdate();
    uint32_t r = currentRow();
    v.edit = EditMode::None;
    uint8_t& st = table_->status[r];
    if (st == kNew) {
        st = kRemoved;
    } else if (st == kDeleted) {
        return;
    } else {
        st = kDeleted;
    }
    ++table_->epoch;
}

EditMode Recordset::editMode() const noexcept {
    return view_->edit;
}

RowStatus Recordset::status() const {
    return static_cast<RowStatus>(table_->status[currentRow()]);
}

void Recordset::updateBatch() {
    requireOpen(*table_);
    finishPendingEdit();
    for (auto& st : table_->status) {
        if (st == kDeleted)
            st = kRemoved;
        else if (st != kRemoved)
            st = kUnmodified;
    }
    table_->originals.clear();
    ++table_->epoch;
}

void Recordset::cancelBatch() {
    requireOpen(*table_);
    if (view_->edit != EditMode::None) cancelUpdate();
    Table& t = *table_;
    for (uint32_t r = 0; r < t.slots(); ++r) {
        uint8_t& st = t.status[r];
        if (st == kNew) {
            st = kRemoved;
        } else if (st == kModified || st == kDeleted) {
            auto it = t.originals.find(r);
            if (it != t.originals.end()) t.restoreRow(r, it->second);
            st = kUnmodified;
        }
    }
    t.originals.clear();
    ++t.epoch;
    ++t.resetEpoch;
}

// --- Filter, sort, find, clone ----------------------------------------------

void Recordset::rebuildView() {
    rebuild(*table_, *view_);
}

void Recordset::setFilter(std::string_view criteria) {
    requireOpen(*table_);
    size_t b = criteria.find_first_not_of(" \t\r\n");
    if (b == std::string_view::npos) {
        setFilter(FilterGroup::None);
        return;
    }
    auto compiled = Filter::compile(*table_, criteria, false, "Filter");
    finishPendingEdit();
    sync(*table_, *view_);
    view_->kind = FilterKind::Criteria;
    view_->criteria.assign(criteria);
    view_->compiled = std::move(compiled);
    view_->bookmarkList.clear();
    rebuildView();
}

void Recordset::setFilter(FilterGroup group) {
    requireOpen(*table_);
    finishPendingEdit();
    sync(*table_, *view_);
    view_->kind = group == FilterGroup::Pending ? FilterKind::Pending : FilterKind::None;
    view_->criteria.clear();
    view_->compiled.reset();
    view_->bookmarkList.clear();
    rebuildView();
}

void Recordset::setFilter(std::span<const Variant> bookmarks) {
    requireOpen(*table_);
    for (size_t i = 0; i < bookmarks.size(); ++i) {
        uint32_t r;
        if (!bookmarkRow(*table_, bookmarks[i], r))
            raiseRs(rserr::InvalidArgument,
                    "Filter: element " + std::to_string(i) + " is not a valid bookmark");
    }
    finishPendingEdit();
    sync(*table_, *view_);
    view_->kind = FilterKind::Bookmarks;
    view_->criteria.clear();
    view_->compiled.reset();
    view_->bookmarkList.assign(bookmarks.begin(), bookmarks.end());
    rebuildView();
}

void Recordset::setFilter(const Variant& filter) {
    switch (filter.type()) {
        case VarType::Empty:
        case VarType::Null:
            setFilter(FilterGroup::None);
            return;
        case VarType::String:
            setFilter(std::string_view(filter.str()));
            return;
        case VarType::Array:
            setFilter(std::span<const Variant>(filter.array()));
            return;
        default:
            break;
    }
    if (filter.isNumber()) {
        double g = filter.toDouble();
        if (g == 0 || g == 3) return setFilter(FilterGroup::None);
        if (g == 1) return setFilter(FilterGroup::Pending);
    }
    raiseRs(rserr::InvalidArgument, "Filter: unsupported filter value");
}

Variant Recordset::filter() const {
    switch (view_->kind) {
        case FilterKind::Criteria:
            return Variant(view_->criteria);
        case FilterKind::Pending:
            return Variant(int32_t{1});
        case FilterKind::Bookmarks:
            return Variant(view_->bookmarkList);
        case FilterKind::None:
            break;
    }
    return Variant(int32_t{0});
}

void Recordset::setSort(std::string_view sort) {
    requireOpen(*table_);
    auto keys = parseSort(*table_, sort);
    finishPendingEdit();
    View& v = *view_;
    sync(*table_, v);
    if (keys.empty()) {
        v.sorted = false;
        v.sortOrder.clear();
        v.sortOrder.shrink_to_fit();
        v.sortText.clear();
    } else {
        std::vector<uint32_t> rows;
        rows.reserve(table_->slots());
        for (uint32_t r = 0; r < table_->slots(); ++r)
            if (table_->status[r] != kRemoved) rows.push_back(r);
        v.sortOrder = sortRows(*table_, std::move(rows), keys);
        v.sorted = true;
        v.sortText.assign(sort);
    }
    rebuildView();
}

const std::string& Recordset::sort() const noexcept {
    return view_->sortText;
}

bool Recordset::find(std::string_view criterion, int64_t skip, SearchDirection direction,
                     const Variant& start) {
    requireOpen(*table_);
    auto f = Filter::compile(*table_, criterion, true, "Find");
    finishPendingEdit();
    View& v = *view_;
    compactView(*table_, v);
    const int64_t size = static_cast<int64_t>(v.ids.size());
    const int64_t step = direction == SearchDirection::Backward ? -1 : 1;
    int64_t base;
    if (!start.isEmpty() && !start.isMissing()) {
        uint32_t row;
        base = bookmarkRow(*table_, start, row) ? positionOf(*table_, v, row) : -1;
        if (base < 0) raiseRs(rserr::InvalidArgument, "Find: the start bookmark is not valid");
    } else if (v.ghost) {
        base = step > 0 ? v.pos : v.pos - 1;
    } else {
        base = v.pos;
        if (step > 0 && base < 0) base = 0;
        if (step < 0 && base >= size) base = size - 1;
    }
    v.ghost = false;
    for (int64_t i = base + skip * step; i >= 0 && i < size; i += step) {
        if (f->matches(*table_, v.ids[static_cast<size_t>(i)])) {
            v.pos = i;
            return true;
        }
    }
    v.pos = step > 0 ? size : -1;
    return false;
}

Ref<Recordset> Recordset::clone() {
    requireOpen(*table_);
    Ref<Recordset> c(new Recordset(table_));
    c->rebuildView();
    return c;
}

}  // namespace pelta
