#include "framework/grid_extender.h"

#include <algorithm>

#include "framework/services.h"
#include "platform/automation/ascii.h"
#include "platform/automation/error.h"
#include "platform/data/recordset.h"

namespace pelta::fw {

using namespace PeltaNom15;

namespace {

// A value written as a literal of the filter grammar.
std::string literal(const pelta::Variant& v) {
    switch (v.type()) {
        case pelta::VarType::Boolean:
            return v.rawBool() ? "True" : "False";
        case pelta::VarType::Byte:
        case pelta::VarType::Integer:
        case pelta::VarType::Long:
            return std::to_string(v.toLong());
        default:
            break;
    }
    std::string text = v.toString(), out = "'";
    for (char c : text) {
        out += c;
        if (c == '\'') out += '\'';
    }
    return out + "'";
}

bool showsAllGroups(const pelta::Variant& v) {
    return v.isEmpty() || v.isNull() || (v.isString() && v.str() == kAllGroups);
}

}  // namespace

GridExtender::GridExtender() {
    services()->addGrid(this);
}

GridExtender::~GridExtender() {
    services()->removeGrid(this);
}

RecordsetRef GridExtender::Rows() {
    return rows_;
}
RecordsetRef GridExtender::view() const {
    return view_;
}

void GridExtender::Init(pelta::Object* Owner, const std::string& GridName, int32_t HelpID,
                        const std::string& LayoutKey) {
    setOwner(Owner);
    gridName_ = GridName;
    helpID_ = HelpID;
    layoutKey_ = LayoutKey;
}

void GridExtender::DeclareColumns(const std::vector<ColumnDecl>& Columns) {
    for (size_t i = 0; i < Columns.size(); ++i)
        for (size_t j = 0; j < i; ++j)
            if (Columns[i].Key.empty() || equalsNoCaseAscii(Columns[i].Key, Columns[j].Key))
                pelta::raise(pelta::errc::InvalidProcedureCall,
                             "The grid " + gridName_ + " declares the column \"" + Columns[i].Key +
                                 "\" twice or without a key",
                             "GridExtender.DeclareColumns");
    columns_ = Columns;
}

void GridExtender::SetColumnList(const std::string& Column, RecordsetRef Rows,
                                 const std::string& KeyField,
                                 const std::vector<std::string>& ShownFields) {
    auto it = std::find_if(columns_.begin(), columns_.end(),
                           [&](const ColumnDecl& c) { return equalsNoCaseAscii(c.Key, Column); });
    if (it == columns_.end())
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The grid " + gridName_ + " has no column " + Column,
                     "GridExtender.SetColumnList");
    if (!Rows) {
        lists_.erase(it->Key);
        return;
    }
    auto check = [&](const std::string& field) {
        if (Rows->fieldIndex(field) < 0)
            pelta::raise(pelta::errc::InvalidProcedureCall,
                         "The rows offered in " + it->Key + " have no field " + field,
                         "GridExtender.SetColumnList");
    };
    check(KeyField);
    for (const auto& f : ShownFields)
        check(f);
    lists_[it->Key] = ColumnList{std::move(Rows), KeyField, ShownFields};
}

const GridExtender::ColumnList* GridExtender::columnList(const std::string& column) const {
    for (const auto& [key, list] : lists_)
        if (equalsNoCaseAscii(key, column)) return &list;
    return nullptr;
}

// ---- binding and filters ------------------------------------------------------------

void GridExtender::Bind(RecordsetRef Rows, const std::string& GroupColumn,
                        const pelta::Variant& GroupValue) {
    if (Rows && !GroupColumn.empty() && Rows->fieldIndex(GroupColumn) < 0)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The rows bound to " + gridName_ + " have no group column " + GroupColumn,
                     "GridExtender.Bind");
    rows_ = std::move(Rows);
    reader_.reset();
    groupColumn_ = GroupColumn;
    groupValue_ = GroupValue;
    selected_.clear();
    view_ = rows_ ? rows_->clone() : nullptr;
    applyFilter();
    baseline_ = pendingRows();
}

std::string GridExtender::filterText() const {
    std::vector<std::string> parts;
    if (!groupColumn_.empty() && !showsAllGroups(groupValue_))
        parts.push_back(groupColumn_ + " = " + literal(groupValue_));
    if (!rowFilter_.empty()) parts.push_back(rowFilter_);
    if (parts.size() == 1) return parts[0];
    std::string out;
    for (const auto& p : parts)
        out += (out.empty() ? "(" : " AND (") + p + ")";
    return out;
}

void GridExtender::applyFilter() {
    if (!view_) return;
    auto text = filterText();
    if (text.empty())
        view_->clearFilter();
    else
        view_->setFilter(std::string_view(text));
    if (view_->recordCount() > 0) view_->moveFirst();
}

void GridExtender::Refresh() {
    if (view_) {
        pelta::Variant current = CurrentBookmark();
        applyFilter();
        if (!current.isEmpty()) standOn(current);
    }
    raise(events_.CalcTotals);
}

void GridExtender::setGroupValue(const pelta::Variant& value) {
    groupValue_ = value;
    selected_.clear();
    applyFilter();
    raise(events_.CalcTotals);
}

void GridExtender::setRowFilter(const std::string& criteria) {
    rowFilter_ = criteria;
    selected_.clear();
    applyFilter();
    raise(events_.CalcTotals);
}

std::vector<pelta::Variant> GridExtender::groupValues() {
    std::vector<pelta::Variant> out{pelta::Variant(kAllGroups)};
    if (!rows_ || groupColumn_.empty()) return out;
    auto all = rows_->clone();
    all->clearFilter();
    if (all->recordCount() == 0) return out;
    for (all->moveFirst(); !all->eof(); all->moveNext()) {
        auto v = all->value(groupColumn_);
        if (v.isNull() || v.isEmpty()) continue;
        if (std::find(out.begin() + 1, out.end(), v) == out.end()) out.push_back(std::move(v));
    }
    return out;
}

int64_t GridExtender::rowCount() {
    return view_ ? view_->recordCount() : 0;
}

// ---- the current row ----------------------------------------------------------------

bool GridExtender::HasCurrentRow() {
    if (!view_ || view_->bof() || view_->eof()) return false;
    return view_->status() != pelta::RowStatus::Deleted;
}

std::string GridExtender::fieldOf(const std::string& column) const {
    for (const auto& c : columns_)
        if (equalsNoCaseAscii(c.Key, column)) return c.Field;
    return column;
}

pelta::Variant GridExtender::CurrentValue(const std::string& Column) {
    if (!HasCurrentRow()) return {};
    auto field = fieldOf(Column);
    if (!field.empty() && view_->fieldIndex(field) >= 0) return view_->value(field);
    bool declared = std::any_of(columns_.begin(), columns_.end(), [&](const ColumnDecl& c) {
        return equalsNoCaseAscii(c.Key, Column);
    });
    if (!declared)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The grid " + gridName_ + " has no column " + Column,
                     "GridExtender.CurrentValue");
    pelta::Variant value;
    raise(events_.FetchData, view_->bookmark(), Column, value);
    return value;
}

pelta::Variant GridExtender::CurrentBookmark() {
    if (!HasCurrentRow()) return {};
    return view_->bookmark();
}

bool GridExtender::standOn(const pelta::Variant& bookmark) {
    if (!view_ || bookmark.isEmpty()) return false;
    pelta::Variant before = CurrentBookmark();
    try {
        view_->setBookmark(bookmark);
        if (!view_->bof() && !view_->eof()) return true;
    } catch (const pelta::Error&) {
    }
    // Not a row of the grid: stay where the grid stood.
    try {
        if (!before.isEmpty())
            view_->setBookmark(before);
        else if (view_->recordCount() > 0)
            view_->moveFirst();
    } catch (const pelta::Error&) {
    }
    return false;
}

bool GridExtender::SetCurrentBookmark(const pelta::Variant& Bookmark) {
    pelta::Variant before = CurrentBookmark();
    if (!standOn(Bookmark)) return false;
    if (!(before == Bookmark)) raise(events_.RowColChange, before, std::string());
    return true;
}

bool GridExtender::MoveToRow(const std::string& Criterion) {
    if (!view_ || view_->recordCount() == 0) return false;
    pelta::Variant before = CurrentBookmark();
    bool found = false;
    try {
        view_->moveFirst();
        found = view_->find(Criterion);
    } catch (...) {
        standOn(before);
        throw;
    }
    if (!found) {
        if (!standOn(before)) view_->moveFirst();
        return false;
    }
    if (!(before == view_->bookmark())) raise(events_.RowColChange, before, std::string());
    return true;
}

// ---- marked rows --------------------------------------------------------------------

void GridExtender::SetMultiSelect(bool MultiSelect) {
    multiSelect_ = MultiSelect;
    if (!multiSelect_ && selected_.size() > 1)
        selected_.erase(selected_.begin(), selected_.end() - 1);
}

void GridExtender::SetSelectedBookmarks(const std::vector<pelta::Variant>& Bookmarks) {
    std::vector<pelta::Variant> marks;
    if (multiSelect_)
        marks = Bookmarks;
    else if (!Bookmarks.empty())
        marks.push_back(Bookmarks.back());
    if (marks == selected_) return;
    selected_ = std::move(marks);
    raise(events_.SelectionChange);
}

// ---- edits --------------------------------------------------------------------------

std::set<double> GridExtender::pendingRows() const {
    std::set<double> out;
    if (!rows_) return out;
    auto pending = rows_->clone();
    pending->setFilter(pelta::FilterGroup::Pending);
    if (pending->recordCount() == 0) return out;
    for (pending->moveFirst(); !pending->eof(); pending->moveNext())
        out.insert(pending->bookmark().toDouble());
    return out;
}

bool GridExtender::EditState() {
    if (view_ && view_->editMode() != pelta::EditMode::None) return true;
    for (double row : pendingRows())
        if (!baseline_.count(row)) return true;
    return false;
}

bool GridExtender::ValidateRows() {
    if (!view_) return true;
    if (view_->editMode() != pelta::EditMode::None) view_->update();
    pelta::Variant before = CurrentBookmark();

    std::vector<pelta::Variant> changed;
    auto pending = rows_->clone();
    pending->setFilter(pelta::FilterGroup::Pending);
    if (pending->recordCount() > 0)
        for (pending->moveFirst(); !pending->eof(); pending->moveNext())
            if (pending->status() != pelta::RowStatus::Deleted)
                changed.push_back(pending->bookmark());

    const pelta::Variant group = groupValue_;
    const std::string rowFilter = rowFilter_;
    for (const auto& row : changed) {
        if (!standOn(row)) {
            // The row is hidden by the group or the quick filter: show every
            // row so that the grid can stand on it.
            groupValue_ = pelta::Variant(kAllGroups);
            rowFilter_.clear();
            applyFilter();
            if (!standOn(row)) continue;
        }
        bool cancel = false;
        raise(events_.BeforeUpdate, cancel);
        if (cancel) return false;  // the grid stands on the refused row
    }
    if (!(group == groupValue_) || rowFilter != rowFilter_) {
        groupValue_ = group;
        rowFilter_ = rowFilter;
        applyFilter();
    }
    standOn(before);
    return true;
}

bool GridExtender::DeleteRows() {
    if (!view_) return false;
    std::vector<pelta::Variant> targets = selected_;
    if (targets.empty() && HasCurrentRow()) targets.push_back(CurrentBookmark());
    if (targets.empty()) return false;
    bool cancel = false;
    raise(events_.BeforeDeleteEX, targets, cancel);
    if (!cancel) raise(events_.BeforeDelete, cancel);
    if (cancel) return false;
    for (const auto& row : targets)
        if (standOn(row)) view_->deleteRecord();
    selected_.clear();
    applyFilter();
    raise(events_.AfterDelete);
    return true;
}

bool GridExtender::editCell(const std::string& column, const pelta::Variant& value) {
    if (!HasCurrentRow()) return false;
    auto field = fieldOf(column);
    if (field.empty() || view_->fieldIndex(field) < 0)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The column " + column + " of " + gridName_ + " cannot be edited",
                     "GridExtender.editCell");
    pelta::Variant old = view_->value(field);
    bool cancel = false;
    raise(events_.BeforeColUpdate, column, old, cancel);
    if (cancel) return false;
    view_->setValue(field, value);
    raise(events_.AfterColUpdate, column);
    return true;
}

bool GridExtender::SetCurrentValue(const std::string& Column, const pelta::Variant& Value) {
    if (!HasCurrentRow()) return false;
    std::string field = fieldOf(Column);
    if (field.empty()) field = Column;
    if (view_->fieldIndex(field) < 0) return false;
    view_->setValue(field, Value);
    return true;
}

void GridExtender::addRow() {
    if (!view_)
        pelta::raise(pelta::errc::ObjectVariableNotSet, "No rows are bound to " + gridName_);
    view_->addNew();
    // A row added while one group is shown belongs to that group.
    if (!groupColumn_.empty() && !showsAllGroups(groupValue_))
        view_->setValue(groupColumn_, groupValue_);
}

bool GridExtender::commitRow() {
    if (!view_ || view_->editMode() == pelta::EditMode::None) return true;
    bool cancel = false;
    raise(events_.BeforeUpdate, cancel);
    if (cancel) return false;
    view_->update();
    raise(events_.AfterUpdate);
    return true;
}

// ---- user actions -------------------------------------------------------------------

bool GridExtender::columnVisible(const std::string& column) {
    bool show = true;
    for (const auto& c : columns_)
        if (equalsNoCaseAscii(c.Key, column)) show = c.Visible;
    raise(events_.CanShowColumn, column, show);
    return show;
}

pelta::Variant GridExtender::fetchData(const pelta::Variant& bookmark, const std::string& column) {
    pelta::Variant value;
    raise(events_.FetchData, bookmark, column, value);
    return value;
}

RowFormatArgs GridExtender::formatRow(const pelta::Variant& bookmark) {
    RowFormatArgs args;
    args.Bookmark = bookmark;
    raise(events_.RowFormat, args);
    return args;
}

pelta::Variant GridExtender::cellValue(const pelta::Variant& bookmark, const std::string& column) {
    if (!view_)
        pelta::raise(pelta::errc::ObjectVariableNotSet, "No rows are bound to " + gridName_,
                     "GridExtender.cellValue");
    if (!reader_ || !rows_) reader_ = view_->clone();
    reader_->clearFilter();
    try {
        reader_->setBookmark(bookmark);
    } catch (const pelta::Error&) {
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The grid " + gridName_ + " has no row at that bookmark",
                     "GridExtender.cellValue");
    }
    auto field = fieldOf(column);
    if (!field.empty() && reader_->fieldIndex(field) >= 0) return reader_->value(field);
    bool declared = std::any_of(columns_.begin(), columns_.end(), [&](const ColumnDecl& c) {
        return equalsNoCaseAscii(c.Key, column);
    });
    if (!declared)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The grid " + gridName_ + " has no column " + column,
                     "GridExtender.cellValue");
    pelta::Variant value;
    raise(events_.FetchData, bookmark, column, value);
    return value;
}

std::vector<pelta::Variant> GridExtender::visibleBookmarks(int64_t first, int64_t count) {
    std::vector<pelta::Variant> out;
    if (!view_ || first < 0 || count <= 0 || first >= view_->recordCount()) return out;
    // Walks the grid's own view and stands on the current row again.
    const pelta::Variant current = CurrentBookmark();
    view_->setAbsolutePosition(first + 1);
    for (int64_t i = 0; i < count && !view_->eof(); ++i, view_->moveNext())
        out.push_back(view_->bookmark());
    if (!current.isEmpty())
        standOn(current);
    else
        view_->moveFirst();
    return out;
}

void GridExtender::scannerReceive(const std::string& code) {
    raise(events_.ScannerReceive, code);
}

bool GridExtender::execute(int32_t commandID) {
    bool handled = false;
    raise(events_.BeforeExecute, commandID, handled);
    return handled;
}

void GridExtender::doubleClick() {
    raise(events_.DblClick);
}

bool GridExtender::canOpen() {
    bool cancel = false;
    raise(events_.CanOpen, cancel);
    return !cancel;
}

void GridExtender::negotiateMenu() {
    raise(events_.MenuNegotiateEx);
}

void GridExtender::addFromSelector(const pelta::Variant& selection) {
    raise(events_.AddFromSelector, selection);
}

}  // namespace pelta::fw
