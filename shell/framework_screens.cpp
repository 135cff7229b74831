#include "shell/framework_screens.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <utility>
#include <vector>

#include "bll/service.h"
#include "framework/attrib_grid.h"
#include "framework/extenders.h"
#include "framework/form_extender.h"
#include "framework/framework.h"
#include "framework/grid_extender.h"
#include "framework/services.h"
#include "framework/user_agent.h"
#include "library/contracts/Constants.h"
#include "library/contracts/Public.h"
#include "platform/automation/ascii.h"
#include "platform/automation/error.h"
#include "platform/data/recordset.h"
#include "shell/downloads.h"
#include "shell/user_agent.h"

namespace pelta::shell {

using PeltaNom15::ColumnDecl;
using PeltaNom15::ControlKind;
using PeltaNom15::EditorKind;
using PeltaNom15::RecordsetRef;

std::string rowKey(const Variant& bookmark) {
    if (bookmark.isEmpty() || bookmark.isNull()) return {};
    double d = bookmark.toDouble();
    char buf[40];
    if (std::floor(d) == d && std::fabs(d) < 1e15)
        std::snprintf(buf, sizeof buf, "%lld", static_cast<long long>(d));
    else
        std::snprintf(buf, sizeof buf, "%.17g", d);
    return buf;
}

Variant rowBookmark(const std::string& key) {
    if (key.empty() || key.size() > 32) return {};
    char* end = nullptr;
    double d = std::strtod(key.c_str(), &end);
    if (end != key.c_str() + key.size() || !std::isfinite(d)) return {};
    return Variant(d);
}

namespace {

std::string text(const Variant& v) {
    if (v.isEmpty() || v.isNull()) return {};
    try {
        return v.toString();
    } catch (const pelta::Error&) {
        return {};
    }
}

[[noreturn]] void refuse(const std::string& what) {
    pelta::raise(pelta::errc::InvalidProcedureCall, what, "pelta.shell");
}

const char* controlKind(ControlKind k) {
    switch (k) {
        case ControlKind::Label:
            return "label";
        case ControlKind::Text:
            return "text";
        case ControlKind::Number:
            return "number";
        case ControlKind::Date:
            return "date";
        case ControlKind::CheckBox:
            return "check";
        case ControlKind::Combo:
            return "combo";
        case ControlKind::Selector:
            return "selector";
        case ControlKind::Grid:
            return "grid";
        case ControlKind::Tree:
            return "tree";
        case ControlKind::TabStrip:
            return "tabstrip";
        case ControlKind::Splitter:
            return "splitter";
        case ControlKind::Note:
            return "note";
        case ControlKind::RichText:
            return "rich";
        case ControlKind::Button:
            return "button";
        case ControlKind::Picture:
            return "picture";
    }
    return "text";
}

const char* editorKind(EditorKind e) {
    switch (e) {
        case EditorKind::None:
            return "";
        case EditorKind::Text:
            return "text";
        case EditorKind::Number:
            return "number";
        case EditorKind::Date:
            return "date";
        case EditorKind::CheckBox:
            return "check";
        case EditorKind::Combo:
            return "combo";
        case EditorKind::Selector:
            return "selector";
    }
    return "";
}

// The rows of a drop-down as key and shown text ("USD – Щатски долар").
std::vector<std::pair<std::string, std::string>> optionsOf(const RecordsetRef& rows,
                                                           const std::string& keyField,
                                                           const std::vector<std::string>& shown) {
    std::vector<std::pair<std::string, std::string>> out;
    if (!rows) return out;
    auto c = rows->clone();
    if (c->recordCount() == 0) return out;
    for (c->moveFirst(); !c->eof(); c->moveNext()) {
        std::string key = text(c->value(keyField));
        std::string shownText;
        for (size_t i = 0; i < shown.size() && i < 2; ++i) {
            std::string part = text(c->value(shown[i]));
            if (part.empty()) continue;
            shownText += (shownText.empty() ? "" : " – ") + part;
        }
        out.emplace_back(key, shownText.empty() ? key : shownText);
    }
    return out;
}

// How the page edits an attribute: an entry by its head field's type.
std::string attribEditor(fw::AttribGridExtender& grid, const PeltaNom15::AttribDecl& a) {
    using PeltaNom15::AttribEditor;
    switch (a.Editor) {
        case AttribEditor::CheckBox:
            return "check";
        case AttribEditor::List:
            return "list";
        case AttribEditor::FixedList:
            return "fixedlist";
        case AttribEditor::Selector:
            return "selector";
        case AttribEditor::TreeList:
            return "treelist";
        case AttribEditor::Entry:
            break;
    }
    RecordsetRef head = grid.head();
    int index = head ? head->fieldIndex(a.Field) : -1;
    if (index < 0) return a.Format.empty() ? "text" : "number";
    switch (head->fieldDef(static_cast<size_t>(index)).type) {
        case pelta::FieldType::Long:
        case pelta::FieldType::Double:
        case pelta::FieldType::Currency:
        case pelta::FieldType::Decimal:
            return "number";
        case pelta::FieldType::Date:
            return "date";
        default:
            return "text";
    }
}

// A quick-filter field whose caption is a key ("cg-grp") is set by the
// screen's own controls (a filter tree); the person types into the others.
bool typedFilterField(const fw::QuickFilterExtender::Field& f) {
    if (f.caption.empty()) return false;
    return !std::all_of(f.caption.begin(), f.caption.end(), [](char c) {
        return (c >= 'a' && c <= 'z') || (c >= '0' && c <= '9') || c == '-' || c == '_';
    });
}

// A grid's rows one page at a time, read from a clone of the grid's view
// with the view's filter (and, when asked, a sort of its own), so that the
// grid's cursor, marks and the screen's recordset never move. The clone is
// kept between pages until the grid or the order changes.
class GridPager {
public:
    RowsPage page(fw::GridExtender& grid, int64_t offset, int64_t count,
                  const std::vector<SortKey>& sort) {
        RowsPage out;
        out.offset = offset;
        RecordsetRef view = grid.view();
        if (!view) return out;
        std::string order = sortText(grid, sort);
        if (!source_ || view.get() != view_ || order != order_) {
            auto source = view->clone();
            source->setFilter(view->filter());
            if (!order.empty()) source->setSort(order);
            source_ = std::move(source);
            view_ = view.get();
            order_ = order;
        }
        auto columns = grid.Columns();
        // Shown columns with no field are computed by the screen, row by row.
        std::vector<bool> computed;
        for (const ColumnDecl& c : columns)
            computed.push_back(c.Field.empty() && grid.columnVisible(c.Key));
        out.total = source_->recordCount();
        if (offset >= out.total) return out;
        source_->setAbsolutePosition(offset + 1);
        for (int64_t i = 0; i < count && !source_->eof(); ++i, source_->moveNext()) {
            Row row;
            row.index = offset + i;
            row.key = rowKey(source_->bookmark());
            for (size_t c = 0; c < columns.size(); ++c) {
                const std::string& field = columns[c].Field;
                if (!field.empty() && source_->fieldIndex(field) >= 0)
                    row.cells.push_back(source_->value(field));
                else if (computed[c])
                    row.cells.push_back(grid.fetchData(source_->bookmark(), columns[c].Key));
                else
                    row.cells.push_back(Variant::null());
            }
            out.rows.push_back(std::move(row));
        }
        return out;
    }

    void invalidate() {
        source_.reset();
        view_ = nullptr;
    }

private:
    static std::string sortText(fw::GridExtender& grid, const std::vector<SortKey>& sort) {
        std::string out;
        auto columns = grid.Columns();
        RecordsetRef view = grid.view();
        for (const SortKey& k : sort) {
            auto c = std::find_if(columns.begin(), columns.end(), [&](const ColumnDecl& d) {
                return equalsNoCaseAscii(d.Key, k.column);
            });
            if (c == columns.end() || c->Field.empty() || view->fieldIndex(c->Field) < 0)
                refuse("The column " + k.column + " cannot be sorted");
            out += (out.empty() ? "" : ", ") + c->Field + (k.descending ? " DESC" : " ASC");
        }
        return out;
    }

    RecordsetRef source_;
    const pelta::Recordset* view_ = nullptr;
    std::string order_;
};

class FrameworkSession;

// What the screens over a form extender share: caption, menu, grids, paging
// and the current and marked rows of a command.
class FormScreen : public Screen {
public:
    FormScreen(FrameworkSession& session, pelta::ObjectRef owner, fw::FormExtender* form)
        : session_(&session), owner_(std::move(owner)), form_(form), site_(form->ClientSite()) {}

    fw::FormExtender* form() const noexcept { return form_.get(); }
    PeltaNom15::IClientSite* site() const noexcept { return site_.get(); }
    bool alive() const noexcept { return form_ != nullptr; }

    std::string caption() override { return form_ ? form_->Caption() : std::string(); }

    std::vector<CommandInfo> commands() override {
        std::vector<CommandInfo> out;
        if (!form_) return out;
        for (const fw::MenuCommand& c : form_->menu()) {
            if (!c.visible) continue;
            out.push_back(CommandInfo{c.id, c.caption, c.tooltip, c.shortcut, c.enabled});
        }
        return out;
    }

    std::vector<GridInfo> grids() override {
        std::vector<GridInfo> out;
        for (fw::GridExtender* g : gridExtenders()) {
            // A form's grid with nothing bound stands for a choice the
            // record does not make (several values where one is chosen).
            if (editableGrids() && !g->Rows()) continue;
            GridInfo info;
            info.name = g->GridName();
            for (const ColumnDecl& c : g->Columns()) {
                ColumnInfo col;
                col.key = c.Key;
                col.caption = c.Caption;
                col.field = c.Field;
                col.visible = g->columnVisible(c.Key);
                col.format = c.Format;
                col.editor = editorKind(c.Editor);
                col.width = c.Width;
                if (const auto* list = g->columnList(c.Key))
                    col.options = optionsOf(list->rows, list->keyField, list->shownFields);
                info.editable = info.editable || c.Editor != EditorKind::None;
                info.columns.push_back(std::move(col));
            }
            info.editable = info.editable && editableGrids();
            info.rowCount = g->rowCount();
            if (!g->groupColumn().empty()) {
                info.groupColumn = g->groupColumn();
                for (const Variant& v : g->groupValues())
                    info.groups.push_back(text(v));
                info.group = text(g->groupValue());
                if (info.group.empty()) info.group = fw::kAllGroups;
            }
            if (fw::QuickFilterExtender* q = quickFilterOf(*g)) {
                info.filterHint = q->hint();
                for (const auto& f : q->fields())
                    if (typedFilterField(f)) info.filters.push_back({f.id, f.caption, f.text});
            }
            out.push_back(std::move(info));
        }
        return out;
    }

    RowsPage rows(const std::string& grid, int64_t offset, int64_t count,
                  const std::vector<SortKey>& sort) override {
        return pagers_[grid].page(gridNamed(grid), offset, count, sort);
    }

    bool execute(int32_t command, const CommandTarget& target) override;

    void setGroup(const std::string& grid, const std::string& value) override {
        fw::GridExtender& g = gridNamed(grid);
        for (const Variant& v : g.groupValues()) {
            if (text(v) != value) continue;
            g.setGroupValue(v);
            invalidate();
            return;
        }
        refuse("The grid " + grid + " has no group " + value);
    }

    void setFilter(const std::string& grid, int32_t field, const std::string& value) override {
        fw::GridExtender& g = gridNamed(grid);
        fw::QuickFilterExtender* q = quickFilterOf(g);
        if (!q) refuse("The grid " + grid + " has no quick filter");
        const auto& fields = q->fields();
        auto f = std::find_if(fields.begin(), fields.end(),
                              [&](const auto& x) { return x.id == field && typedFilterField(x); });
        if (f == fields.end())
            refuse("The quick filter of " + grid + " has no field " + std::to_string(field));
        pelta::Ref<fw::QuickFilterExtender> keep(q);
        keep->SetText(field, value);
        invalidate();
        keep->Apply();
    }

    // The grids' rows may have changed: pages are cut anew.
    void invalidate() {
        for (auto& [name, pager] : pagers_)
            pager.invalidate();
    }

    // Drops every reference: the screen is not used afterwards.
    virtual void release() {
        pagers_.clear();
        form_.reset();
        site_.reset();
        owner_.reset();
    }

protected:
    virtual bool editableGrids() const { return false; }

    std::vector<fw::GridExtender*> gridExtenders() const {
        if (!owner_) return {};
        return fw::services()->gridsOfOwner(owner_.get());
    }

    fw::QuickFilterExtender* quickFilterOf(fw::GridExtender& grid) const {
        if (!owner_) return nullptr;
        for (fw::QuickFilterExtender* q : fw::services()->quickFiltersOfOwner(owner_.get()))
            if (pelta::query<fw::GridExtender>(q->grid()) == &grid) return q;
        return nullptr;
    }

    fw::GridExtender& gridNamed(const std::string& name) {
        for (fw::GridExtender* g : gridExtenders())
            if (name.empty() || equalsNoCaseAscii(g->GridName(), name)) return *g;
        refuse("No grid " + name);
    }

    // The row the page stands on becomes the grid's current row; the rows
    // it marked become the grid's marks.
    void applyTarget(const CommandTarget& target) {
        auto grids = gridExtenders();
        if (grids.empty()) return;
        fw::GridExtender& g = gridNamed(target.grid);
        if (!target.currentKey.empty()) {
            Variant bm = rowBookmark(target.currentKey);
            if (bm.isEmpty() || !g.SetCurrentBookmark(bm))
                refuse("The row " + target.currentKey + " is not in the grid");
        }
        std::vector<Variant> marks;
        for (const std::string& key : target.selectedKeys) {
            Variant bm = rowBookmark(key);
            if (bm.isEmpty()) refuse("Bad row key " + key);
            marks.push_back(bm);
        }
        if (marks.size() > 1 && !g.MultiSelect()) g.SetMultiSelect(true);
        g.SetSelectedBookmarks(marks);
    }

    FrameworkSession* session_;
    pelta::ObjectRef owner_;
    pelta::Ref<fw::FormExtender> form_;
    pelta::Ref<PeltaNom15::IClientSite> site_;
    std::map<std::string, GridPager> pagers_;
};

// A list control of the library.
class ListScreen final : public FormScreen {
public:
    using FormScreen::FormScreen;

    std::string kind() override { return "list"; }
    std::vector<ControlInfo> controls() override { return {}; }
    void setValue(const std::string& control, const Variant&) override {
        refuse("The list has no control " + control);
    }
    bool save() override { return false; }

    bool queryTerminate() override;
    void terminate() override;
};

// A detail form shown by a list.
class DetailScreen final : public FormScreen {
public:
    using FormScreen::FormScreen;

    std::string kind() override { return "detail"; }

    std::vector<ControlInfo> controls() override {
        std::vector<ControlInfo> out;
        if (!form_) return out;
        for (const PeltaNom15::ControlDecl& d : form_->controls()) {
            ControlInfo c;
            c.name = d.Name;
            c.kind = controlKind(d.Kind);
            c.caption = d.Caption;
            c.field = d.Field;
            c.group = d.Group;
            c.format = d.Format;
            c.hint = d.Hint;
            c.prompt = d.Prompt;
            c.readOnly = d.ReadOnly;
            c.value = form_->ControlValue(d.Name);
            if (const auto* list = form_->controlList(d.Name))
                c.options = optionsOf(list->rows, list->keyField, list->shownFields);
            out.push_back(std::move(c));
        }
        return out;
    }

    void setValue(const std::string& control, const Variant& value) override {
        if (!form_) refuse("The form is closed");
        form_->userSetValue(control, value);
    }

    bool save() override;
    bool savedNothing() const override { return savedNothing_; }

    std::string addRow(const std::string& grid) override {
        fw::GridExtender& g = gridNamed(grid);
        if (!g.commitRow()) return {};  // the row being edited was refused
        g.addRow();
        invalidate();
        return rowKey(g.CurrentBookmark());
    }

    bool editCell(const std::string& grid, const std::string& row, const std::string& column,
                  const Variant& value) override {
        fw::GridExtender& g = gridNamed(grid);
        Variant bm = rowBookmark(row);
        if (bm.isEmpty()) refuse("Bad row key " + row);
        if (!(g.CurrentBookmark() == bm)) {
            // Leaving the row being edited ends its edit, which may be refused.
            if (!g.commitRow()) return false;
            if (!g.SetCurrentBookmark(bm)) refuse("The row " + row + " is not in the grid");
        }
        bool ok = g.editCell(column, value);
        invalidate();
        return ok;
    }

    std::vector<AttribGridInfo> attributeGrids() override {
        std::vector<AttribGridInfo> out;
        for (fw::AttribGridExtender* a : attribGridExtenders()) {
            AttribGridInfo info;
            info.name = a->GridName();
            for (const auto& g : a->groups())
                info.groups.push_back(AttribGroupInfo{g.number, g.caption});
            for (const PeltaNom15::AttribDecl& d : a->Attributes()) {
                AttribRowInfo row;
                row.group = d.Group;
                row.field = d.Field;
                row.caption = d.Caption;
                row.editor = attribEditor(*a, d);
                row.value = a->Value(d.Field);
                fw::AttribGridExtender::ShownRow shown = a->shownRow(d.Field);
                row.text = std::move(shown.text);
                row.style = std::move(shown.style);
                if (d.Editor == PeltaNom15::AttribEditor::List ||
                    d.Editor == PeltaNom15::AttribEditor::FixedList ||
                    d.Editor == PeltaNom15::AttribEditor::TreeList)
                    for (auto& c : a->choices(d.Field))
                        row.options.push_back(AttribOption{c.key, c.text, c.parentKey});
                row.help = d.Help;
                info.rows.push_back(std::move(row));
            }
            info.selected = a->SelectedField();
            info.help = a->HelpText();
            out.push_back(std::move(info));
        }
        return out;
    }

    std::vector<TreeInfo> trees() override {
        std::vector<TreeInfo> out;
        if (!owner_) return out;
        for (fw::TreeExtender* t : fw::services()->treesOfOwner(owner_.get())) {
            TreeInfo info;
            info.name = t->treeName();
            for (const fw::TreeNode& n : t->nodes())
                info.nodes.push_back(TreeNodeInfo{n.parentKey, n.key, n.text});
            info.selected = t->SelectedKey();
            out.push_back(std::move(info));
        }
        return out;
    }

    bool setAttribute(const std::string& grid, const std::string& field,
                      const Variant& value) override {
        pelta::Ref<fw::AttribGridExtender> a(&attribGridNamed(grid));
        bool ok = a->UserSetValue(field, value);
        invalidate();
        return ok;
    }

    void attributeButton(const std::string& grid, const std::string& field) override {
        pelta::Ref<fw::AttribGridExtender> a(&attribGridNamed(grid));
        a->buttonClick(field);
        invalidate();
    }

    void selectAttribute(const std::string& grid, const std::string& field) override {
        pelta::Ref<fw::AttribGridExtender> a(&attribGridNamed(grid));
        a->Select(field);
    }

    bool chooseRow(const std::string& grid, const std::string& row) override {
        fw::GridExtender& g = gridNamed(grid);
        Variant bm = rowBookmark(row);
        if (bm.isEmpty()) refuse("Bad row key " + row);
        if (g.CurrentBookmark() == bm) return true;
        // Leaving the row being edited ends its edit, which may be refused.
        if (!g.commitRow()) return false;
        if (!g.SetCurrentBookmark(bm)) refuse("The row " + row + " is not in the grid");
        invalidate();
        return true;
    }

    bool activateNode(const std::string& tree, const std::string& key) override {
        if (!owner_) refuse("The form is closed");
        for (fw::TreeExtender* t : fw::services()->treesOfOwner(owner_.get())) {
            if (!equalsNoCaseAscii(t->treeName(), tree)) continue;
            pelta::Ref<fw::TreeExtender> keep(t);  // the node's screen code may drop it
            bool ok = keep->SelectNode(key);
            invalidate();
            return ok;
        }
        refuse("No tree " + tree);
    }

    bool queryTerminate() override;
    void terminate() override { release(); }

    // Ends the edits of the rows the person is on (false when one is refused).
    bool commitRows() {
        for (fw::GridExtender* g : gridExtenders())
            if (!g->commitRow()) return false;
        return true;
    }

protected:
    bool editableGrids() const override { return true; }

private:
    std::vector<fw::AttribGridExtender*> attribGridExtenders() const {
        if (!owner_) return {};
        return fw::services()->attribGridsOfOwner(owner_.get());
    }

    fw::AttribGridExtender& attribGridNamed(const std::string& name) {
        for (fw::AttribGridExtender* a : attribGridExtenders())
            if (name.empty() || equalsNoCaseAscii(a->GridName(), name)) return *a;
        refuse("No attribute grid " + name);
    }

    bool savedNothing_ = false;
};

// A selector's list while a screen waits for the person to choose in it: its
// grid and quick filter only, no commands; the list belongs to the screen
// that shows it, which terminates it, so this screen only lets go of it.
class SelectorScreen final : public FormScreen {
public:
    SelectorScreen(FrameworkSession& session, pelta::ObjectRef owner, fw::FormExtender* form,
                   std::string grid)
        : FormScreen(session, std::move(owner), form), grid_(std::move(grid)) {}

    std::string kind() override { return "selector"; }
    std::vector<CommandInfo> commands() override { return {}; }
    std::vector<ControlInfo> controls() override { return {}; }
    std::vector<GridInfo> grids() override {
        std::vector<GridInfo> out;
        for (GridInfo& g : FormScreen::grids())
            if (equalsNoCaseAscii(g.name, grid_)) out.push_back(std::move(g));
        return out;
    }
    bool execute(int32_t, const CommandTarget&) override { return false; }
    void setValue(const std::string& control, const Variant&) override {
        refuse("The selector has no control " + control);
    }
    bool save() override { return false; }
    bool queryTerminate() override { return true; }
    void terminate() override { release(); }

    // The rows the person chose become the grid's current row and marks;
    // false when the current row is not one the grid shows.
    bool choose(const RowsChoice& choice) {
        if (!alive()) return false;
        fw::GridExtender& g = gridNamed(grid_);
        Variant current = rowBookmark(choice.current);
        std::vector<Variant> marks;
        for (const std::string& key : choice.selected) {
            Variant bm = rowBookmark(key);
            if (!bm.isEmpty()) marks.push_back(bm);
        }
        if (current.isEmpty() && !marks.empty()) current = marks.front();
        if (current.isEmpty() || !g.SetCurrentBookmark(current)) return false;
        if (marks.size() > 1 && !g.MultiSelect()) g.SetMultiSelect(true);
        g.SetSelectedBookmarks(marks);
        return true;
    }

private:
    std::string grid_;
};

// The framework's user agent of a session's thread: the session's dialogs.
class WebAgent final : public fw::UserAgent {
public:
    WebAgent(shell::UserAgent& dialogs, FrameworkSession& session)
        : dialogs_(dialogs), session_(&session) {}

    int32_t messageBox(const fw::Prompt& p) override {
        return dialogs_.messageBox(p.text, p.style, p.caption, p.details);
    }
    void anchoredMessage(const fw::Prompt& p) override {
        dialogs_.showMessage(p.control, p.text, p.title.empty() ? p.caption : p.title, p.hint);
    }
    std::optional<Variant> inputBox(const fw::Prompt& p) override {
        std::string value = text(p.value);
        if (!dialogs_.inputBox(p.text, p.title.empty() ? p.caption : p.title, value))
            return std::nullopt;
        return Variant(value);
    }
    // A file the screen writes for the person: a path of the session's
    // downloads, offered to the page when the action ends.
    std::optional<std::filesystem::path> saveFile(const fw::Prompt& p) override;
    void documentShown(fw::FormExtender& form) override;
    bool chooseFromList(const fw::ListPick& pick) override;

    void detach() noexcept { session_ = nullptr; }
    std::string typeName() const override { return "WebUserAgent"; }

private:
    shell::UserAgent& dialogs_;
    FrameworkSession* session_;
};

class FrameworkSession final : public ListAdapter {
public:
    FrameworkSession(ScreenHost& host, const FrameworkOptions& options) : host_(host) {
        std::string user = host.userName().empty() ? options.defaultUser : host.userName();
        connection_ = bll::Connection::open(options.database, user);
        agent_ = pelta::makeRef<WebAgent>(host.userAgent(), *this);
        scope_ = std::make_unique<fw::UserAgentScope>(agent_);
    }

    ~FrameworkSession() override {
        scope_.reset();
        agent_->detach();
    }

    std::shared_ptr<Screen> openList(pelta::ObjectRef control) override {
        auto list = pelta::query<PeltaNom15::IZonListControl>(control.get());
        if (!list) refuse(control->typeName() + " is not a list control");
        auto site = pelta::makeRef<fw::ClientSite>(connection_);
        if (!list->InitClientSite(site.get()))
            pelta::raise(pelta::errc::Fail, "The list " + control->typeName() + " could not start",
                         "pelta.shell");
        fw::FormExtender* form = fw::services()->formOfOwner(control.get());
        if (!form) {
            terminateControl(control.get());
            refuse("The list " + control->typeName() + " made no form");
        }
        auto screen = std::make_shared<ListScreen>(*this, control, form);
        form->negotiateMenu();
        if (!form->Refresh()) {
            terminateControl(control.get());
            pelta::raise(pelta::errc::Fail, "The list " + form->Caption() + " could not be read",
                         "pelta.shell");
        }
        lists_.push_back(screen);
        return screen;
    }

    void documentShown(fw::FormExtender& form) {
        prune();
        for (auto& weak : details_) {
            if (auto d = weak.lock(); d && d->form() == &form) {
                d->invalidate();
                host_.openScreen(d);  // comes forward
                return;
            }
        }
        if (!form.owner()) return;
        auto screen = std::make_shared<DetailScreen>(*this, pelta::ObjectRef(form.owner()), &form);
        details_.push_back(screen);
        host_.openScreen(screen);
    }

    std::optional<std::filesystem::path> saveFile(const fw::Prompt& p) {
        Downloads* downloads = host_.downloads();
        if (!downloads) return std::nullopt;
        return downloads->reserve(p.fileName);
    }

    // A selector's list shown in a modal dialog; the choice is left in its grid.
    bool chooseFromList(const fw::ListPick& pick) {
        if (!pick.selector || !pick.form || !pick.grid) return false;
        auto screen = std::make_shared<SelectorScreen>(*this, pelta::ObjectRef(pick.selector),
                                                       pick.form, pick.grid->GridName());
        const int64_t id = host_.openModalScreen(screen);
        struct Forget {
            ScreenHost& host;
            SelectorScreen& screen;
            int64_t id;
            ~Forget() {
                host.closeModalScreen(id);
                screen.release();
            }
        } forget{host_, *screen, id};
        std::optional<RowsChoice> choice = host_.userAgent().chooseRows(id, pick.caption);
        return choice && screen->choose(*choice);
    }

    // After a command or a save: files written go to the page, closed
    // documents leave, the rest is redrawn.
    void afterAction() {
        if (Downloads* downloads = host_.downloads()) downloads->offer();
        prune();
        auto details = details_;
        for (auto& weak : details) {
            auto d = weak.lock();
            if (!d || !d->alive()) continue;
            if (d->form()->closed()) {
                host_.closeScreen(*d);
                continue;
            }
            d->invalidate();
            host_.screenChanged(*d);
        }
        for (auto& weak : lists_) {
            auto l = weak.lock();
            if (!l || !l->alive()) continue;
            l->invalidate();
            for (const GridInfo& g : l->grids())
                host_.gridChanged(*l, g.name);
        }
    }

    // The detail screens of the list whose client site is `site` close first.
    void closeDetailsOf(PeltaNom15::IClientSite* site) {
        prune();
        auto details = details_;
        for (auto& weak : details)
            if (auto d = weak.lock(); d && d->alive() && d->site() == site) host_.closeScreen(*d);
    }

    // Asks the person whether to close a screen with unsaved edits.
    bool confirmDiscard(const std::string& caption) {
        int32_t answer = host_.userAgent().messageBox(
            "Промените не са записани. Затваряне без запис?",
            PeltaNom15::vbYesNo | PeltaNom15::vbQuestion | 256 /* second button default */, caption,
            {});
        return answer == PeltaNom15::vbYes;
    }

    static void terminateControl(pelta::Object* control) {
        if (auto* t = pelta::query<PeltaNom15::IZonTerminate>(control)) t->Terminate();
    }

private:
    void prune() {
        auto dead = [](const auto& w) { return w.expired(); };
        details_.erase(std::remove_if(details_.begin(), details_.end(), dead), details_.end());
        lists_.erase(std::remove_if(lists_.begin(), lists_.end(), dead), lists_.end());
    }

    ScreenHost& host_;
    pelta::Ref<bll::Connection> connection_;
    pelta::Ref<WebAgent> agent_;
    std::unique_ptr<fw::UserAgentScope> scope_;
    std::vector<std::weak_ptr<ListScreen>> lists_;
    std::vector<std::weak_ptr<DetailScreen>> details_;
};

std::optional<std::filesystem::path> WebAgent::saveFile(const fw::Prompt& p) {
    if (!session_) return std::nullopt;
    return session_->saveFile(p);
}

void WebAgent::documentShown(fw::FormExtender& form) {
    if (session_) session_->documentShown(form);
}

bool WebAgent::chooseFromList(const fw::ListPick& pick) {
    return session_ && session_->chooseFromList(pick);
}

bool FormScreen::execute(int32_t command, const CommandTarget& target) {
    if (!form_) return false;
    const fw::MenuCommand* c = form_->command(command);
    if (!c || !c->visible || !c->enabled) return false;
    if (auto* detail = dynamic_cast<DetailScreen*>(this); detail && !detail->commitRows()) {
        return true;  // the row being edited was refused; a message said why
    }
    applyTarget(target);
    pelta::Ref<fw::FormExtender> keep = form_;  // the command may close this screen
    FrameworkSession& session = *session_;
    keep->Execute(command);
    session.afterAction();
    return true;
}

bool ListScreen::queryTerminate() {
    auto* t = pelta::query<PeltaNom15::IZonTerminate>(owner_.get());
    if (!t) return true;
    bool cancel = false;
    t->QueryTerminate(cancel);
    return !cancel || session_->confirmDiscard(caption());
}

void ListScreen::terminate() {
    pelta::ObjectRef control = owner_;
    session_->closeDetailsOf(site_.get());
    release();
    FrameworkSession::terminateControl(control.get());
}

bool DetailScreen::save() {
    if (!form_) return false;
    pelta::Ref<fw::FormExtender> keep = form_;
    FrameworkSession& session = *session_;
    savedNothing_ = false;
    bool saved = commitRows();
    if (saved && !keep->isModified())
        savedNothing_ = true;  // the framework has nothing to write: say so, not "saved"
    else if (saved)
        saved = keep->SaveDocument();
    session.afterAction();
    return saved;
}

bool DetailScreen::queryTerminate() {
    if (!form_) return true;
    if (auto* t = pelta::query<PeltaNom15::IZonTerminate>(owner_.get())) {
        bool cancel = false;
        t->QueryTerminate(cancel);
        if (cancel && !session_->confirmDiscard(caption())) return false;
    }
    // The list keeps the form for its next record; only the document closes.
    pelta::Ref<fw::FormExtender> keep = form_;
    return keep->CloseDocument();
}

}  // namespace

ListAdapterFactory frameworkListAdapter(FrameworkOptions options) {
    static std::once_flag registered;
    std::call_once(registered, [] { fw::registerFramework(); });
    return [options = std::move(options)](ScreenHost& host) -> std::unique_ptr<ListAdapter> {
        return std::make_unique<FrameworkSession>(host, options);
    };
}

}  // namespace pelta::shell
