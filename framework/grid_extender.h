// The grid extender: a grid over a recordset. The grid works on its own clone
// of the bound recordset, so that its cursor, its group filter and the quick
// filter never disturb the screen's recordset; edits made through the grid
// change the shared rows.
#pragma once

#include <cstdint>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "framework/extender_base.h"
#include "library/contracts/Extenders.h"

namespace pelta::fw {

using PeltaNom15::PropertyBagRef;
using PeltaNom15::RecordsetRef;

// The group value that shows every group.
inline constexpr const char* kAllGroups = "(Всички)";

class GridExtender : public PeltaNom15::IGridExtender, public ExtenderBase {
public:
    GridExtender();
    ~GridExtender() override;

    PeltaNom15::GridEvents& Events() override { return events_; }

    void Init(pelta::Object* Owner, const std::string& GridName, int32_t HelpID,
              const std::string& LayoutKey) override;
    std::string GridName() override { return gridName_; }
    void DeclareColumns(const std::vector<PeltaNom15::ColumnDecl>& Columns) override;
    std::vector<PeltaNom15::ColumnDecl> Columns() override { return columns_; }
    // Raises InvalidProcedureCall for an undeclared column or a field the
    // rows lack; null rows take the list away.
    void SetColumnList(const std::string& Column, RecordsetRef Rows, const std::string& KeyField,
                       const std::vector<std::string>& ShownFields) override;

    // Empty or "(Всички)" shows every group; another value shows that group.
    // The grid stands on its first row; the marks are cleared.
    void Bind(RecordsetRef Rows, const std::string& GroupColumn = {},
              const pelta::Variant& GroupValue = {}) override;
    RecordsetRef Rows() override;
    // Applies the filters again over the current rows, keeps the current row
    // when it is still shown, and raises CalcTotals.
    void Refresh() override;

    bool HasCurrentRow() override;
    // A column key (a declared column's field) or a field name; a column with
    // no field in the rows is asked of FetchData. Empty without a current row.
    pelta::Variant CurrentValue(const std::string& Column) override;
    pelta::Variant CurrentBookmark() override;
    // Raises RowColChange when the row changes.
    bool SetCurrentBookmark(const pelta::Variant& Bookmark) override;
    // Searches the grid's rows from the first; stays put when nothing matches.
    bool MoveToRow(const std::string& Criterion) override;
    bool SetCurrentValue(const std::string& Column, const pelta::Variant& Value) override;

    bool MultiSelect() override { return multiSelect_; }
    void SetMultiSelect(bool MultiSelect) override;
    std::vector<pelta::Variant> SelectedBookmarks() override { return selected_; }
    // Raises SelectionChange when the marks change. A single-select grid
    // keeps the last bookmark only.
    void SetSelectedBookmarks(const std::vector<pelta::Variant>& Bookmarks) override;

    bool EditState() override;
    bool ValidateRows() override;
    bool DeleteRows() override;

    // ---- For hosts and renderers ----------------------------------------------

    // The rows a combo column offers, as the screen set them; null when none.
    struct ColumnList {
        RecordsetRef rows;
        std::string keyField;
        std::vector<std::string> shownFields;
    };
    const ColumnList* columnList(const std::string& column) const;

    int32_t helpID() const noexcept { return helpID_; }
    const std::string& layoutKey() const noexcept { return layoutKey_; }
    // The grid's own view of the rows (its clone), null before binding.
    RecordsetRef view() const;
    int64_t rowCount();
    const std::string& groupColumn() const noexcept { return groupColumn_; }
    const pelta::Variant& groupValue() const noexcept { return groupValue_; }
    // The distinct values of the group column, in order of first appearance,
    // after "(Всички)".
    std::vector<pelta::Variant> groupValues();
    // The user picks another group.
    void setGroupValue(const pelta::Variant& value);
    // A further row filter (the quick filter's clause); empty clears it.
    void setRowFilter(const std::string& criteria);
    const std::string& rowFilter() const noexcept { return rowFilter_; }

    // The value of a cell as the grid draws it: the bound field, or for a
    // computed column what FetchData answers. Raises InvalidProcedureCall for
    // an unknown column or a bookmark that is not a row.
    pelta::Variant cellValue(const pelta::Variant& bookmark, const std::string& column);
    // The bookmarks of the shown rows from `first` (0-based), at most `count`.
    std::vector<pelta::Variant> visibleBookmarks(int64_t first, int64_t count);
    // A barcode scanner delivers a code.
    void scannerReceive(const std::string& code);

    // Whether a column is shown: declared visible and CanShowColumn agrees.
    bool columnVisible(const std::string& column);
    // The value a host paints in a column with no field in the rows (an
    // icon, a computed text): FetchData is asked for the row `bookmark`.
    pelta::Variant fetchData(const pelta::Variant& bookmark, const std::string& column);
    // The formatting of the row at `bookmark` (RowFormat).
    PeltaNom15::RowFormatArgs formatRow(const pelta::Variant& bookmark);

    // The user edits the current row: BeforeColUpdate, the value, AfterColUpdate.
    // False when refused.
    bool editCell(const std::string& column, const pelta::Variant& value);
    // The user adds a row (it becomes current; commitRow ends it).
    void addRow();
    // The user leaves the edited row: BeforeUpdate, then the row is updated
    // and AfterUpdate raised. False when refused (the edit stays pending).
    bool commitRow();
    // The user presses a command in the grid, double-clicks, or opens a row.
    bool execute(int32_t commandID);  // True when handled
    void doubleClick();
    bool canOpen();
    void negotiateMenu();
    void addFromSelector(const pelta::Variant& selection);

private:
    std::string fieldOf(const std::string& column) const;
    std::string filterText() const;
    void applyFilter();
    bool standOn(const pelta::Variant& bookmark);  // False when the row is not shown
    std::set<double> pendingRows() const;          // bookmarks of rows with pending changes

    PeltaNom15::GridEvents events_;
    std::string gridName_;
    int32_t helpID_ = 0;
    std::string layoutKey_;
    std::vector<PeltaNom15::ColumnDecl> columns_;
    std::map<std::string, ColumnList> lists_;  // by column key
    RecordsetRef rows_;
    RecordsetRef view_;
    std::string groupColumn_;
    pelta::Variant groupValue_;
    std::string rowFilter_;
    bool multiSelect_ = false;
    std::vector<pelta::Variant> selected_;
    std::set<double> baseline_;  // rows already pending when bound
    RecordsetRef reader_;        // reads cells by bookmark without moving the grid
};

}  // namespace pelta::fw
