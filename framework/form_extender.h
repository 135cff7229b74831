// The form extender: a screen's document window. It keeps the menu model,
// the declared controls and their values, and drives the document cycle
// (fetch, fill, is-modified, is-correct, upload, save) by raising the
// screen's events.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "framework/extender_base.h"
#include "library/contracts/Extenders.h"

namespace pelta::fw {

using PeltaNom15::PropertyBagRef;
using PeltaNom15::RecordsetRef;

class FieldExtender;

// One command of the menu and toolbar, as a renderer draws it.
struct MenuCommand {
    int32_t id = 0;
    std::string caption;  // may carry "\t" and the shortcut's text
    std::string tooltip;
    std::string band;  // "file", "edit", "view", "tools", or a screen's own band
    bool enabled = true;
    bool visible = true;
    std::string shortcut;  // "Ctrl+N", "Del", "F5"; empty when none
};

// The commands every form starts with; screens remove what they do not offer.
std::vector<MenuCommand> standardCommands();

// The rows a combo control offers.
struct ControlList {
    RecordsetRef rows;
    std::string keyField;
    std::vector<std::string> shownFields;
};

class FormExtender : public PeltaNom15::IFormExtender, public ExtenderBase {
public:
    FormExtender();
    ~FormExtender() override;

    PeltaNom15::FormEvents& Events() override { return events_; }

    void Init(pelta::Object* Owner, const std::string& Caption, const std::string& LibName,
              const std::string& ObjectName, int32_t HelpID) override;
    pelta::Object* Owner() override { return owner(); }
    std::string Caption() override { return caption_; }
    // Raises CaptionChanged, whose handler may still change the caption.
    void SetCaption(const std::string& Caption) override;
    std::string ObjectName() override { return objectName_; }
    int32_t HelpID() override { return helpID_; }

    void SetClientSite(PeltaNom15::IClientSite* Site) override;
    pelta::Ref<PeltaNom15::IClientSite> ClientSite() override { return site_; }
    void RegisterDetailForm(const std::string& ClassName) override;
    std::string DetailFormClass() override { return detailFormClass_; }
    void SetLayoutKey(const std::string& LayoutKey) override;

    void RemoveCommands(const std::vector<int32_t>& CommandIDs) override;
    // Adds a command, or moves an existing one to `Band` with the new caption.
    void AddCommand(int32_t CommandID, const std::string& Caption,
                    const std::string& Band) override;
    // The commands below raise InvalidProcedureCall for a command not in the menu.
    void SetCommandCaption(int32_t CommandID, const std::string& Caption) override;
    void SetCommandTooltip(int32_t CommandID, const std::string& Tooltip) override;
    void EnableCommand(int32_t CommandID, bool Enabled) override;
    void ShowCommand(int32_t CommandID, bool Visible) override;

    bool Refresh() override;
    // True until a fetch succeeds (the reference lists are then held), and
    // again after flushCache.
    bool Referentials() override { return referentials_; }
    bool SaveDocument() override;
    bool ShowDocument(const std::string& Key) override;
    bool CloseDocument() override;
    // Default actions: 207 refresh; 201 save; 101 in a shown document a new
    // document (NewDocument, then fetch and fill).
    void Execute(int32_t CommandID) override;

    PropertyBagRef CreatePropertyBag() override;
    // Raises InvalidProcedureCall when the constants are not 2 and -2, and
    // InvalidData when the bytes are not a bag.
    PropertyBagRef CreatePropertyBag(const pelta::Bytes& Contents, int32_t Const1, int32_t Const2,
                                     pelta::ObjectRef Context) override;

    // An empty caption is the form's caption.
    int32_t MsgBox(const std::string& Text, int32_t Style, const std::string& Caption = {},
                   const std::string& Details = {}) override;
    // Also moves the focus to the control.
    void ShowMessage(const std::string& ControlName, const std::string& Text,
                     const std::string& Title = {}, const std::string& Hint = {}) override;
    int32_t AskYesNo(const std::string& Text, const std::string& Caption = {}) override;
    bool InputBox(const std::string& Prompt, const std::string& Title,
                  pelta::Variant& Value) override;
    // An input box whose hint lists the choices joined by "|"; the answer is
    // a choice's number or text (anything else raises InvalidProcedureCall).
    bool InputList(const std::string& Title, const std::string& Prompt,
                   const std::vector<std::string>& Choices, int32_t& Choice) override;
    // Asks the user agent (PromptKind::SaveFile); the answer is a path.
    bool SaveFileDialog(const std::string& Title, const std::string& Filter,
                        const std::string& InitialDir, std::string& FileName) override;

    // Kept under the layout key (the object name while no key is set).
    pelta::Variant GetSetting(const std::string& Name, const pelta::Variant& Default) override;
    void SaveSetting(const std::string& Name, const pelta::Variant& Value) override;

    // Raises InvalidProcedureCall for a duplicate name; unknown names given
    // to the members below raise InvalidProcedureCall naming the control.
    void DeclareControls(const std::vector<PeltaNom15::ControlDecl>& Controls) override;
    pelta::Variant ControlValue(const std::string& Name) override;
    void SetControlValue(const std::string& Name, const pelta::Variant& Value) override;
    void SetControlList(const std::string& Name, RecordsetRef Rows, const std::string& KeyField,
                        const std::vector<std::string>& ShownFields) override;
    void SetFocus(const std::string& Name) override;

    // ---- For hosts and renderers ----------------------------------------------

    const std::string& libName() const noexcept { return libName_; }
    // The layout key, or the object name while none is set.
    std::string layoutKey() const;
    const std::vector<MenuCommand>& menu() const noexcept { return menu_; }
    const MenuCommand* command(int32_t id) const;
    // Executes the visible, enabled command bound to `shortcut`; False when none.
    bool executeShortcut(const std::string& shortcut);

    // The document: its key, whether one is shown, whether it was closed.
    const std::string& documentKey() const noexcept { return key_; }
    bool documentShown() const noexcept { return shown_; }
    bool closed() const noexcept { return closed_; }
    int32_t fetchCount() const noexcept { return fetches_; }
    // The next fetch asks for the reference lists again (cache flushed).
    void resetReferentials() noexcept { referentials_ = true; }

    // IsModified as the screen answers it (True when it does not handle it).
    bool isModified();
    // Moves to another record (MovePosition with the bookmark, then fetch
    // and fill); False when the fetch was cancelled.
    bool movePosition(const pelta::Variant& bookmark);
    // QueryStandalone, QueryFree: True when the screen agrees.
    bool queryStandalone();
    bool queryFree();
    // The menu is built: MenuNegotiateEx, then AfterMenuNegotiate.
    void negotiateMenu();
    void activate();
    void resize();
    void keyDown(int32_t& keyCode, int32_t shift);
    void notify(int32_t code, const pelta::Variant& param);
    void flushCache();
    void applyFilter(int32_t filterID, const pelta::Variant& value);

    // Controls as a renderer reads them.
    const std::vector<PeltaNom15::ControlDecl>& controls() const noexcept { return controls_; }
    bool hasControl(const std::string& name) const;
    const ControlList* controlList(const std::string& name) const;
    const std::string& focus() const noexcept { return focus_; }
    // The user moves the focus: BeforeControlSetFocus may refuse.
    bool userFocus(const std::string& name);
    // The user changes a control's value: the value is set and the field
    // extenders over the control raise Change.
    void userSetValue(const std::string& name, const pelta::Variant& value);
    // The user clicks a control: its field extenders raise Click.
    void userClick(const std::string& name);

    // Field extenders attach themselves to their control.
    void attachField(FieldExtender* field);
    void detachField(FieldExtender* field);

private:
    size_t controlIndex(const std::string& name) const;  // raises for unknown names
    MenuCommand& commandRef(int32_t id);                 // raises for unknown ids
    bool fetchAndFill();

    PeltaNom15::FormEvents events_;
    std::string caption_;
    std::string libName_;
    std::string objectName_;
    int32_t helpID_ = 0;
    pelta::Ref<PeltaNom15::IClientSite> site_;
    std::string detailFormClass_;
    std::string layoutKey_;
    std::vector<MenuCommand> menu_;

    std::string key_;
    bool shown_ = false;
    bool closed_ = false;
    bool referentials_ = true;
    int32_t fetches_ = 0;

    std::vector<PeltaNom15::ControlDecl> controls_;
    std::vector<pelta::Variant> values_;
    std::map<std::string, ControlList> lists_;  // by lower-case name
    std::string focus_;
    std::vector<FieldExtender*> fields_;
};

}  // namespace pelta::fw
