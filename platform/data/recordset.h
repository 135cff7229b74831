// Recordsets: a disconnected table of typed rows with a cursor, edits tracked
// per row, filters in the ADO criteria grammar, find, sort, bookmarks, clones
// over the same rows, and a binary byte form.
//
// Storage is columnar (see recordset_impl.h): filter, find and sort run over
// typed column vectors, and save/load are mostly bulk copies of columns.
//
// Errors are pelta::Error with the ADO numbers below. Malformed filter, find
// and sort texts raise rserr::InvalidArgument (3001) with a description that
// names the 1-based character position where the text went wrong; malformed
// bytes given to load() raise errc::InvalidData.
#pragma once

#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "platform/automation/object.h"
#include "platform/automation/variant.h"
#include "platform/data/bytes.h"

namespace pelta {

namespace rserr {
// Arguments are of the wrong type, out of acceptable range, or in conflict.
inline constexpr int32_t InvalidArgument = 3001;
// BOF or EOF is true, or the current record has been deleted.
inline constexpr int32_t NoCurrentRecord = 3021;
// Operation is not allowed in this context.
inline constexpr int32_t IllegalOperation = 3219;
// Item cannot be found in the collection (unknown field name or index).
inline constexpr int32_t ItemNotFound = 3265;
// Object is already in collection (duplicate field name).
inline constexpr int32_t ObjectInCollection = 3367;
// Operation is not allowed when the object is closed / open.
inline constexpr int32_t ObjectClosed = 3704;
inline constexpr int32_t ObjectOpen = 3705;
// A value does not fit its field (too long, null into a non-nullable field,
// not convertible): "multiple-step operation generated errors".
inline constexpr int32_t MultipleStep = static_cast<int32_t>(0x80040E21);
}  // namespace rserr

enum class FieldType : uint8_t {
    Boolean,
    Long,  // 32-bit integer
    Double,
    Currency,  // 64-bit integer scaled by 10,000
    Decimal,   // exact, with precision and scale
    Date,      // OLE Automation date
    Guid,      // value is the text "{XXXXXXXX-...}"
    Text,      // UTF-8, at most definedSize characters (0: unlimited)
    LongText,  // UTF-8, unlimited
    Binary,    // bytes, at most definedSize bytes (0: unlimited)
};

struct FieldDef {
    std::string name;
    FieldType type = FieldType::Text;
    uint32_t definedSize = 0;
    bool nullable = true;
    uint8_t precision = 0;  // Decimal: total digits (1..28); 0 means 28
    uint8_t scale = 0;      // Decimal: digits after the point (0..precision)
};

enum class RowStatus : uint8_t { Unmodified, New, Modified, Deleted };
enum class EditMode : uint8_t { None, InProgress, Add };
// Filters by group; None clears any filter.
enum class FilterGroup : uint8_t { None, Pending };
enum class SearchDirection : int8_t { Forward = 1, Backward = -1 };

// AbsolutePosition when the cursor is not on a row.
inline constexpr int64_t kPosUnknown = -1;
inline constexpr int64_t kPosBof = -2;
inline constexpr int64_t kPosEof = -3;

class Recordset;
namespace rsimpl {
struct Table;
struct View;
}  // namespace rsimpl

// A field of a recordset as a light handle: valid while the recordset lives.
class FieldAccess {
public:
    FieldAccess(Recordset& rs, size_t index) noexcept : rs_(&rs), index_(index) {}
    size_t index() const noexcept { return index_; }
    const FieldDef& def() const;
    const std::string& name() const { return def().name; }
    FieldType type() const { return def().type; }
    uint32_t definedSize() const { return def().definedSize; }
    Variant value() const;
    void setValue(const Variant& v) const;
    Variant originalValue() const;
    bool isNull() const;

private:
    Recordset* rs_;
    size_t index_;
};

class Recordset : public Persistable {
public:
    Recordset();
    ~Recordset() override;

    // --- Shape. Fields are appended while the recordset is closed. ---
    void appendField(FieldDef def);
    void appendField(std::string name, FieldType type, uint32_t definedSize = 0,
                     bool nullable = true);
    void appendDecimalField(std::string name, uint8_t precision, uint8_t scale,
                            bool nullable = true);
    // Opens the fabricated recordset empty.
    void open();
    bool isOpen() const noexcept;

    size_t fieldCount() const noexcept;
    const FieldDef& fieldDef(size_t index) const;
    // The index of the field named `name` (without regard to case), or -1.
    int fieldIndex(std::string_view name) const noexcept;
    // Raises ItemNotFound for an unknown name or index.
    FieldAccess field(std::string_view name);
    FieldAccess field(size_t index);

    // --- Values of the current row. ---
    Variant value(size_t field) const;
    Variant value(std::string_view field) const;
    // Starts an edit of the current row when none is in progress.
    void setValue(size_t field, const Variant& v);
    void setValue(std::string_view field, const Variant& v);
    // The value as of the last updateBatch (or load); Null for new rows.
    Variant originalValue(size_t field) const;
    Variant originalValue(std::string_view field) const;

    // --- Cursor. Moving while an edit is in progress updates it first. ---
    bool bof() const noexcept;
    bool eof() const noexcept;
    void moveFirst();
    void moveLast();
    void moveNext();
    void movePrevious();
    // Moves `n` rows from the current row, or from the row of `start`.
    void move(int64_t n, const Variant& start = Variant());
    // 1-based position among the visible rows, or kPosBof/kPosEof/kPosUnknown.
    int64_t absolutePosition() const;
    void setAbsolutePosition(int64_t position);
    // Rows visible under the current filter.
    int64_t recordCount() const;

    // A bookmark identifies a row for as long as the row lives, through
    // filters, sorts and clones of this recordset. It is a Variant (Double).
    Variant bookmark() const;
    void setBookmark(const Variant& bookmark);
    // -1, 0, 1 by position in the current order; raises InvalidArgument when
    // either is not a row of the current view.
    int compareBookmarks(const Variant& a, const Variant& b) const;

    // --- Editing. ---
    void addNew();
    void update();
    // Reverts the edit; after a cancelled AddNew the cursor is on the last row.
    void cancelUpdate();
    // Marks the current row deleted (a new row disappears at once). The cursor
    // stays on the deleted row, whose values cannot be read, until it moves.
    void deleteRecord();
    EditMode editMode() const noexcept;
    RowStatus status() const;
    // Accepts all pending changes: every row unmodified, deleted rows gone,
    // original values equal to the values.
    void updateBatch();
    // Reverts all pending changes: new rows gone, deleted and modified rows
    // back as they were.
    void cancelBatch();

    // --- Filter and sort. Setting either puts the cursor on the first row. ---
    void setFilter(std::string_view criteria);
    void setFilter(const char* criteria) { setFilter(std::string_view(criteria)); }
    void setFilter(const std::string& criteria) { setFilter(std::string_view(criteria)); }
    void setFilter(FilterGroup group);
    void setFilter(std::span<const Variant> bookmarks);
    // A String (criteria), a number (FilterGroup), an Array of bookmarks, or
    // Empty (clear).
    void setFilter(const Variant& filter);
    void clearFilter() { setFilter(FilterGroup::None); }
    // The filter as set: criteria text, FilterGroup as Long, or bookmark array.
    Variant filter() const;

    // "Name ASC, Code DESC"; empty clears. Stable; text by Bulgarian collation.
    void setSort(std::string_view sort);
    const std::string& sort() const noexcept;

    // Finds the next row matching one criterion ("Code = 'A1'"), skipping
    // `skip` rows from the current row (or from `start`). On failure the
    // cursor is at EOF (forward) or BOF (backward). Returns whether found.
    bool find(std::string_view criterion, int64_t skip = 0,
              SearchDirection direction = SearchDirection::Forward,
              const Variant& start = Variant());

    // A recordset over the same rows with its own cursor, filter and sort.
    Ref<Recordset> clone();

    // --- Persistence. ---
    // Rows saved: the rows visible under the filter in force (a pending
    // filter includes deleted rows); without a filter every row including
    // those deleted and not yet accepted. Status and original values are kept.
    Bytes save() const;
    static Ref<Recordset> load(std::span<const uint8_t> bytes);
    std::string_view persistTag() const override { return "Recordset"; }
    void persist(ByteWriter& w) const override;
    static Ref<Recordset> loadFrom(ByteReader& r);

    std::string typeName() const override { return "Recordset"; }

private:
    friend class FieldAccess;
    Recordset(std::shared_ptr<rsimpl::Table> table);
    uint32_t currentRow() const;
    uint32_t editableRow();
    void finishPendingEdit();
    void rebuildView();

    std::shared_ptr<rsimpl::Table> table_;
    std::unique_ptr<rsimpl::View> view_;
};

}  // namespace pelta
