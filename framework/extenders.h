// The smaller extenders: tree, splitter, tab strip, quick filter, footer,
// preset filter, report and field. Screens set their handlers; hosts and
// tests raise their events through the public members (click, drag ...).
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "framework/extender_base.h"
#include "library/contracts/Extenders.h"
#include "platform/data/recordset.h"

namespace pelta::fw {

using PeltaNom15::PropertyBagRef;
using PeltaNom15::RecordsetRef;

class FormExtender;
class GridExtender;

struct TreeNode {
    std::string parentKey;  // empty at the root
    std::string key;
    std::string text;
};

// Registers itself with the services while it lives, so that a host finds
// the trees of a screen it did not make (treesOfOwner).
class TreeExtender : public PeltaNom15::ITreeExtender, public ExtenderBase {
public:
    TreeExtender();
    ~TreeExtender() override;
    TreeExtender(const TreeExtender&) = delete;
    TreeExtender& operator=(const TreeExtender&) = delete;

    PeltaNom15::TreeEvents& Events() override { return events_; }
    void Init(pelta::Object* Owner, const std::string& TreeName, int32_t HelpID) override;
    void Clear() override;
    // Raises InvalidProcedureCall for a duplicate key or an unknown parent.
    void AddNode(const std::string& ParentKey, const std::string& Key,
                 const std::string& Text) override;
    std::string SelectedKey() override { return selected_; }
    // Selects the node and raises NodeActivate; False for an unknown key.
    bool SelectNode(const std::string& Key) override;

    const std::string& treeName() const noexcept { return treeName_; }
    const std::vector<TreeNode>& nodes() const noexcept { return nodes_; }
    bool execute(int32_t commandID);  // True when handled
    void doubleClick();
    void negotiateMenu();

private:
    bool hasNode(const std::string& key) const;

    PeltaNom15::TreeEvents events_;
    std::string treeName_;
    int32_t helpID_ = 0;
    std::vector<TreeNode> nodes_;
    std::string selected_;
};

// The position is kept as the setting `SettingName` of the owner's form.
class SplitterExtender : public PeltaNom15::ISplitterExtender, public ExtenderBase {
public:
    PeltaNom15::SplitterEvents& Events() override { return events_; }
    void Init(pelta::Object* Owner, const std::string& SettingName, double Default) override;
    double Position() override { return position_; }
    void SetPosition(double Position) override;

    // The user drags the splitter: BeginSplit may refuse, then the position
    // is set and Split raised. False when refused.
    bool drag(double position);
    const std::string& settingName() const noexcept { return settingName_; }

private:
    PeltaNom15::SplitterEvents events_;
    std::string settingName_;
    double position_ = 0;
};

// Tabs are counted from 0 in the order of their captions.
class TabExtender : public PeltaNom15::ITabExtender, public ExtenderBase {
public:
    PeltaNom15::TabEvents& Events() override { return events_; }
    void Init(pelta::Object* Owner, const std::vector<std::string>& Captions) override;
    int32_t CurrentTab() override { return current_; }
    // Raises SubscriptOutOfRange for a tab that does not exist.
    void SetCurrentTab(int32_t Tab) override;

    // The user clicks a tab: BeforeClick may refuse, then the tab becomes
    // current and Click is raised. False when refused.
    bool click(int32_t tab);
    const std::vector<std::string>& captions() const noexcept { return captions_; }

private:
    PeltaNom15::TabEvents events_;
    std::vector<std::string> captions_;
    int32_t current_ = 0;
};

// Filters a grid by typed texts. A field whose clause the screen does not
// build matches rows where any of its fields contains the text.
// Registers itself with the services while it lives, so that a host finds
// the quick filters of a screen it did not make (quickFiltersOfOwner).
class QuickFilterExtender : public PeltaNom15::IQuickFilterExtender, public ExtenderBase {
public:
    QuickFilterExtender();
    ~QuickFilterExtender() override;
    QuickFilterExtender(const QuickFilterExtender&) = delete;
    QuickFilterExtender& operator=(const QuickFilterExtender&) = delete;

    PeltaNom15::QuickFilterEvents& Events() override { return events_; }
    void Init(pelta::Object* Owner, PeltaNom15::IGridExtender* Grid,
              const std::string& Hint) override;
    void AddField(int32_t FilterID, const std::string& Caption,
                  const std::vector<std::string>& Fields) override;
    // Clearing a text raises ClearClause.
    void SetText(int32_t FilterID, const std::string& Text) override;
    std::string Text(int32_t FilterID) override;
    // BeforeFilter may refuse; then FilterClause per field with a text; the
    // clauses joined with AND become the grid's row filter.
    void Apply() override;

    void SetFieldList(int32_t FilterID, RecordsetRef Rows, const std::string& KeyField,
                      const std::string& ShownField, const std::string& FirstEntry) override;

    struct Field {
        int32_t id = 0;
        std::string caption;
        std::vector<std::string> fields;
        std::string text;
        // A field chosen from rows (SetFieldList).
        RecordsetRef listRows;
        std::string listKey;
        std::string listShown;
        std::string listFirst;
    };
    const std::vector<Field>& fields() const noexcept { return fields_; }
    const std::string& hint() const noexcept { return hint_; }
    // The grid the filter applies to; null before Init.
    PeltaNom15::IGridExtender* grid() const noexcept { return grid_.get(); }

private:
    Field& fieldRef(int32_t id);

    PeltaNom15::QuickFilterEvents events_;
    pelta::Ref<PeltaNom15::IGridExtender> grid_;
    std::string hint_;
    std::vector<Field> fields_;
};

class FooterExtender : public PeltaNom15::IFooterExtender, public ExtenderBase {
public:
    PeltaNom15::FooterEvents& Events() override { return events_; }
    void Init(pelta::Object* Owner, const std::vector<std::string>& Buttons) override;
    const std::vector<std::string>& buttons() const noexcept { return buttons_; }
    // Raises SubscriptOutOfRange for a button that does not exist.
    void click(int32_t button);

private:
    PeltaNom15::FooterEvents events_;
    std::vector<std::string> buttons_;
};

class PresetExtender : public PeltaNom15::IPresetExtender, public ExtenderBase {
public:
    PeltaNom15::PresetEvents& Events() override { return events_; }
    void Init(pelta::Object* Owner, const std::string& LayoutKey) override;
    // Asks the screen for the description of the filter in force.
    std::string updateDescription();
    const std::string& description() const noexcept { return description_; }
    const std::string& layoutKey() const noexcept { return layoutKey_; }

private:
    PeltaNom15::PresetEvents events_;
    std::string layoutKey_;
    std::string description_;
};

class ReportExtender : public PeltaNom15::IReportExtender, public ExtenderBase {
public:
    PeltaNom15::ReportEvents& Events() override { return events_; }
    void Init(pelta::Object* Owner, const std::string& Caption, const std::string& LibName,
              const std::string& ObjectName) override;

    const std::string& caption() const noexcept { return caption_; }
    const std::string& objectName() const noexcept { return objectName_; }
    // Filter (may refuse), Fetch step 1 (may cancel), ReportStart,
    // BeforeBindGrid, FillControls. False when refused or cancelled.
    bool run();
    void formatSection(const std::string& section);
    bool execute(int32_t commandID);  // True when handled
    void negotiateMenu();

private:
    PeltaNom15::ReportEvents events_;
    std::string caption_;
    std::string libName_;
    std::string objectName_;
};

// A field extender over a declared control of a form: its value is the
// control's value.
class FieldExtender : public PeltaNom15::IFieldExtender, public ExtenderBase {
public:
    ~FieldExtender() override;
    PeltaNom15::FieldEvents& Events() override { return events_; }
    // Raises InvalidProcedureCall when the form has no such control.
    void Init(PeltaNom15::IFormExtender* Form, const std::string& ControlName) override;
    pelta::Variant Value() override;
    void SetValue(const pelta::Variant& Value) override;

    const std::string& controlName() const noexcept { return control_; }
    void raiseChange();
    void raiseClick();
    // The user follows a link; False when the screen cancels.
    bool navigate(const std::string& url);

private:
    friend class FormExtender;
    PeltaNom15::FieldEvents events_;
    pelta::Ref<PeltaNom15::IFormExtender> form_;
    std::string control_;
};

}  // namespace pelta::fw
