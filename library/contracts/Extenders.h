// The framework's extenders as the library sees them. A screen owns its
// extenders and handles their events: it sets the handlers of an extender's
// Events() (`m_oForm->Events().Fetch = [this](...) { m_oForm_Fetch(...); }`),
// and the framework raises them. By-reference arguments (`Cancel`,
// `Handled`) are references.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "library/contracts/Controls.h"
#include "library/contracts/Framework.h"
#include "platform/automation/object.h"
#include "platform/automation/variant.h"

namespace pelta {
class Recordset;
class PropertyBag;
}  // namespace pelta

namespace PeltaNom15 {

using RecordsetRef = pelta::Ref<pelta::Recordset>;
using PropertyBagRef = pelta::Ref<pelta::PropertyBag>;

// ---- form extender ------------------------------------------------------------

struct FormEvents {
    std::function<void(int32_t Step, bool& Cancel)> Fetch;
    std::function<void()> FillControls;
    std::function<void(bool& Modified)> IsModified;
    std::function<void(bool& Cancel)> IsCorrect;
    std::function<void()> Upload;
    std::function<void(bool& Cancel)> Save;
    std::function<void()> NewDocument;
    std::function<void(const pelta::Variant& Bookmark)> MovePosition;
    std::function<void(bool& Cancel)> QueryStandalone;
    std::function<void(bool& Cancel)> QueryClose;
    std::function<void(bool& Cancel)> QueryFree;
    std::function<void()> UnloadDocument;
    std::function<void()> MenuNegotiateEx;
    std::function<void()> AfterMenuNegotiate;
    std::function<void(int32_t CommandID, bool& Handled)> BeforeExecute;
    std::function<void(int32_t CommandID)> AfterExecute;
    std::function<void()> Resize;
    std::function<void()> Activate;
    std::function<void(int32_t& KeyCode, int32_t Shift)> KeyDown;
    std::function<void(int32_t Code, const pelta::Variant& Param)> Notify;
    std::function<void()> FlushCache;
    std::function<void(int32_t FilterID, const pelta::Variant& Value)> ApplyFilter;
    std::function<void(std::string& Caption)> CaptionChanged;
    std::function<void(const std::string& ControlName, bool& Cancel)> BeforeControlSetFocus;
};

class IFormExtender : public virtual pelta::Object {
public:
    virtual FormEvents& Events() = 0;

    virtual void Init(pelta::Object* Owner, const std::string& Caption, const std::string& LibName,
                      const std::string& ObjectName, int32_t HelpID) = 0;
    virtual pelta::Object* Owner() = 0;
    virtual std::string Caption() = 0;
    virtual void SetCaption(const std::string& Caption) = 0;
    virtual std::string ObjectName() = 0;
    virtual int32_t HelpID() = 0;

    virtual void SetClientSite(IClientSite* Site) = 0;
    virtual pelta::Ref<IClientSite> ClientSite() = 0;
    // The class of the detail form this list opens.
    virtual void RegisterDetailForm(const std::string& ClassName) = 0;
    virtual std::string DetailFormClass() = 0;
    // The layout key under which the screen's settings are kept.
    virtual void SetLayoutKey(const std::string& LayoutKey) = 0;

    // Menus and toolbar.
    virtual void RemoveCommands(const std::vector<int32_t>& CommandIDs) = 0;
    virtual void AddCommand(int32_t CommandID, const std::string& Caption,
                            const std::string& Band) = 0;
    virtual void SetCommandCaption(int32_t CommandID, const std::string& Caption) = 0;
    virtual void SetCommandTooltip(int32_t CommandID, const std::string& Tooltip) = 0;
    virtual void EnableCommand(int32_t CommandID, bool Enabled) = 0;
    virtual void ShowCommand(int32_t CommandID, bool Visible) = 0;

    // The cycle, driven by the framework and callable by the screen.
    // Fetch (step 1) then fill; False when the fetch was cancelled.
    virtual bool Refresh() = 0;
    // True when the screen asked for the reference lists on the next fetch.
    virtual bool Referentials() = 0;
    // IsModified, IsCorrect, Upload, Save; False when any step refused.
    virtual bool SaveDocument() = 0;
    // Shows a detail document for `Key` (empty: a new record) and fetches it.
    virtual bool ShowDocument(const std::string& Key) = 0;
    // Asks QueryClose and unloads the document; False when refused.
    virtual bool CloseDocument() = 0;
    // Performs a command: BeforeExecute, then the framework's own action
    // when not handled, then AfterExecute.
    virtual void Execute(int32_t CommandID) = 0;

    // Property bags: empty, or opened from a response.
    virtual PropertyBagRef CreatePropertyBag() = 0;
    virtual PropertyBagRef CreatePropertyBag(const pelta::Bytes& Contents, int32_t Const1,
                                             int32_t Const2, pelta::ObjectRef Context) = 0;

    // Messages and questions, through the user agent.
    virtual int32_t MsgBox(const std::string& Text, int32_t Style, const std::string& Caption = {},
                           const std::string& Details = {}) = 0;
    // A message anchored to a control, with a title and a hint.
    virtual void ShowMessage(const std::string& ControlName, const std::string& Text,
                             const std::string& Title = {}, const std::string& Hint = {}) = 0;
    // Answers vbYes or vbNo.
    virtual int32_t AskYesNo(const std::string& Text, const std::string& Caption = {}) = 0;
    // False when cancelled; `Value` carries the default in and the answer out.
    virtual bool InputBox(const std::string& Prompt, const std::string& Title,
                          pelta::Variant& Value) = 0;
    // A dialog with one list field: `Choices` are offered (numbered from 1),
    // `Choice` carries the preselected number in and the chosen one out.
    // False when cancelled.
    virtual bool InputList(const std::string& Title, const std::string& Prompt,
                           const std::vector<std::string>& Choices, int32_t& Choice) = 0;
    // A save-file dialog titled `Title`: `Filter` lists descriptions and their
    // patterns joined by "|" ("Текст|*.txt|Всички файлове (*.*)|*.*"),
    // `InitialDir` is the folder offered first, `FileName` carries the name
    // offered in and the chosen file's path out. False when cancelled, and
    // from a host that cannot save files.
    virtual bool SaveFileDialog(const std::string& Title, const std::string& Filter,
                                const std::string& InitialDir, std::string& FileName) {
        (void)Title, (void)Filter, (void)InitialDir, (void)FileName;
        return false;
    }

    // Settings under the screen's layout key.
    virtual pelta::Variant GetSetting(const std::string& Name, const pelta::Variant& Default) = 0;
    virtual void SaveSetting(const std::string& Name, const pelta::Variant& Value) = 0;

    // Controls: declared once; the framework holds their values.
    virtual void DeclareControls(const std::vector<ControlDecl>& Controls) = 0;
    virtual pelta::Variant ControlValue(const std::string& Name) = 0;
    virtual void SetControlValue(const std::string& Name, const pelta::Variant& Value) = 0;
    // Rows a combo offers: the key field, the shown field and further columns.
    virtual void SetControlList(const std::string& Name, RecordsetRef Rows,
                                const std::string& KeyField,
                                const std::vector<std::string>& ShownFields) = 0;
    virtual void SetFocus(const std::string& Name) = 0;
};

// ---- grid extender ------------------------------------------------------------

struct RowFormatArgs {
    pelta::Variant Bookmark;
    std::string RowStyle;
    std::vector<std::pair<std::string, std::string>> CellStyles;  // column, style
};

struct GridEvents {
    // A computed column's value for the row at `Bookmark`.
    std::function<void(const pelta::Variant& Bookmark, const std::string& Column,
                       pelta::Variant& Value)>
        FetchData;
    std::function<void(bool& Cancel)> BeforeUpdate;
    std::function<void()> AfterUpdate;
    std::function<void(const std::string& Column, const pelta::Variant& OldValue, bool& Cancel)>
        BeforeColUpdate;
    std::function<void(const std::string& Column)> AfterColUpdate;
    std::function<void(bool& Cancel)> BeforeDelete;
    std::function<void(const std::vector<pelta::Variant>& Bookmarks, bool& Cancel)> BeforeDeleteEX;
    std::function<void()> AfterDelete;
    std::function<void(const pelta::Variant& LastBookmark, const std::string& LastColumn)>
        RowColChange;
    std::function<void()> SelectionChange;
    std::function<void()> CalcTotals;
    std::function<void(RowFormatArgs& Args)> RowFormat;
    std::function<void(const pelta::Variant& Selection)> AddFromSelector;
    std::function<void(const std::string& Column, bool& Cancel)> BeforeShowSelector;
    std::function<void(const std::string& Column)> BeforeInitComboColumn;
    std::function<void(const std::string& Column, pelta::Variant& Value, bool& Cancel)>
        BeforeEndComboColumn;
    std::function<void(const std::string& Column, bool& Cancel)> BeforeFixSingleCheck;
    std::function<void(const std::string& Column, bool& Show)> CanShowColumn;
    std::function<void(bool& Cancel)> CanOpen;
    std::function<void()> MenuNegotiateEx;
    std::function<void(int32_t CommandID, bool& Handled)> BeforeExecute;
    std::function<void()> DblClick;
    // A code read by a barcode scanner while the grid had the focus.
    std::function<void(const std::string& Code)> ScannerReceive;
};

class IGridExtender : public virtual pelta::Object {
public:
    virtual GridEvents& Events() = 0;

    virtual void Init(pelta::Object* Owner, const std::string& GridName, int32_t HelpID,
                      const std::string& LayoutKey) = 0;
    virtual std::string GridName() = 0;
    virtual void DeclareColumns(const std::vector<ColumnDecl>& Columns) = 0;
    virtual std::vector<ColumnDecl> Columns() = 0;
    // Rows a combo column offers: the key field, the shown field and further
    // columns (as IFormExtender::SetControlList for a control). A grid that
    // draws no lists may ignore it.
    virtual void SetColumnList(const std::string& Column, RecordsetRef Rows,
                               const std::string& KeyField,
                               const std::vector<std::string>& ShownFields) {
        (void)Column, (void)Rows, (void)KeyField, (void)ShownFields;
    }

    // Binds rows, optionally grouped by a column with an initial group value
    // ("(Всички)" shows every group).
    virtual void Bind(RecordsetRef Rows, const std::string& GroupColumn = {},
                      const pelta::Variant& GroupValue = {}) = 0;
    virtual RecordsetRef Rows() = 0;
    virtual void Refresh() = 0;

    // The current row.
    virtual bool HasCurrentRow() = 0;
    virtual pelta::Variant CurrentValue(const std::string& Column) = 0;
    virtual pelta::Variant CurrentBookmark() = 0;
    virtual bool SetCurrentBookmark(const pelta::Variant& Bookmark) = 0;
    // Positions on the first row matching a criterion ("ID='{...}'").
    virtual bool MoveToRow(const std::string& Criterion) = 0;
    // The screen's own change of a cell of the current row (a value computed
    // from another cell), without column events; False without a current row
    // or such a column.
    virtual bool SetCurrentValue(const std::string& Column, const pelta::Variant& Value) = 0;

    // Marked (selected) rows.
    virtual bool MultiSelect() = 0;
    virtual void SetMultiSelect(bool MultiSelect) = 0;
    virtual std::vector<pelta::Variant> SelectedBookmarks() = 0;
    virtual void SetSelectedBookmarks(const std::vector<pelta::Variant>& Bookmarks) = 0;

    // Edit state: True when rows were changed since binding.
    virtual bool EditState() = 0;
    // Runs BeforeUpdate over every changed row; False when one is refused
    // (the grid then stands on that row).
    virtual bool ValidateRows() = 0;
    // The grid's own delete of the current or marked rows: BeforeDelete, and
    // the rows go when not cancelled. False when cancelled.
    virtual bool DeleteRows() = 0;
};

// ---- further extenders ----------------------------------------------------------

struct TreeEvents {
    std::function<void(const std::string& NodeKey)> NodeActivate;
    std::function<void()> MenuNegotiateEx;
    std::function<void(int32_t CommandID, bool& Handled)> BeforeExecute;
    std::function<void()> DblClick;
};

class ITreeExtender : public virtual pelta::Object {
public:
    virtual TreeEvents& Events() = 0;
    virtual void Init(pelta::Object* Owner, const std::string& TreeName, int32_t HelpID) = 0;
    virtual void Clear() = 0;
    virtual void AddNode(const std::string& ParentKey, const std::string& Key,
                         const std::string& Text) = 0;
    virtual std::string SelectedKey() = 0;
    virtual bool SelectNode(const std::string& Key) = 0;
};

struct SplitterEvents {
    std::function<void(bool& Cancel)> BeginSplit;
    std::function<void(double Position)> Split;
};

class ISplitterExtender : public virtual pelta::Object {
public:
    virtual SplitterEvents& Events() = 0;
    virtual void Init(pelta::Object* Owner, const std::string& SettingName, double Default) = 0;
    virtual double Position() = 0;
    virtual void SetPosition(double Position) = 0;
};

struct TabEvents {
    std::function<void(int32_t Tab, bool& Cancel)> BeforeClick;
    std::function<void(int32_t Tab)> Click;
};

class ITabExtender : public virtual pelta::Object {
public:
    virtual TabEvents& Events() = 0;
    virtual void Init(pelta::Object* Owner, const std::vector<std::string>& Captions) = 0;
    virtual int32_t CurrentTab() = 0;
    virtual void SetCurrentTab(int32_t Tab) = 0;
};

struct QuickFilterEvents {
    // Builds the row filter clause for a filter field's text.
    std::function<void(int32_t FilterID, const std::string& Text, std::string& Clause,
                       bool& Handled)>
        FilterClause;
    std::function<void(int32_t FilterID)> ClearClause;
    std::function<void(bool& Cancel)> BeforeFilter;
};

class IQuickFilterExtender : public virtual pelta::Object {
public:
    virtual QuickFilterEvents& Events() = 0;
    virtual void Init(pelta::Object* Owner, IGridExtender* Grid, const std::string& Hint) = 0;
    virtual void AddField(int32_t FilterID, const std::string& Caption,
                          const std::vector<std::string>& Fields) = 0;
    virtual void SetText(int32_t FilterID, const std::string& Text) = 0;
    virtual std::string Text(int32_t FilterID) = 0;
    // Applies every field's clause to the grid's rows.
    virtual void Apply() = 0;
    // A field chosen from rows instead of typed: `FirstEntry` ("(Всички)")
    // comes first and means no choice; the text of the field is then the
    // chosen row's `KeyField` value.
    virtual void SetFieldList(int32_t FilterID, RecordsetRef Rows, const std::string& KeyField,
                              const std::string& ShownField, const std::string& FirstEntry) = 0;
};

struct FooterEvents {
    std::function<void(int32_t Button)> Click;
};

class IFooterExtender : public virtual pelta::Object {
public:
    virtual FooterEvents& Events() = 0;
    virtual void Init(pelta::Object* Owner, const std::vector<std::string>& Buttons) = 0;
};

struct PresetEvents {
    std::function<void(std::string& Description)> UpdateDescription;
};

class IPresetExtender : public virtual pelta::Object {
public:
    virtual PresetEvents& Events() = 0;
    virtual void Init(pelta::Object* Owner, const std::string& LayoutKey) = 0;
};

struct ReportEvents {
    std::function<void(int32_t Step, bool& Cancel)> Fetch;
    std::function<void()> FillControls;
    std::function<void(bool& Cancel)> Filter;
    std::function<void(int32_t CommandID, bool& Handled)> BeforeExecute;
    std::function<void()> MenuNegotiateEx;
    std::function<void(const std::string& Section)> SectionFormat;
    std::function<void()> ReportStart;
    std::function<void()> BeforeBindGrid;
};

class IReportExtender : public virtual pelta::Object {
public:
    virtual ReportEvents& Events() = 0;
    virtual void Init(pelta::Object* Owner, const std::string& Caption, const std::string& LibName,
                      const std::string& ObjectName) = 0;
};

// A band of filters above a list: drop-down lists that set what the list
// shows (a price-list type, a store) without filtering its rows, and command
// buttons. The framework raises Change when the user picks a value and Click
// for a button.
struct FilterBandEvents {
    std::function<void(int32_t FilterID, const pelta::Variant& Value)> Change;
    std::function<void(int32_t FilterID)> Click;
};

class IFilterBandExtender : public virtual pelta::Object {
public:
    virtual FilterBandEvents& Events() = 0;
    virtual void Init(pelta::Object* Owner, const std::string& Caption) = 0;
    // A drop-down list over rows (replaced when the filter exists): the key
    // field is the value, the shown field its text; `FirstEntry` (may be
    // empty) comes first and stands for the value Empty.
    virtual void AddList(int32_t FilterID, const std::string& Caption, RecordsetRef Rows,
                         const std::string& KeyField, const std::string& ShownField,
                         const std::string& FirstEntry) = 0;
    virtual void AddButton(int32_t FilterID, const std::string& Caption) = 0;
    virtual pelta::Variant Value(int32_t FilterID) = 0;
    // Sets the shown value without raising Change.
    virtual void SetValue(int32_t FilterID, const pelta::Variant& Value) = 0;
};

// The cache of a list's result sets: the screen declares every named set
// it uses (a result property of its read operation, or an index it derives
// from them) with its key columns and a slot; the framework keeps what the
// screen stores between fetches until the screen drops it by name.
class ICacheDefExtender : public virtual pelta::Object {
public:
    virtual void Init(pelta::Object* Owner, const std::string& DataSource) = 0;
    virtual std::string DataSource() = 0;
    // Raises InvalidProcedureCall for a name or slot declared twice.
    virtual void AddSet(const std::string& Name, int32_t Slot,
                        const std::vector<std::string>& KeyColumns, bool Derived) = 0;
    virtual bool IsCached(const std::string& Name) = 0;
    // Empty when not cached.
    virtual pelta::Variant Item(const std::string& Name) = 0;
    virtual void SetItem(const std::string& Name, const pelta::Variant& Value) = 0;
    virtual void Drop(const std::string& Name) = 0;
    // The declared result sets (not derived) that are not cached, in the
    // order of declaration.
    virtual std::vector<std::string> Missing() = 0;
};

// Field extenders over combo boxes, selectors, check boxes and text fields.
struct FieldEvents {
    std::function<void()> Change;
    std::function<void()> Click;
    std::function<void(const std::string& Url, bool& Cancel)> BeforeNavigate;
};

class IFieldExtender : public virtual pelta::Object {
public:
    virtual FieldEvents& Events() = 0;
    // Binds to a declared control of the owner's form.
    virtual void Init(IFormExtender* Form, const std::string& ControlName) = 0;
    virtual pelta::Variant Value() = 0;
    virtual void SetValue(const pelta::Variant& Value) = 0;
};

// ---- attribute grid ------------------------------------------------------------

// The attribute grid of a detail form: further fields of the head, one row
// each ("Име", "Стойност"), in numbered groups, with the chosen row's help
// text shown under the grid. Values live in the bound head row: the grid
// reads them from it and writes what the person enters straight into it.
enum class AttribEditor {
    Entry,  // text, or a number when Format is given
    CheckBox,
    List,       // rows of a reference set (SetList)
    FixedList,  // the fixed choices of Values
    Selector,   // a record of another nomenclature, picked by the screen
    TreeList,   // rows of a reference set with a parent field (SetList)
};

struct AttribDecl {
    int32_t Group = 0;    // one of the numbers of the grid's groups
    std::string Caption;  // "Нето тегло"
    std::string Field;    // the head field, "WeightNeto"
    AttribEditor Editor = AttribEditor::Entry;
    std::string Format;  // an entry's number format ("#,##0.000#####", "General Number")
    // FixedList: "0|(Няма)|1|На база обем|2|На база тегло", value then text.
    std::string Values;
    // Selector: the head field holding the shown name ("SecItmName").
    std::string ShownField;
    std::string Help;  // shown under the grid while the row is chosen
};

struct AttribEvents {
    // A value the person entered or chose, before it is written to the head;
    // a handler may change Value or cancel (the old value stays).
    std::function<void(const std::string& Field, pelta::Variant& Value, bool& Cancel)> BeforeUpdate;
    std::function<void(const std::string& Field)> AfterUpdate;
    // The button of a selector row: the screen picks the record and sets the
    // value and its shown name (UserSetValue, SetShownText).
    std::function<void(const std::string& Field)> ButtonClick;
    // A row is drawn: the screen may change the shown text and give a style
    // ("Inactive", "Required").
    std::function<void(const std::string& Field, std::string& Text, std::string& Style)> RowFormat;
    std::function<void(const std::string& Field)> SelChange;
};

class IAttribGridExtender : public virtual pelta::Object {
public:
    virtual AttribEvents& Events() = 0;
    // `Groups` "1|Основни|2|Мерки|...": numbers and captions in their order.
    virtual void Init(pelta::Object* Owner, const std::string& GridName,
                      const std::string& Groups) = 0;
    virtual std::string GridName() = 0;
    // Raises InvalidProcedureCall for a field declared twice or an unknown group.
    virtual void AddAttribute(const AttribDecl& Attribute) = 0;
    virtual std::vector<AttribDecl> Attributes() = 0;
    // The rows a list or tree attribute offers; a tree names its parent field.
    virtual void SetList(const std::string& Field, RecordsetRef Rows, const std::string& KeyField,
                         const std::string& ShownField, const std::string& ParentField = {}) = 0;
    // The head whose current row holds the values; clears the edit state.
    virtual void Bind(RecordsetRef Head) = 0;
    virtual pelta::Variant Value(const std::string& Field) = 0;
    // As the person enters it: converted to the head field's type (a number
    // typed as text, a list's key), BeforeUpdate, written, AfterUpdate. False
    // when refused (not a number, not among the list's rows, cancelled).
    virtual bool UserSetValue(const std::string& Field, const pelta::Variant& Value) = 0;
    // The screen's own change: written without events or edit state.
    virtual void SetValue(const std::string& Field, const pelta::Variant& Value) = 0;
    // The value as the row shows it: the list's or fixed list's text, the
    // selector's shown name, a number in its format, after RowFormat.
    virtual std::string ShownText(const std::string& Field) = 0;
    // Writes a selector's shown name into its ShownField.
    virtual void SetShownText(const std::string& Field, const std::string& Text) = 0;
    // True when the person changed a value since Bind or ResetEditState.
    virtual bool EditState() = 0;
    virtual void ResetEditState() = 0;
    virtual std::string SelectedField() = 0;
    // Chooses a row (a message points the person at it); raises SelChange.
    virtual void Select(const std::string& Field) = 0;
    // The chosen row's help text.
    virtual std::string HelpText() = 0;
};

}  // namespace PeltaNom15
