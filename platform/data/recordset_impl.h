// Internal storage of recordsets, shared by recordset.cpp, filter.cpp and
// recordset_io.cpp. Not for use outside platform/data.
//
// A Table holds the rows of a recordset and of all its clones: one typed
// column per field plus a null bitmap, and a status per row slot. A row is
// identified by its slot (row id) for as long as it lives; removed slots are
// never reused, so bookmarks stay valid. Text and bytes live in a per-column
// arena addressed by (offset, length); an edit appends the new value to the
// arena and repoints the row.
#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "platform/automation/variant.h"
#include "platform/data/recordset.h"

namespace pelta::rsimpl {

// Row slot status: the public RowStatus values, and Removed for slots whose
// row is gone for good.
inline constexpr uint8_t kRemoved = 0xFF;

struct TextSpan {
    uint32_t offset;
    uint32_t length;
};

struct Column {
    FieldType type = FieldType::Text;
    std::vector<uint64_t> nulls;  // bit set: Null
    std::vector<uint8_t> b;       // Boolean (0/1)
    std::vector<int32_t> i32;     // Long
    std::vector<double> f64;      // Double, Date
    std::vector<int64_t> i64;     // Currency (scaled)
    std::vector<Decimal> dec;     // Decimal
    std::vector<std::array<uint8_t, 16>> guid;
    std::string arena;  // Text, LongText, Binary
    std::vector<TextSpan> spans;
    size_t garbage = 0;  // arena bytes no longer referenced

    bool isNull(uint32_t row) const noexcept { return (nulls[row >> 6] >> (row & 63)) & 1; }
    void setNull(uint32_t row, bool null) noexcept {
        uint64_t bit = uint64_t{1} << (row & 63);
        if (null)
            nulls[row >> 6] |= bit;
        else
            nulls[row >> 6] &= ~bit;
    }
    std::string_view text(uint32_t row) const noexcept {
        const TextSpan s = spans[row];
        return {arena.data() + s.offset, s.length};
    }
    // Appends a slot holding Null.
    void appendNull();
    void reserve(size_t rows);
    // Stores text/bytes for an existing slot (the old bytes become garbage).
    void setText(uint32_t row, std::string_view v);
};

bool isTextType(FieldType t) noexcept;

struct Table {
    std::vector<FieldDef> defs;
    std::vector<Column> cols;
    std::vector<uint8_t> status;  // per slot: RowStatus or kRemoved
    // Values as of the last accept, for rows modified or deleted since.
    std::unordered_map<uint32_t, std::vector<Variant>> originals;
    // Folded field name -> index.
    std::unordered_map<std::string, size_t> byName;
    bool open = false;
    // Bumped whenever a row leaves or re-enters the visible set (delete,
    // batch accept/cancel, cancel of an added row), so views re-check.
    uint64_t epoch = 0;
    // Bumped when rows come back (batch cancel): views rebuild from scratch.
    uint64_t resetEpoch = 0;
    // Decimal fields: 10^(precision-scale), the first magnitude that does not fit.
    std::vector<Decimal> decimalLimit;

    uint32_t slots() const noexcept { return static_cast<uint32_t>(status.size()); }
    int find(std::string_view name) const noexcept;
    uint32_t appendRow();  // a New row of Nulls
    Variant get(size_t field, uint32_t row) const;
    // Converts and stores; raises MultipleStep when the value does not fit.
    void set(size_t field, uint32_t row, const Variant& v);
    Variant original(size_t field, uint32_t row) const;
    std::vector<Variant> rowValues(uint32_t row) const;
    void restoreRow(uint32_t row, const std::vector<Variant>& values);
    void addField(FieldDef def);
    void openEmpty();
};

enum class FilterKind : uint8_t { None, Criteria, Pending, Bookmarks };

class Filter;

struct View {
    FilterKind kind = FilterKind::None;
    std::string criteria;
    std::shared_ptr<const Filter> compiled;
    std::vector<Variant> bookmarkList;
    std::string sortText;
    // Sorted order of all slots when a sort is set, else empty.
    std::vector<uint32_t> sortOrder;
    bool sorted = false;

    std::vector<uint32_t> ids;  // rows in view order (may hold rows no longer visible)
    int64_t pos = 0;            // -1: BOF; ids.size(): EOF
    bool ghost = false;         // current row vanished: logically just before ids[pos]
    uint64_t epochSeen = 0;
    uint64_t resetSeen = 0;
    uint32_t slotsSeen = 0;
    bool compact = true;  // every row of ids is visible

    mutable std::vector<uint32_t> posOf;  // row id -> position + 1 (0: absent)
    mutable bool posValid = false;

    EditMode edit = EditMode::None;
    uint32_t editRow = 0;
    std::vector<Variant> editBackup;
};

// Bookmarks are Doubles holding row id + 1.
Variant makeBookmark(uint32_t row);
// The row id of a bookmark, or false when it is not one of `t`'s live rows.
bool bookmarkRow(const Table& t, const Variant& bm, uint32_t& row);

[[noreturn]] void raiseRs(int32_t number, std::string description);

}  // namespace pelta::rsimpl
