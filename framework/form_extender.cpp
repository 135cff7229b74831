#include "framework/form_extender.h"

#include <algorithm>

#include "framework/attrib_grid.h"
#include "framework/extenders.h"
#include "framework/services.h"
#include "library/contracts/Constants.h"
#include "platform/automation/ascii.h"
#include "platform/automation/error.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace pelta::fw {

using namespace PeltaNom15;

namespace {

pelta::Ref<UserAgent> requireAgent(const std::string& what) {
    auto agent = currentUserAgent();
    if (!agent)
        pelta::raise(pelta::errc::Fail, "No user agent answers \"" + what + "\"", "FormExtender");
    return agent;
}

}  // namespace

std::vector<MenuCommand> standardCommands() {
    return {
        {kCmdNew, "Нов\tCtrl+N", "Нов (Ctrl+N)", "file", true, true, "Ctrl+N"},
        {kCmdOpen, "Отвори\tCtrl+O", "Отвори (Ctrl+O)", "file", true, true, "Ctrl+O"},
        {kCmdSave, "Запис\tCtrl+S", "Запис (Ctrl+S)", "file", true, true, "Ctrl+S"},
        {kCmdSaveAs, "Запис като...", "Запис като", "file", true, true, ""},
        {kCmdPrint, "Печат...\tCtrl+P", "Печат (Ctrl+P)", "file", true, true, "Ctrl+P"},
        {kCmdExport, "Експорт...", "Експорт", "file", true, true, ""},
        {kCmdCopyRecord, "Копие на запис", "Копие на запис", "edit", true, true, ""},
        {kCmdCopy, "Копирай", "Копирай", "edit", true, true, ""},
        {kCmdDelete, "Изтрий", "Изтрий", "edit", true, true, ""},
        {kCmdDeleteInactive, "Изтрий\tDel", "Изтрий (Del)", "edit", true, true, "Del"},
        {kCmdRefresh, "Обнови\tF5", "Обнови (F5)", "view", true, true, "F5"},
        {kCmdFilter, "Филтър...", "Филтър", "view", true, true, ""},
        {kCmdProperties, "Свойства...", "Свойства", "tools", true, true, ""},
    };
}

FormExtender::FormExtender() : menu_(standardCommands()) {
    services()->addForm(this);
}

FormExtender::~FormExtender() {
    services()->removeForm(this);
}

void FormExtender::Init(pelta::Object* Owner, const std::string& Caption,
                        const std::string& LibName, const std::string& ObjectName, int32_t HelpID) {
    setOwner(Owner);
    caption_ = Caption;
    libName_ = LibName;
    objectName_ = ObjectName;
    helpID_ = HelpID;
}

void FormExtender::SetCaption(const std::string& Caption) {
    std::string caption = Caption;
    raise(events_.CaptionChanged, caption);
    caption_ = std::move(caption);
}

void FormExtender::SetClientSite(IClientSite* Site) {
    site_ = Site;
}

void FormExtender::RegisterDetailForm(const std::string& ClassName) {
    detailFormClass_ = ClassName;
}

void FormExtender::SetLayoutKey(const std::string& LayoutKey) {
    layoutKey_ = LayoutKey;
}

std::string FormExtender::layoutKey() const {
    return layoutKey_.empty() ? objectName_ : layoutKey_;
}

// ---- menu ---------------------------------------------------------------------------

void FormExtender::RemoveCommands(const std::vector<int32_t>& CommandIDs) {
    menu_.erase(std::remove_if(menu_.begin(), menu_.end(),
                               [&](const MenuCommand& c) {
                                   return std::find(CommandIDs.begin(), CommandIDs.end(), c.id) !=
                                          CommandIDs.end();
                               }),
                menu_.end());
}

void FormExtender::AddCommand(int32_t CommandID, const std::string& Caption,
                              const std::string& Band) {
    for (auto& c : menu_) {
        if (c.id != CommandID) continue;
        c.caption = Caption;
        c.band = Band;
        return;
    }
    MenuCommand c;
    c.id = CommandID;
    c.caption = Caption;
    c.band = Band;
    // "Caption\tCtrl+N": the text after the tab is the shortcut.
    if (auto tab = Caption.find('\t'); tab != std::string::npos)
        c.shortcut = Caption.substr(tab + 1);
    menu_.push_back(std::move(c));
}

MenuCommand& FormExtender::commandRef(int32_t id) {
    for (auto& c : menu_)
        if (c.id == id) return c;
    pelta::raise(pelta::errc::InvalidProcedureCall,
                 "The menu of " + objectName_ + " has no command " + std::to_string(id),
                 "FormExtender");
}

const MenuCommand* FormExtender::command(int32_t id) const {
    for (const auto& c : menu_)
        if (c.id == id) return &c;
    return nullptr;
}

void FormExtender::SetCommandCaption(int32_t CommandID, const std::string& Caption) {
    auto& c = commandRef(CommandID);
    c.caption = Caption;
    if (auto tab = Caption.find('\t'); tab != std::string::npos)
        c.shortcut = Caption.substr(tab + 1);
}

void FormExtender::SetCommandTooltip(int32_t CommandID, const std::string& Tooltip) {
    commandRef(CommandID).tooltip = Tooltip;
}

void FormExtender::EnableCommand(int32_t CommandID, bool Enabled) {
    commandRef(CommandID).enabled = Enabled;
}

void FormExtender::ShowCommand(int32_t CommandID, bool Visible) {
    commandRef(CommandID).visible = Visible;
}

bool FormExtender::executeShortcut(const std::string& shortcut) {
    for (const auto& c : menu_) {
        if (!c.visible || !c.enabled || c.shortcut.empty() ||
            !equalsNoCaseAscii(c.shortcut, shortcut))
            continue;
        Execute(c.id);
        return true;
    }
    return false;
}

// ---- the document cycle -------------------------------------------------------------

bool FormExtender::fetchAndFill() {
    bool cancel = false;
    ++fetches_;
    raise(events_.Fetch, 1, cancel);
    if (cancel) return false;
    referentials_ = false;
    raise(events_.FillControls);
    return true;
}

bool FormExtender::Refresh() {
    return fetchAndFill();
}

bool FormExtender::isModified() {
    bool modified = true;  // a screen that does not tell is saved every time
    if (events_.IsModified) {
        modified = false;
        events_.IsModified(modified);
    }
    return modified;
}

bool FormExtender::SaveDocument() {
    if (!isModified()) return true;
    bool cancel = false;
    raise(events_.IsCorrect, cancel);
    if (cancel) return false;
    raise(events_.Upload);
    cancel = false;
    raise(events_.Save, cancel);
    if (cancel) return false;
    // The answer of the save replaced the screen's data: show it.
    raise(events_.FillControls);
    return true;
}

bool FormExtender::ShowDocument(const std::string& Key) {
    key_ = Key;
    shown_ = true;
    closed_ = false;
    if (!fetchAndFill()) return false;
    if (auto agent = currentUserAgent()) agent->documentShown(*this);
    return true;
}

bool FormExtender::movePosition(const pelta::Variant& bookmark) {
    raise(events_.MovePosition, bookmark);
    if (bookmark.isArray() && !bookmark.array().empty() && bookmark.array()[0].isString())
        key_ = bookmark.array()[0].str();
    return fetchAndFill();
}

bool FormExtender::CloseDocument() {
    bool cancel = false;
    raise(events_.QueryClose, cancel);
    if (cancel) return false;
    raise(events_.UnloadDocument);
    shown_ = false;
    closed_ = true;
    return true;
}

void FormExtender::Execute(int32_t CommandID) {
    bool handled = false;
    raise(events_.BeforeExecute, CommandID, handled);
    if (!handled) {
        switch (CommandID) {
            case kCmdRefresh:
                Refresh();
                break;
            case kCmdSave:
                SaveDocument();
                break;
            case kCmdNew:
                if (shown_) {
                    raise(events_.NewDocument);
                    key_.clear();
                    fetchAndFill();
                }
                break;
            default:
                break;
        }
    }
    raise(events_.AfterExecute, CommandID);
}

bool FormExtender::queryStandalone() {
    bool cancel = false;
    raise(events_.QueryStandalone, cancel);
    return !cancel;
}

bool FormExtender::queryFree() {
    bool cancel = false;
    raise(events_.QueryFree, cancel);
    return !cancel;
}

void FormExtender::negotiateMenu() {
    raise(events_.MenuNegotiateEx);
    raise(events_.AfterMenuNegotiate);
}

void FormExtender::activate() {
    raise(events_.Activate);
}
void FormExtender::resize() {
    raise(events_.Resize);
}
void FormExtender::keyDown(int32_t& keyCode, int32_t shift) {
    raise(events_.KeyDown, keyCode, shift);
}
void FormExtender::notify(int32_t code, const pelta::Variant& param) {
    raise(events_.Notify, code, param);
}
void FormExtender::flushCache() {
    referentials_ = true;
    raise(events_.FlushCache);
}
void FormExtender::applyFilter(int32_t filterID, const pelta::Variant& value) {
    raise(events_.ApplyFilter, filterID, value);
}

// ---- property bags ------------------------------------------------------------------

PropertyBagRef FormExtender::CreatePropertyBag() {
    return pelta::makeRef<pelta::PropertyBag>();
}

PropertyBagRef FormExtender::CreatePropertyBag(const pelta::Bytes& Contents, int32_t Const1,
                                               int32_t Const2, pelta::ObjectRef Context) {
    if (Const1 != kBagConst1 || Const2 != kBagConst2)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "A property bag is opened with the constants 2 and -2",
                     "FormExtender.CreatePropertyBag");
    // The transport context of this framework's connections carries nothing
    // the bag needs: the bytes describe themselves.
    (void)Context;
    return pelta::PropertyBag::fromContents(Contents);
}

// ---- messages -----------------------------------------------------------------------

int32_t FormExtender::MsgBox(const std::string& Text, int32_t Style, const std::string& Caption,
                             const std::string& Details) {
    return services()->MsgBox(Text, Style, Caption.empty() ? caption_ : Caption, Details);
}

void FormExtender::ShowMessage(const std::string& ControlName, const std::string& Text,
                               const std::string& Title, const std::string& Hint) {
    // A message may point at a declared control or at one of the form's
    // attribute grids (which has chosen the row concerned).
    bool attributes = false;
    if (!ControlName.empty())
        for (auto* a : services()->attribGridsOfOwner(owner()))
            attributes = attributes || a->GridName() == ControlName;
    if (!ControlName.empty() && !attributes) controlIndex(ControlName);
    Prompt p;
    p.kind = PromptKind::Anchored;
    p.text = Text;
    p.caption = caption_;
    p.control = ControlName;
    p.title = Title;
    p.hint = Hint;
    requireAgent(Text)->anchoredMessage(p);
    if (!ControlName.empty())
        focus_ = attributes ? ControlName : controls_[controlIndex(ControlName)].Name;
}

int32_t FormExtender::AskYesNo(const std::string& Text, const std::string& Caption) {
    return MsgBox(Text, vbYesNo | vbQuestion, Caption);
}

bool FormExtender::InputBox(const std::string& Prompt, const std::string& Title,
                            pelta::Variant& Value) {
    fw::Prompt p;
    p.kind = PromptKind::InputBox;
    p.text = Prompt;
    p.caption = caption_;
    p.title = Title;
    p.value = Value;
    auto answer = requireAgent(Prompt)->inputBox(p);
    if (!answer) return false;
    Value = std::move(*answer);
    return true;
}

bool FormExtender::InputList(const std::string& Title, const std::string& Prompt,
                             const std::vector<std::string>& Choices, int32_t& Choice) {
    if (Choices.empty()) return false;
    fw::Prompt p;
    p.kind = PromptKind::InputBox;
    p.text = Prompt;
    p.caption = caption_;
    p.title = Title;
    for (const auto& c : Choices)
        p.hint += (p.hint.empty() ? "" : "|") + c;
    p.value = pelta::Variant(Choice);
    auto answer = requireAgent(Prompt)->inputBox(p);
    if (!answer) return false;
    // The answer is a choice's number or its text.
    int32_t chosen = 0;
    if (answer->isString()) {
        for (size_t i = 0; i < Choices.size(); ++i)
            if (Choices[i] == answer->str()) chosen = static_cast<int32_t>(i + 1);
    }
    if (chosen == 0 && answer->isNumeric()) {
        try {
            chosen = answer->toLong();
        } catch (const pelta::Error&) {
            chosen = 0;
        }
    }
    if (chosen < 1 || chosen > static_cast<int32_t>(Choices.size()))
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The answer is not one of the choices of \"" + Prompt + "\"",
                     "FormExtender.InputList");
    Choice = chosen;
    return true;
}

bool FormExtender::SaveFileDialog(const std::string& Title, const std::string& Filter,
                                  const std::string& InitialDir, std::string& FileName) {
    fw::Prompt p;
    p.kind = PromptKind::SaveFile;
    p.caption = caption_;
    p.title = Title;
    p.filter = Filter;
    p.initialDir = InitialDir;
    p.fileName = FileName;
    auto answer = requireAgent(Title)->saveFile(p);
    if (!answer || answer->empty()) return false;
    FileName = answer->string();
    return true;
}

// ---- settings -----------------------------------------------------------------------

pelta::Variant FormExtender::GetSetting(const std::string& Name, const pelta::Variant& Default) {
    return services()->settings().get(layoutKey(), Name, Default);
}

void FormExtender::SaveSetting(const std::string& Name, const pelta::Variant& Value) {
    services()->settings().put(layoutKey(), Name, Value);
}

// ---- controls -----------------------------------------------------------------------

size_t FormExtender::controlIndex(const std::string& name) const {
    for (size_t i = 0; i < controls_.size(); ++i)
        if (equalsNoCaseAscii(controls_[i].Name, name)) return i;
    pelta::raise(pelta::errc::InvalidProcedureCall,
                 "The form " + objectName_ + " declares no control " + name, "FormExtender");
}

bool FormExtender::hasControl(const std::string& name) const {
    for (const auto& c : controls_)
        if (equalsNoCaseAscii(c.Name, name)) return true;
    return false;
}

void FormExtender::DeclareControls(const std::vector<ControlDecl>& Controls) {
    for (size_t i = 0; i < Controls.size(); ++i) {
        const auto& c = Controls[i];
        bool duplicate = c.Name.empty() || hasControl(c.Name);
        for (size_t j = 0; j < i && !duplicate; ++j)
            duplicate = equalsNoCaseAscii(Controls[j].Name, c.Name);
        if (duplicate)
            pelta::raise(pelta::errc::InvalidProcedureCall,
                         "The form " + objectName_ + " declares the control \"" + c.Name +
                             "\" twice or without a name",
                         "FormExtender.DeclareControls");
    }
    for (const auto& c : Controls) {
        controls_.push_back(c);
        values_.push_back(c.Kind == ControlKind::CheckBox ? pelta::Variant(false)
                                                          : pelta::Variant());
    }
}

pelta::Variant FormExtender::ControlValue(const std::string& Name) {
    return values_[controlIndex(Name)];
}

void FormExtender::SetControlValue(const std::string& Name, const pelta::Variant& Value) {
    values_[controlIndex(Name)] = Value;
}

void FormExtender::SetControlList(const std::string& Name, RecordsetRef Rows,
                                  const std::string& KeyField,
                                  const std::vector<std::string>& ShownFields) {
    const auto& control = controls_[controlIndex(Name)];
    if (!Rows) {
        lists_.erase(lowerAscii(control.Name));
        return;
    }
    auto check = [&](const std::string& field) {
        if (Rows->fieldIndex(field) < 0)
            pelta::raise(pelta::errc::InvalidProcedureCall,
                         "The rows of " + control.Name + " have no field " + field,
                         "FormExtender.SetControlList");
    };
    check(KeyField);
    for (const auto& f : ShownFields)
        check(f);
    lists_[lowerAscii(control.Name)] = ControlList{std::move(Rows), KeyField, ShownFields};
}

const ControlList* FormExtender::controlList(const std::string& name) const {
    auto it = lists_.find(lowerAscii(name));
    return it == lists_.end() ? nullptr : &it->second;
}

void FormExtender::SetFocus(const std::string& Name) {
    focus_ = controls_[controlIndex(Name)].Name;
}

bool FormExtender::userFocus(const std::string& name) {
    const auto& control = controls_[controlIndex(name)];
    bool cancel = false;
    raise(events_.BeforeControlSetFocus, control.Name, cancel);
    if (cancel) return false;
    focus_ = control.Name;
    return true;
}

void FormExtender::userSetValue(const std::string& name, const pelta::Variant& value) {
    SetControlValue(name, value);
    // Held while raising: a handler may create or drop field extenders.
    std::vector<pelta::Ref<FieldExtender>> fields(fields_.begin(), fields_.end());
    for (auto& f : fields)
        if (equalsNoCaseAscii(f->controlName(), name)) f->raiseChange();
}

void FormExtender::userClick(const std::string& name) {
    controlIndex(name);
    std::vector<pelta::Ref<FieldExtender>> fields(fields_.begin(), fields_.end());
    for (auto& f : fields)
        if (equalsNoCaseAscii(f->controlName(), name)) f->raiseClick();
}

void FormExtender::attachField(FieldExtender* field) {
    fields_.push_back(field);
}

void FormExtender::detachField(FieldExtender* field) {
    fields_.erase(std::remove(fields_.begin(), fields_.end(), field), fields_.end());
}

}  // namespace pelta::fw
