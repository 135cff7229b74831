#include "library/frame/cDetailFrame.h"

#include <cmath>

#include "library/contracts/Constants.h"
#include "library/frame/mdBllCall.h"
#include "library/frame/mdBllErrors.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "platform/automation/error.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

namespace {
constexpr const char* kNotFound = "Номенклатурата не е намерена или недостатъчни права върху данни";
constexpr const char* kNoCreateRight = "Недостатъчни права за създаване на %1";
constexpr const char* kNoDetailsRight = "Недостатъчни права за достъп до форма с детайли на %1";
constexpr const char* kAskDelete = "Желаете ли да изтриете номенклатурата?";
}  // namespace

cDetailFrame::cDetailFrame(DetailDefinition Def) : m_oDef(std::move(Def)) {
    mdErrorHandling::DebugInstanceInit(m_oDef.ObjectName, m_lInstanceID, this);
}

cDetailFrame::~cDetailFrame() {
    mdErrorHandling::DebugInstanceTerm(m_oDef.ObjectName, m_lInstanceID);
}

RecordsetRef cDetailFrame::Head() const {
    return m_rsHead;
}

IGridExtender* cDetailFrame::Grid(const std::string& ControlName) const {
    auto it = m_oGrids.find(ControlName);
    return it == m_oGrids.end() ? nullptr : it->second.get();
}

RecordsetRef cDetailFrame::Rows(const std::string& SubList) const {
    auto it = m_oRows.find(SubList);
    return it == m_oRows.end() ? RecordsetRef() : it->second;
}

RecordsetRef cDetailFrame::Reference(const std::string& Name) const {
    auto it = m_oRefs.find(Name);
    return it == m_oRefs.end() ? RecordsetRef() : it->second;
}

bool cDetailFrame::pvCreateGrids(std::span<const GridDecl> Grids) {
    for (const GridDecl& g : Grids) {
        auto grid = CreateGridExtender(this, g.Control, {}, g.HelpID);
        if (!grid) return false;
        grid->DeclareColumns(g.Columns);
        m_oGrids[g.Control] = grid;
    }
    return true;
}

bool cDetailFrame::frInit(IClientSite* Site) {
    try {
        if (!Site) return false;
        Load();
        m_oSite = Site;
        m_oConnection = Site->Connection();
        m_oForm = CreateFormExtender(this, m_oDef.Caption, m_oDef.ObjectName, m_oDef.HelpID);
        if (!m_oForm) return false;
        m_oForm->SetClientSite(Site);
        m_oForm->SetLayoutKey(m_oDef.LayoutKey);
        m_oForm->DeclareControls(m_oDef.Controls);
        if (!m_oDef.Attributes.empty()) {
            m_oAttribExt = CreateAttribGridExtender(this, m_oDef.AttribGrid, m_oDef.AttribGroups);
            if (!m_oAttribExt) return false;
            for (const AttribDecl& a : m_oDef.Attributes)
                m_oAttribExt->AddAttribute(a);
        }
        m_oDetailOpener = CreateDetailOpener(Site, m_oDef.LayoutKey, m_oDef.ListName);
        if (!m_oDetailOpener) return false;

        auto& e = m_oForm->Events();
        e.Fetch = [this](int32_t Step, bool& Cancel) { m_oForm_Fetch(Step, Cancel); };
        e.FillControls = [this] { m_oForm_FillControls(); };
        e.IsModified = [this](bool& Modified) { m_oForm_IsModified(Modified); };
        e.IsCorrect = [this](bool& Cancel) { m_oForm_IsCorrect(Cancel); };
        e.Upload = [this] { m_oForm_Upload(); };
        e.Save = [this](bool& Cancel) { m_oForm_Save(Cancel); };
        e.NewDocument = [this] { m_sKey.clear(); };
        e.MovePosition = [this](const pelta::Variant& Bookmark) {
            if (Bookmark.isArray() && !Bookmark.array().empty())
                m_sKey = C2Str(Bookmark.array()[0]);
        };
        e.QueryStandalone = [this](bool& Cancel) { m_oForm_QueryStandalone(Cancel); };
        e.BeforeExecute = [this](int32_t Id, bool& Handled) { m_oForm_BeforeExecute(Id, Handled); };
        return pvInitForm();
    } catch (...) {
        PrintError("frInit", m_oDef.ObjectName);
        return false;
    }
}

bool cDetailFrame::ShowDetails(const std::string& Key) {
    try {
        if (!pvHasRight(kRightOpenDetails)) {
            m_oForm->MsgBox(Printf(kNoDetailsRight, m_oDef.Caption), vbExclamation);
            return false;
        }
        m_sKey = Key;
        return m_oForm->ShowDocument(Key);
    } catch (...) {
        ShowError("ShowDetails", m_oDef.ObjectName, m_oDef.Caption);
        return false;
    }
}

bool cDetailFrame::ShowFromRecordset(RecordsetRef Rows) {
    try {
        if (!Rows || Rows->recordCount() == 0 || Rows->bof() || Rows->eof() ||
            Rows->fieldIndex(m_oDef.KeyField) < 0)
            return false;
        return ShowDetails(C2Str(Rows->value(m_oDef.KeyField)));
    } catch (...) {
        ShowError("ShowFromRecordset", m_oDef.ObjectName, m_oDef.Caption);
        return false;
    }
}

void cDetailFrame::SetOpener(std::function<void(RecordsetRef)> RowSaved,
                             std::function<void()> RecordDeleted) {
    m_fnRowSaved = std::move(RowSaved);
    m_fnRecordDeleted = std::move(RecordDeleted);
}

bool cDetailFrame::pvHasRight(int32_t RightFlag) {
    return m_oDetailOpener && m_oDetailOpener->HasRight(RightFlag);
}

void cDetailFrame::m_oForm_Fetch(int32_t Step, bool& Cancel) {
    try {
        if (Step != 1) return;
        auto request = CreatePropertyBag(m_oForm.get());
        request->writeProperty("ID", pelta::Variant(m_sKey));
        request->writeProperty("Referentials", pelta::Variant(m_oForm->Referentials()));
        auto response =
            CallBll(m_oForm.get(), m_oConnection.get(), m_oDef.ReadOperation, request.get());
        if (!response) {
            Cancel = true;
            return;
        }
        auto head = RecordsetProperty(response.get(), "Head");
        if (!m_sKey.empty() && (!head || head->recordCount() == 0)) {
            m_oForm->MsgBox(kNotFound, vbExclamation);
            Cancel = true;
            return;
        }
        if (m_sKey.empty() && !pvHasRight(kRightCreate)) {
            m_oForm->MsgBox(Printf(kNoCreateRight, m_oDef.Caption), vbExclamation);
            Cancel = true;
            return;
        }
        if (!head) {
            Cancel = true;
            return;
        }
        // The answer is complete: from here on it replaces the form's data.
        m_rsHead = head;
        pvTakeResponse(*response, true);
        if (m_sKey.empty()) {
            const pelta::Date now = pelta::now();
            m_rsHead->addNew();
            auto set = [&](const char* field, const pelta::Variant& v) {
                if (m_rsHead->fieldIndex(field) >= 0) m_rsHead->setValue(field, v);
            };
            set("IsActive", pelta::Variant(true));
            set("CU", pelta::Variant(m_oConnection->CurrentUserID()));
            set("CD", pelta::Variant(now));
            pvNewRecord();
            m_rsHead->update();
        }
        m_rsHead->moveFirst();
        pvBindAttributes();
    } catch (...) {
        Cancel = true;
        ShowError("m_oForm_Fetch", m_oDef.ObjectName, m_oDef.Caption);
    }
}

void cDetailFrame::m_oForm_FillControls() {
    try {
        if (!m_rsHead || m_rsHead->recordCount() == 0) return;
        m_rsHead->moveFirst();
        for (const auto& c : m_oDef.Controls) {
            if (c.Field.empty() || m_rsHead->fieldIndex(c.Field) < 0) continue;
            m_oForm->SetControlValue(c.Name, m_rsHead->value(c.Field));
        }
        pvBindAttributes();
        pvFillControls();
    } catch (...) {
        PrintError("m_oForm_FillControls", m_oDef.ObjectName);
    }
}

pelta::Variant cDetailFrame::pvParameter(const char* Name) {
    if (!m_oConnection) return {};
    auto params = m_oConnection->AppParameters();
    if (!params) return {};
    auto p = params->Item(Name);
    return p ? p->Value() : pelta::Variant();
}

std::string cDetailFrame::pvText(const std::string& ControlName) {
    return C2Str(m_oForm->ControlValue(ControlName));
}

pelta::Variant cDetailFrame::pvControlField(const std::string& ControlName) {
    pelta::Variant v = m_oForm->ControlValue(ControlName);
    if (v.isEmpty() || (v.isString() && v.str().empty())) return pelta::Variant::null();
    return v;
}

// The attributes edit the head in place: bound again to each new head.
void cDetailFrame::pvBindAttributes() {
    if (!m_oAttribExt || !m_rsHead || m_rsAttribHead == m_rsHead) return;
    m_rsAttribHead = m_rsHead;
    m_oAttribExt->Bind(m_rsHead);
}

void cDetailFrame::pvShowAttribMessage(const std::string& Field, const std::string& Text,
                                       const std::string& Title, const std::string& Hint) {
    if (m_oAttribExt) m_oAttribExt->Select(Field);
    m_oForm->ShowMessage(m_oDef.AttribGrid, Text, Title, Hint);
}

bool cDetailFrame::SameValue(const pelta::Variant& A, const pelta::Variant& B) {
    auto blank = [](const pelta::Variant& v) {
        return v.isEmpty() || v.isNull() || (v.isString() && v.str().empty());
    };
    if (blank(A) || blank(B)) return blank(A) && blank(B);
    try {
        return pelta::compareValues(A, B) == 0;
    } catch (const pelta::Error&) {
        return C2Str(A) == C2Str(B);
    }
}

bool cDetailFrame::pvModified() {
    if (!m_rsHead || m_rsHead->recordCount() == 0) return false;
    m_rsHead->moveFirst();
    for (const auto& c : m_oDef.Controls) {
        if (c.Field.empty() || c.ReadOnly || m_rsHead->fieldIndex(c.Field) < 0) continue;
        if (!m_oDef.ModifiedFields.empty()) {
            bool listed = false;
            for (const auto& f : m_oDef.ModifiedFields)
                listed = listed || f == c.Field;
            if (!listed) continue;
        }
        if (!SameValue(m_oForm->ControlValue(c.Name), m_rsHead->value(c.Field))) return true;
    }
    if (m_oAttribExt && m_oAttribExt->EditState()) return true;
    return pvIsModified();
}

void cDetailFrame::m_oForm_IsModified(bool& Modified) {
    try {
        Modified = pvModified();
    } catch (...) {
        Modified = true;
        PrintError("m_oForm_IsModified", m_oDef.ObjectName);
    }
}

void cDetailFrame::m_oForm_IsCorrect(bool& Cancel) {
    Cancel = true;
    try {
        if (pvIsCorrect()) Cancel = false;
    } catch (...) {
        ShowError("m_oForm_IsCorrect", m_oDef.ObjectName, m_oDef.Caption);
    }
}

void cDetailFrame::m_oForm_Upload() {
    try {
        m_rsHead->moveFirst();
        for (const auto& c : m_oDef.Controls) {
            if (c.Field.empty() || c.ReadOnly || m_rsHead->fieldIndex(c.Field) < 0) continue;
            m_rsHead->setValue(c.Field, pvControlField(c.Name));
        }
        if (m_rsHead->fieldIndex("LU") >= 0)
            m_rsHead->setValue("LU", pelta::Variant(m_oConnection->CurrentUserID()));
        if (m_rsHead->fieldIndex("LD") >= 0) m_rsHead->setValue("LD", pelta::Variant(pelta::now()));
        pvUpload();
        m_rsHead->update();
    } catch (...) {
        RaiseError("m_oForm_Upload", m_oDef.ObjectName);
    }
}

void cDetailFrame::m_oForm_Save(bool& Cancel) {
    try {
        auto request = CreatePropertyBag(m_oForm.get());
        request->writeProperty("Head", pelta::Variant(pelta::ObjectRef(m_rsHead)));
        pvWriteSaveRequest(*request);
        request->writeProperty("NeedFetch", pelta::Variant(false));
        request->writeProperty(
            "NeedList",
            pelta::Variant(m_oDef.NeedList.empty() ? m_oDef.ListName : m_oDef.NeedList));
        // A form may answer a refusal by sending the request again (after the
        // user agreed to a duplicate); never more often than this.
        constexpr int32_t kMaxAttempts = 4;
        PropertyBagRef response;
        for (int32_t attempt = 1;; ++attempt) {
            response =
                CallBll(m_oForm.get(), m_oConnection.get(), m_oDef.UpdateOperation, request.get());
            if (!response) {
                Cancel = true;
                return;
            }
            if (response->readProperty("BllError").isEmpty()) break;
            // Everything the answer carries is read before its verdict; the
            // form's data is replaced only when the save went through, so
            // that a refused save leaves the user's edits where they were.
            SaveRefusal what = pvSaveRefused(*response, *request, attempt);
            if (what == SaveRefusal::Retry && attempt < kMaxAttempts) continue;
            if (what != SaveRefusal::Handled) {
                const std::string rowID = C2Str(response->readProperty("BllRowID"));
                if (rowID.empty() || !pvShowRowError(*response, rowID))
                    ShowBllError(m_oForm.get(), response.get());
            }
            Cancel = true;
            return;
        }
        auto head = RecordsetProperty(response.get(), "Head");
        auto listRow = RecordsetProperty(response.get(), "ListResult");
        if (!head || head->recordCount() == 0) {
            Cancel = true;
            return;
        }
        m_rsHead = head;
        m_rsHead->moveFirst();
        m_sKey = C2Str(m_rsHead->value(m_oDef.KeyField));
        pvTakeResponse(*response, false);
        pvBindAttributes();
        if (m_fnRowSaved) m_fnRowSaved(listRow);
    } catch (...) {
        Cancel = true;
        ShowError("m_oForm_Save", m_oDef.ObjectName, m_oDef.Caption);
    }
}

void cDetailFrame::m_oForm_QueryStandalone(bool& Cancel) {
    try {
        if (!TerminateObject(this)) Cancel = true;
    } catch (...) {
        Cancel = true;
        PrintError("m_oForm_QueryStandalone", m_oDef.ObjectName);
    }
}

void cDetailFrame::m_oForm_BeforeExecute(int32_t CommandID, bool& Handled) {
    try {
        if (pvExecute(CommandID)) {
            Handled = true;
            return;
        }
        if (CommandID != kCmdDelete) return;
        Handled = true;
        pvDelete();
    } catch (...) {
        Handled = true;
        ShowError("m_oForm_BeforeExecute", m_oDef.ObjectName, m_oDef.Caption);
    }
}

void cDetailFrame::pvDelete() {
    if (m_sKey.empty()) return;  // a record not saved yet has nothing to delete
    if (m_oForm->AskYesNo(kAskDelete) != vbYes) return;
    auto services = FrameworkServices();
    if (!services || !services->RecordDeletion()) return;
    if (!services->RecordDeletion()->DeleteRecord(m_oConnection.get(), m_oForm.get(), kBllCallKind,
                                                  m_oDef.DeleteOperation, m_oDef.KeyField, m_sKey))
        return;
    if (m_fnRecordDeleted) m_fnRecordDeleted();
    m_sKey.clear();
    m_rsHead.reset();
    m_oForm->CloseDocument();
}

void cDetailFrame::QueryTerminate(bool& Cancel) {
    try {
        if (Cancel) return;  // termination was abandoned: nothing to undo
        if (m_oForm && m_rsHead && pvModified()) Cancel = true;
    } catch (...) {
        PrintError("IZonTerminate_QueryTerminate", m_oDef.ObjectName);
    }
}

void cDetailFrame::Terminate() {
    pelta::Ref<cDetailFrame> keepAlive(this);  // leaving Forms may drop the last reference
    try {
        m_fnRowSaved = nullptr;
        m_fnRecordDeleted = nullptr;
        for (auto& [name, grid] : m_oGrids)
            grid->Events() = {};
        m_oGrids.clear();
        if (m_oAttribExt) m_oAttribExt->Events() = {};
        m_oAttribExt.reset();
        m_rsAttribHead.reset();
        m_oRows.clear();
        m_oRefs.clear();
        if (m_oForm) m_oForm->Events() = {};
        m_oForm.reset();
        m_oDetailOpener.reset();
        m_rsHead.reset();
        m_oConnection.reset();
        m_oSite.reset();
        Unload();
    } catch (...) {
        PrintError("IZonTerminate_Terminate", m_oDef.ObjectName);
    }
}

}  // namespace PeltaNom15
