#include "framework/extenders.h"

#include <algorithm>

#include "framework/form_extender.h"
#include "framework/grid_extender.h"
#include "framework/services.h"
#include "platform/automation/error.h"
#include "platform/data/recordset.h"

namespace pelta::fw {

using namespace PeltaNom15;

// ---- TreeExtender -------------------------------------------------------------------

TreeExtender::TreeExtender() {
    services()->addTree(this);
}

TreeExtender::~TreeExtender() {
    services()->removeTree(this);
}

void TreeExtender::Init(pelta::Object* Owner, const std::string& TreeName, int32_t HelpID) {
    setOwner(Owner);
    treeName_ = TreeName;
    helpID_ = HelpID;
}

void TreeExtender::Clear() {
    nodes_.clear();
    selected_.clear();
}

bool TreeExtender::hasNode(const std::string& key) const {
    return std::any_of(nodes_.begin(), nodes_.end(),
                       [&](const TreeNode& n) { return n.key == key; });
}

void TreeExtender::AddNode(const std::string& ParentKey, const std::string& Key,
                           const std::string& Text) {
    if (Key.empty() || hasNode(Key))
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The tree " + treeName_ + " already has a node \"" + Key + "\"",
                     "TreeExtender.AddNode");
    if (!ParentKey.empty() && !hasNode(ParentKey))
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The tree " + treeName_ + " has no parent node \"" + ParentKey + "\"",
                     "TreeExtender.AddNode");
    nodes_.push_back(TreeNode{ParentKey, Key, Text});
}

bool TreeExtender::SelectNode(const std::string& Key) {
    if (!hasNode(Key)) return false;
    selected_ = Key;
    raise(events_.NodeActivate, Key);
    return true;
}

bool TreeExtender::execute(int32_t commandID) {
    bool handled = false;
    raise(events_.BeforeExecute, commandID, handled);
    return handled;
}

void TreeExtender::doubleClick() {
    raise(events_.DblClick);
}
void TreeExtender::negotiateMenu() {
    raise(events_.MenuNegotiateEx);
}

// ---- SplitterExtender ---------------------------------------------------------------

void SplitterExtender::Init(pelta::Object* Owner, const std::string& SettingName, double Default) {
    setOwner(Owner);
    settingName_ = SettingName;
    position_ = Default;
    if (auto* form = services()->formOfOwner(Owner); form && !SettingName.empty()) {
        auto kept = form->GetSetting(SettingName, pelta::Variant(Default));
        if (kept.isNumeric() && !kept.isEmpty()) position_ = kept.toDouble();
    }
}

void SplitterExtender::SetPosition(double Position) {
    position_ = Position;
    if (auto* form = services()->formOfOwner(owner()); form && !settingName_.empty())
        form->SaveSetting(settingName_, pelta::Variant(Position));
}

bool SplitterExtender::drag(double position) {
    bool cancel = false;
    raise(events_.BeginSplit, cancel);
    if (cancel) return false;
    SetPosition(position);
    raise(events_.Split, position);
    return true;
}

// ---- TabExtender --------------------------------------------------------------------

void TabExtender::Init(pelta::Object* Owner, const std::vector<std::string>& Captions) {
    setOwner(Owner);
    captions_ = Captions;
    current_ = 0;
}

void TabExtender::SetCurrentTab(int32_t Tab) {
    if (Tab < 0 || static_cast<size_t>(Tab) >= captions_.size())
        pelta::raise(pelta::errc::SubscriptOutOfRange, "There is no tab " + std::to_string(Tab),
                     "TabExtender.SetCurrentTab");
    current_ = Tab;
}

bool TabExtender::click(int32_t tab) {
    if (tab < 0 || static_cast<size_t>(tab) >= captions_.size())
        pelta::raise(pelta::errc::SubscriptOutOfRange, "There is no tab " + std::to_string(tab),
                     "TabExtender.click");
    bool cancel = false;
    raise(events_.BeforeClick, tab, cancel);
    if (cancel) return false;
    current_ = tab;
    raise(events_.Click, tab);
    return true;
}

// ---- QuickFilterExtender ------------------------------------------------------------

QuickFilterExtender::QuickFilterExtender() {
    services()->addQuickFilter(this);
}

QuickFilterExtender::~QuickFilterExtender() {
    services()->removeQuickFilter(this);
}

void QuickFilterExtender::Init(pelta::Object* Owner, IGridExtender* Grid, const std::string& Hint) {
    setOwner(Owner);
    grid_ = Grid;
    hint_ = Hint;
}

QuickFilterExtender::Field& QuickFilterExtender::fieldRef(int32_t id) {
    for (auto& f : fields_)
        if (f.id == id) return f;
    pelta::raise(pelta::errc::InvalidProcedureCall,
                 "The quick filter has no field " + std::to_string(id), "QuickFilterExtender");
}

void QuickFilterExtender::AddField(int32_t FilterID, const std::string& Caption,
                                   const std::vector<std::string>& Fields) {
    for (auto& f : fields_)
        if (f.id == FilterID) {
            f.caption = Caption;
            f.fields = Fields;
            return;
        }
    Field f;
    f.id = FilterID;
    f.caption = Caption;
    f.fields = Fields;
    fields_.push_back(std::move(f));
}

void QuickFilterExtender::SetFieldList(int32_t FilterID, RecordsetRef Rows,
                                       const std::string& KeyField, const std::string& ShownField,
                                       const std::string& FirstEntry) {
    auto& f = fieldRef(FilterID);
    f.listRows = std::move(Rows);
    f.listKey = KeyField;
    f.listShown = ShownField;
    f.listFirst = FirstEntry;
}

void QuickFilterExtender::SetText(int32_t FilterID, const std::string& Text) {
    auto& f = fieldRef(FilterID);
    bool cleared = !f.text.empty() && Text.empty();
    f.text = Text;
    if (cleared) raise(events_.ClearClause, FilterID);
}

std::string QuickFilterExtender::Text(int32_t FilterID) {
    return fieldRef(FilterID).text;
}

void QuickFilterExtender::Apply() {
    bool cancel = false;
    raise(events_.BeforeFilter, cancel);
    if (cancel) return;
    std::string all;
    for (const auto& f : fields_) {
        if (f.text.empty()) continue;
        std::string clause;
        bool handled = false;
        raise(events_.FilterClause, f.id, f.text, clause, handled);
        if (!handled) {
            // Quotes doubled, wildcards bracketed: the text matches itself.
            std::string quoted;
            for (char c : f.text) {
                if (c == '*' || c == '%' || c == '[')
                    quoted += std::string("[") + c + "]";
                else
                    quoted += c;
                if (c == '\'') quoted += '\'';
            }
            for (const auto& name : f.fields)
                clause += (clause.empty() ? "" : " OR ") + name + " LIKE '*" + quoted + "*'";
        }
        if (clause.empty()) continue;
        all += (all.empty() ? "(" : " AND (") + clause + ")";
    }
    auto* grid = pelta::query<GridExtender>(grid_.get());
    if (!grid)
        pelta::raise(pelta::errc::ObjectVariableNotSet, "The quick filter has no grid",
                     "QuickFilterExtender.Apply");
    grid->setRowFilter(all);
}

// ---- FooterExtender -----------------------------------------------------------------

void FooterExtender::Init(pelta::Object* Owner, const std::vector<std::string>& Buttons) {
    setOwner(Owner);
    buttons_ = Buttons;
}

void FooterExtender::click(int32_t button) {
    if (button < 0 || static_cast<size_t>(button) >= buttons_.size())
        pelta::raise(pelta::errc::SubscriptOutOfRange,
                     "There is no footer button " + std::to_string(button), "FooterExtender.click");
    raise(events_.Click, button);
}

// ---- PresetExtender -----------------------------------------------------------------

void PresetExtender::Init(pelta::Object* Owner, const std::string& LayoutKey) {
    setOwner(Owner);
    layoutKey_ = LayoutKey;
}

std::string PresetExtender::updateDescription() {
    std::string description = description_;
    raise(events_.UpdateDescription, description);
    description_ = std::move(description);
    return description_;
}

// ---- ReportExtender -----------------------------------------------------------------

void ReportExtender::Init(pelta::Object* Owner, const std::string& Caption,
                          const std::string& LibName, const std::string& ObjectName) {
    setOwner(Owner);
    caption_ = Caption;
    libName_ = LibName;
    objectName_ = ObjectName;
}

bool ReportExtender::run() {
    bool cancel = false;
    raise(events_.Filter, cancel);
    if (cancel) return false;
    raise(events_.Fetch, 1, cancel);
    if (cancel) return false;
    raise(events_.ReportStart);
    raise(events_.BeforeBindGrid);
    raise(events_.FillControls);
    return true;
}

void ReportExtender::formatSection(const std::string& section) {
    raise(events_.SectionFormat, section);
}

bool ReportExtender::execute(int32_t commandID) {
    bool handled = false;
    raise(events_.BeforeExecute, commandID, handled);
    return handled;
}

void ReportExtender::negotiateMenu() {
    raise(events_.MenuNegotiateEx);
}

// ---- FieldExtender ------------------------------------------------------------------

FieldExtender::~FieldExtender() {
    if (auto* form = pelta::query<FormExtender>(form_.get())) form->detachField(this);
}

void FieldExtender::Init(IFormExtender* Form, const std::string& ControlName) {
    auto* form = pelta::query<FormExtender>(Form);
    if (!form)
        pelta::raise(pelta::errc::ObjectRequired, "A field extender needs a form extender",
                     "FieldExtender.Init");
    if (!form->hasControl(ControlName))
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The form " + form->ObjectName() + " declares no control " + ControlName,
                     "FieldExtender.Init");
    if (auto* old = pelta::query<FormExtender>(form_.get())) old->detachField(this);
    form_ = Form;
    control_ = ControlName;
    setOwner(form->owner());
    form->attachField(this);
}

pelta::Variant FieldExtender::Value() {
    if (!form_) return {};
    return form_->ControlValue(control_);
}

void FieldExtender::SetValue(const pelta::Variant& Value) {
    if (!form_)
        pelta::raise(pelta::errc::ObjectVariableNotSet, "The field extender is not initialised",
                     "FieldExtender.SetValue");
    form_->SetControlValue(control_, Value);
}

void FieldExtender::raiseChange() {
    raise(events_.Change);
}
void FieldExtender::raiseClick() {
    raise(events_.Click);
}

bool FieldExtender::navigate(const std::string& url) {
    bool cancel = false;
    raise(events_.BeforeNavigate, url, cancel);
    return !cancel;
}

}  // namespace pelta::fw
