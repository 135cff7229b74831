// A screen as the shell shows it: its caption, menu and toolbar commands,
// declared controls and grids, and the rows of a grid one page at a time.
// Every member runs on the session's user-interface thread.
//
// The framework's extenders are adapted to this interface: a list control's
// form extender gives the caption and commands, its grid extender the columns
// and the recordset that pages are cut from.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "platform/automation/variant.h"

namespace pelta::shell {

class UserAgent;
class Downloads;

struct ColumnInfo {
    std::string key;
    std::string caption;
    std::string field;
    bool visible = true;
    std::string format;
    std::string editor;  // "", "text", "number", "date", "check", "combo", "selector"
    int32_t width = 0;
    // Combo columns: the rows offered, as key and shown text.
    std::vector<std::pair<std::string, std::string>> options;
};

// A field of a grid's quick filter: text typed to narrow the rows.
struct FilterFieldInfo {
    int32_t id = 0;
    std::string caption;
    std::string text;  // as applied
};

struct GridInfo {
    std::string name;
    std::vector<ColumnInfo> columns;
    int64_t rowCount = 0;
    bool editable = false;  // rows may be added and cells edited
    // A grouped grid: the group values offered (the first shows every group)
    // and the one shown.
    std::string groupColumn;
    std::vector<std::string> groups;
    std::string group;
    // The quick filter's fields the person types into, and its hint
    // ("(префикс '/' за код ...)").
    std::vector<FilterFieldInfo> filters;
    std::string filterHint;
};

struct CommandInfo {
    int32_t id = 0;
    std::string caption;  // may hold "\t" and the shortcut's text, as menus do
    std::string tooltip;
    std::string shortcut;  // "Ctrl+N", "Del", "F5"; empty when none
    bool enabled = true;
};

struct ControlInfo {
    std::string name;
    std::string kind;  // "text", "number", "date", "check", "combo", "note", "grid" ...
    std::string caption;
    std::string field;
    std::string group;
    std::string format;
    std::string hint;
    bool readOnly = false;
    Variant value;
    // Combos: the rows offered, as key and shown text.
    std::vector<std::pair<std::string, std::string>> options;
    std::string prompt;  // shown in an empty field
};

// An attribute grid of a detail form: further fields of the record, one row
// each ("Име", "Стойност"), in numbered groups, with the chosen row's help
// text under the grid.
struct AttribOption {
    std::string key;
    std::string text;
    std::string parentKey;  // tree lists: the parent's key, empty at the root
};

struct AttribRowInfo {
    int32_t group = 0;
    std::string field;
    std::string caption;
    // "text", "number", "date", "check", "list", "fixedlist", "treelist", "selector"
    std::string editor;
    Variant value;
    // The value as the row shows it: a list's or fixed list's text, a
    // selector's name, a number in its format. Empty for a check box, which
    // the page draws from the value.
    std::string text;
    std::string style;                  // "Inactive", "Required" ... empty when plain
    std::vector<AttribOption> options;  // lists, tree lists and fixed lists
    std::string help;                   // may hold "[b]...[/b]"
};

struct AttribGroupInfo {
    int32_t number = 0;
    std::string caption;
};

struct AttribGridInfo {
    std::string name;
    std::vector<AttribGroupInfo> groups;  // in their order
    std::vector<AttribRowInfo> rows;      // in the order declared
    std::string selected;                 // the chosen row's field; empty when none
    std::string help;                     // the chosen row's help text
};

// A tree of a detail form. A declared control whose group is the key of one
// of its nodes belongs to that node: the page shows it while the node is the
// selected one.
struct TreeNodeInfo {
    std::string parentKey;  // empty at the root
    std::string key;
    std::string text;
};

struct TreeInfo {
    std::string name;
    std::vector<TreeNodeInfo> nodes;  // parents before their children
    std::string selected;             // empty when none is selected
};

struct SortKey {
    std::string column;
    bool descending = false;
};

struct Row {
    int64_t index = 0;           // position in the grid's current order
    std::string key;             // bookmark, stable across sorting
    std::vector<Variant> cells;  // in the order of the grid's columns
};

struct RowsPage {
    int64_t total = 0;
    int64_t offset = 0;
    std::vector<Row> rows;
};

// What the page asks of a screen when it runs a command: the grid row that is
// current and the rows that are marked.
struct CommandTarget {
    std::string grid;
    std::vector<std::string> selectedKeys;
    std::string currentKey;
};

class Screen {
public:
    virtual ~Screen() = default;

    virtual std::string kind() = 0;  // "list" or "detail"
    virtual std::string caption() = 0;
    virtual std::vector<CommandInfo> commands() = 0;
    virtual std::vector<ControlInfo> controls() = 0;
    virtual std::vector<GridInfo> grids() = 0;

    // `count` rows from `offset` of `grid` in the order `sort` (empty: the
    // grid's own order). Raises pelta::Error for an unknown grid or column.
    virtual RowsPage rows(const std::string& grid, int64_t offset, int64_t count,
                          const std::vector<SortKey>& sort) = 0;

    // Runs a framework command (101 new, 102 open, 205 delete, 207 refresh ...).
    // False when the screen does not offer it.
    virtual bool execute(int32_t command, const CommandTarget& target) = 0;
    // A control's value typed by the person. Raises for an unknown control.
    virtual void setValue(const std::string& control, const Variant& value) = 0;
    // Validates, uploads and saves; false when refused (a message said why).
    virtual bool save() = 0;
    // True when the last save found nothing changed and so wrote nothing.
    virtual bool savedNothing() const { return false; }

    // Editable grids. The defaults raise: a screen without such grids.
    // A new row in `grid`; answers its key.
    virtual std::string addRow(const std::string& grid);
    // A cell of the row `row` typed by the person; false when the screen
    // refused it (a message said why).
    virtual bool editCell(const std::string& grid, const std::string& row,
                          const std::string& column, const Variant& value);
    // Grouped grids: shows the group `value` (the first of GridInfo::groups
    // shows every group).
    virtual void setGroup(const std::string& grid, const std::string& value);
    // Quick filters: the text of field `field` of `grid`'s quick filter,
    // applied to the rows at once.
    virtual void setFilter(const std::string& grid, int32_t field, const std::string& text);

    // Attribute grids and trees of a detail form; none by default.
    virtual std::vector<AttribGridInfo> attributeGrids() { return {}; }
    virtual std::vector<TreeInfo> trees() { return {}; }
    // A value the person entered in the attribute grid `grid`: converted,
    // checked and written by the grid; false when refused (not a number, not
    // offered, or the screen said no). The defaults raise: a screen without
    // attribute grids or trees.
    virtual bool setAttribute(const std::string& grid, const std::string& field,
                              const Variant& value);
    // The button of a selector row: the screen picks the record.
    virtual void attributeButton(const std::string& grid, const std::string& field);
    // The person chose a row; its help text shows under the grid.
    virtual void selectAttribute(const std::string& grid, const std::string& field);
    // The person clicked a node of a tree; false when the tree has no such node.
    virtual bool activateNode(const std::string& tree, const std::string& key);
    // The person stands on the row `row` of an editable grid: leaving the row
    // being edited ends its edit (false when that is refused). The default
    // raises: a screen without such grids.
    virtual bool chooseRow(const std::string& grid, const std::string& row);

    // The termination protocol: may refuse (unsaved edits the person keeps).
    virtual bool queryTerminate() = 0;
    // Releases everything; the screen is not used afterwards.
    virtual void terminate() = 0;
};

// What a screen may ask of the session hosting it.
class ScreenHost {
public:
    virtual ~ScreenHost() = default;
    virtual UserAgent& userAgent() = 0;
    // Where files a screen writes for the person go (downloads of the page);
    // null when the host cannot hand files over.
    virtual Downloads* downloads() { return nullptr; }
    // The login name of the person; empty when nobody logged in (loopback).
    virtual std::string userName() const { return {}; }
    // Shows another screen (a detail form opened by a list); answers its id.
    virtual int64_t openScreen(std::shared_ptr<Screen> screen) = 0;
    // Tells the page that a screen's caption, values or commands changed.
    virtual void screenChanged(Screen& screen) = 0;
    // Tells the page that the rows of a grid changed.
    virtual void gridChanged(Screen& screen, const std::string& grid) = 0;
    // Closes a screen from its own code (after a delete in a detail form).
    virtual void closeScreen(Screen& screen) = 0;
    // A screen shown in a modal dialog while the code that shows it waits (a
    // selector's list): reachable by its id, but not among the screens the
    // page shows; forgotten (not terminated) when the dialog is over.
    virtual int64_t openModalScreen(std::shared_ptr<Screen> screen) {
        return openScreen(std::move(screen));
    }
    virtual void closeModalScreen(int64_t id) { (void)id; }
};

struct NavigationEntry {
    std::string id;       // what the page sends back to open it ("PeltaNom15.ctxRatios")
    std::string caption;  // shown in the navigation
    bool available = true;
};

// The library as one session sees it: its entry object and the lists it
// opened. Lives and dies on the session's user-interface thread.
class LibrarySession {
public:
    virtual ~LibrarySession() = default;
    // Creates and initialises a list control. Raises pelta::Error when it cannot.
    virtual std::shared_ptr<Screen> openList(const std::string& id) = 0;
    // Ends the session's hold on the library (the entry object's Terminate).
    virtual void terminate() = 0;
};

// Where screens come from: the library's public list controls.
class ScreenProvider {
public:
    virtual ~ScreenProvider() = default;
    virtual std::vector<NavigationEntry> navigation() = 0;
    // Called on the new session's user-interface thread.
    virtual std::unique_ptr<LibrarySession> startSession(ScreenHost& host) = 0;
};

}  // namespace pelta::shell
