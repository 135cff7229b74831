// The frame every detail form follows: it edits one record — a head and
// usually row lists — inside the framework's document window. The framework
// decides when to fetch, fill, check, upload and save; the frame answers
// those events, and a form overrides the hooks for what makes it different.
//
// Head fields are bound to the declared controls through ControlDecl::Field:
// the frame fills them, compares them for IsModified and uploads them.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <span>
#include <string>
#include <vector>

#include "library/contracts/Controls.h"
#include "library/contracts/Extenders.h"
#include "library/contracts/IZonTerminate.h"
#include "library/contracts/Public.h"
#include "library/frame/Forms.h"
#include "library/frame/IDetailForm.h"

namespace PeltaNom15 {

struct DetailDefinition {
    std::string Caption;     // "Валутни курсове", also the list's caption in messages
    std::string ObjectName;  // "frmRatiosDetails"
    int32_t HelpID = 0;
    std::string LayoutKey;
    std::string ListName;  // "ctxRatios": refreshed after a save, and whose rights apply
    // "NeedList" of the save when it names more lists ("ctxPr|ctxContragents");
    // empty: ListName.
    std::string NeedList;
    std::string ReadOperation;
    std::string UpdateOperation;
    std::string DeleteOperation;
    std::string KeyField = "ID";
    std::vector<ControlDecl> Controls;
    // Head fields whose control IsModified compares; empty: every bound field.
    std::vector<std::string> ModifiedFields;
    // Further head fields edited in an attribute grid of that name, in the
    // numbered groups "1|Основни|2|...".
    std::string AttribGrid;
    std::string AttribGroups;
    std::vector<AttribDecl> Attributes;
};

class cDetailFrame : public LibForm,
                     public IDetailForm,
                     public IZonNomDetailForm,
                     public IZonTerminate {
public:
    // IZonNomDetailForm: how other screens open the form.
    pelta::ObjectRef Form() override { return pelta::ObjectRef(m_oForm.get()); }
    bool Init(IClientSite* Site) override { return frInit(Site); }
    bool ShowDetail(const std::string& ID) override { return ShowDetails(ID); }
    bool ShowFromRecordset(RecordsetRef Rows) override;

    // IDetailForm
    bool frInit(IClientSite* Site) override;
    bool ShowDetails(const std::string& Key) override;
    void SetOpener(std::function<void(RecordsetRef)> RowSaved,
                   std::function<void()> RecordDeleted) override;
    IFormExtender* FormExtender() override { return m_oForm.get(); }

    // IZonTerminate: refuses while the shown record has unsaved edits.
    void QueryTerminate(bool& Cancel) override;
    void Terminate() override;

    // A row grid of the form: its control, help number and columns.
    struct GridDecl {
        const char* Control;
        int32_t HelpID;
        std::vector<ColumnDecl> Columns;
    };

    const std::string& Key() const noexcept { return m_sKey; }
    RecordsetRef Head() const;
    // The form's row grids by control name, its sub-lists and reference
    // lists by name; null when the form has none of that name.
    IGridExtender* Grid(const std::string& ControlName) const;
    RecordsetRef Rows(const std::string& SubList) const;
    RecordsetRef Reference(const std::string& Name) const;
    // The attribute grid; null when the form has no attributes.
    IAttribGridExtender* Attributes() const { return m_oAttribExt.get(); }

protected:
    explicit cDetailFrame(DetailDefinition Def);
    ~cDetailFrame() override;

    // ---- what a form adds ----
    // Grids, drop-downs, tabs and splitters; False when the form cannot work.
    virtual bool pvInitForm() { return true; }
    // Takes the row lists and reference lists of a successful fetch or save.
    virtual void pvTakeResponse(pelta::PropertyBag& Response, bool Fetched) {}
    // Defaults of a new record beyond ID, IsActive, CU and CD (the head row
    // is being added).
    virtual void pvNewRecord() {}
    virtual void pvFillControls() {}
    virtual bool pvIsModified() { return false; }
    // Checks beyond the frame's; False (after telling the user) refuses.
    virtual bool pvIsCorrect() { return true; }
    // Copies what the bound controls do not cover into the head and rows.
    virtual void pvUpload() {}
    // Request properties of the save beyond "Head", "NeedFetch", "NeedList".
    virtual void pvWriteSaveRequest(pelta::PropertyBag& Request) {}
    // What became of a refused save (a "BllError" in the answer).
    enum class SaveRefusal {
        Show,     // the frame shows it (pvShowRowError, then the common message)
        Handled,  // the form told the user; the save is cancelled
        Retry,    // the form changed the request: send it again
    };
    // Asked for every refusal; `Attempt` counts the calls of this save from
    // 1. The frame sends a request again a few times at most.
    virtual SaveRefusal pvSaveRefused(pelta::PropertyBag& Response, pelta::PropertyBag& Request,
                                      int32_t Attempt) {
        return SaveRefusal::Show;
    }
    // Commands of the form, asked before the frame's own (118 delete); true
    // when performed.
    virtual bool pvExecute(int32_t CommandID) { return false; }
    // A refused save that names a row: positions on it and tells the user.
    // False when the form has no row of that kind (the frame then shows the
    // refusal itself).
    virtual bool pvShowRowError(pelta::PropertyBag& Response, const std::string& RowID) {
        return false;
    }

    // ---- shared ----
    // Creates the grids and keeps them by control name; False when one fails.
    bool pvCreateGrids(std::span<const GridDecl> Grids);
    bool pvHasRight(int32_t RightFlag);
    // Whether the shown record has edits not saved yet.
    bool pvModified();
    // A message about an attribute: its row is chosen first.
    void pvShowAttribMessage(const std::string& Field, const std::string& Text,
                             const std::string& Title = {}, const std::string& Hint = {});
    // A parameter of the site (the connection's application parameters);
    // Empty when there is none of that name.
    pelta::Variant pvParameter(const char* Name);
    // A control's value as text.
    std::string pvText(const std::string& ControlName);
    // The value of a control as a head field takes it: Null for an empty one.
    pelta::Variant pvControlField(const std::string& ControlName);
    // Equality as an edit sees it: empty and Null alike, texts by content.
    static bool SameValue(const pelta::Variant& A, const pelta::Variant& B);

    DetailDefinition m_oDef;
    pelta::Ref<IClientSite> m_oSite;
    pelta::Ref<IBllConnection> m_oConnection;
    pelta::Ref<IFormExtender> m_oForm;
    pelta::Ref<IDetailOpener> m_oDetailOpener;
    std::string m_sKey;
    RecordsetRef m_rsHead;
    std::map<std::string, pelta::Ref<IGridExtender>> m_oGrids;  // by control name
    pelta::Ref<IAttribGridExtender> m_oAttribExt;               // null without attributes
    std::map<std::string, RecordsetRef> m_oRows;                // sub-lists by name
    std::map<std::string, RecordsetRef> m_oRefs;                // reference lists by name
    int32_t m_lInstanceID = 0;

private:
    void m_oForm_Fetch(int32_t Step, bool& Cancel);
    void m_oForm_FillControls();
    void m_oForm_IsModified(bool& Modified);
    void m_oForm_IsCorrect(bool& Cancel);
    void m_oForm_Upload();
    void m_oForm_Save(bool& Cancel);
    void m_oForm_QueryStandalone(bool& Cancel);
    void m_oForm_BeforeExecute(int32_t CommandID, bool& Handled);
    void pvDelete();
    void pvBindAttributes();

    RecordsetRef m_rsAttribHead;  // the head the attributes are bound to
    std::function<void(RecordsetRef)> m_fnRowSaved;
    std::function<void()> m_fnRecordDeleted;
};

}  // namespace PeltaNom15
