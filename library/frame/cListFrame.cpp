#include "library/frame/cListFrame.h"

#include "library/contracts/Constants.h"
#include "library/frame/Forms.h"
#include "library/frame/mdBllCall.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

namespace {
constexpr const char* kAskDeleteInactive =
    "Желаете ли да изтриете избраните неактивни номенклатури?";
}

cListFrame::cListFrame(ListDefinition Def) : m_oDef(std::move(Def)) {
    mdErrorHandling::DebugInstanceInit(m_oDef.ObjectName, m_lInstanceID, this);
}

cListFrame::~cListFrame() {
    mdErrorHandling::DebugInstanceTerm(m_oDef.ObjectName, m_lInstanceID);
}

RecordsetRef cListFrame::ListRecordset() const {
    return m_rsList;
}

bool cListFrame::InitClientSite(IClientSite* Site) {
    if (m_oForm) return true;  // initialised once; later calls come from hosts reusing the control
    m_oSite = Site;
    bool ok = false;
    try {
        ok = pvInit();
    } catch (...) {
        PrintError("IZonListControl_InitClientSite", m_oDef.ObjectName);
    }
    if (!ok) {
        try {
            TerminateObject(this);
        } catch (...) {
            PrintError("IZonListControl_InitClientSite", m_oDef.ObjectName);
        }
    }
    return ok;
}

bool cListFrame::pvInit() {
    m_sInstanceName = m_oDef.ObjectName + "#" + std::to_string(m_lInstanceID);
    if (!m_oSite) return false;
    m_oConnection = m_oSite->Connection();

    m_oForm = CreateFormExtender(this, m_oDef.Caption, m_oDef.ObjectName, m_oDef.FormHelpID);
    if (!m_oForm) return false;
    m_oForm->SetClientSite(m_oSite.get());
    m_oForm->SetLayoutKey(m_oDef.GridLayoutKey);
    ControlDecl grid;
    grid.Name = "geCtl";
    grid.Kind = ControlKind::Grid;
    grid.Caption = m_oDef.Caption;
    m_oForm->DeclareControls({grid});
    m_oGridExt = CreateGridExtender(this, "geCtl", m_oDef.GridLayoutKey, m_oDef.GridHelpID);
    if (!m_oGridExt) return false;
    m_oGridExt->DeclareColumns(m_oDef.Columns);
    m_oForm->RegisterDetailForm(m_oDef.DetailFormClass);

    m_oForm->RemoveCommands(m_oDef.RemovedCommands);
    for (const auto& c : m_oDef.Commands) {
        if (!c.Caption.empty()) m_oForm->SetCommandCaption(c.CommandID, c.Caption);
        if (!c.Tooltip.empty()) m_oForm->SetCommandTooltip(c.CommandID, c.Tooltip);
    }
    m_oDetailOpener = CreateDetailOpener(m_oSite.get(), m_oDef.DetailLayoutKey, m_oDef.ObjectName);
    if (!m_oDetailOpener) return false;

    auto& e = m_oForm->Events();
    e.Fetch = [this](int32_t Step, bool& Cancel) { m_oForm_Fetch(Step, Cancel); };
    e.FillControls = [this] { m_oForm_FillControls(); };
    e.BeforeExecute = [this](int32_t Id, bool& Handled) { m_oForm_BeforeExecute(Id, Handled); };
    m_oGridExt->Events().BeforeDelete = [this](bool& Cancel) {
        try {
            m_oGridExt_BeforeDelete(Cancel);
        } catch (...) {
            Cancel = true;
            ShowError("m_oGridExt_BeforeDelete", m_oDef.ObjectName, m_oDef.Caption);
        }
    };
    pvInitList();
    return true;
}

void cListFrame::m_oForm_Fetch(int32_t Step, bool& Cancel) {
    try {
        if (Step != 1) return;
        auto request = CreatePropertyBag(m_oForm.get());
        if (!request) {
            Cancel = true;
            return;
        }
        pvWriteFetchRequest(*request);
        // An operation without parameters gets no bytes at all.
        auto response = CallBll(m_oForm.get(), m_oConnection.get(), m_oDef.ReadOperation,
                                request->count() ? request.get() : nullptr);
        if (!response || !pvReadFetchResponse(*response)) Cancel = true;
    } catch (...) {
        Cancel = true;
        ShowError("m_oForm_Fetch", m_oDef.ObjectName, m_oDef.Caption);
    }
}

bool cListFrame::pvReadFetchResponse(pelta::PropertyBag& Response) {
    auto list = RecordsetProperty(&Response, m_oDef.ListProperty);
    if (!list) return false;
    m_rsList = list;
    return true;
}

void cListFrame::pvBindList() {
    if (!m_rsList) return;
    if (m_oDef.GroupColumn.empty())
        m_oGridExt->Bind(m_rsList);
    else
        m_oGridExt->Bind(m_rsList, m_oDef.GroupColumn, pelta::Variant(m_oDef.GroupValue));
    m_oGridExt->Refresh();
}

void cListFrame::m_oForm_FillControls() {
    try {
        pvBindList();
    } catch (...) {
        PrintError("m_oForm_FillControls", m_oDef.ObjectName);
    }
}

void cListFrame::m_oForm_BeforeExecute(int32_t CommandID, bool& Handled) {
    try {
        // The list's own commands first: it may perform a frame command its way.
        if (pvExecute(CommandID)) {
            Handled = true;
            return;
        }
        switch (CommandID) {
            case kCmdNew:
                Handled = true;
                pvShowDetails({});
                break;
            case kCmdOpen: {
                Handled = true;
                if (!m_oGridExt->HasCurrentRow()) return;
                std::string key = C2Str(m_oGridExt->CurrentValue(m_oDef.KeyField));
                if (!key.empty()) pvShowDetails(key);
                break;
            }
            case kCmdDeleteInactive:
                Handled = true;
                pvDeleteInactive();
                break;
            case kCmdRefresh:
                Handled = true;
                m_oForm->Refresh();
                break;
            default:
                break;
        }
    } catch (...) {
        Handled = true;
        ShowError("m_oForm_BeforeExecute", m_oDef.ObjectName, m_oDef.Caption);
    }
}

pelta::Ref<IDetailForm> cListFrame::pvGetDetailForm() {
    if (!m_oDetailOpener || !m_oDetailOpener->HasRight(kRightOpenDetails)) return {};
    pelta::Ref<IDetailForm> form;
    if (auto services = FrameworkServices()) {
        if (auto deletion = services->RecordDeletion())
            form = pelta::queryRef<IDetailForm>(deletion->FindDetailForm(m_oForm.get()));
    }
    if (!form) form = m_oDetailForm;  // the cached one, its document closed meanwhile
    if (!form) {
        form = pelta::queryRef<IDetailForm>(CreateRegisteredClass(m_oDef.DetailFormClass));
        if (!form) return {};
        if (!form->frInit(m_oSite.get())) {
            TerminateObject(form.get());
            return {};
        }
    }
    form->SetOpener([this](RecordsetRef Row) { pvMergeListRow(Row); },
                    [this] { pvDetailDeleted(); });
    m_oDetailForm = form;
    return form;
}

void cListFrame::pvDetailDeleted() {
    if (m_oForm) m_oForm->Refresh();
}

void cListFrame::pvShowDetails(const std::string& Key) {
    if (auto form = pvGetDetailForm()) form->ShowDetails(Key);
}

void cListFrame::pvDeleteInactive() {
    if (m_oForm->MsgBox(kAskDeleteInactive, vbYesNo | vbQuestion) != vbYes) return;
    auto services = FrameworkServices();
    if (!services || !services->RecordDeletion()) return;
    services->RecordDeletion()->DeleteRecords(m_oConnection.get(), m_oGridExt.get(), m_oForm.get(),
                                              kBllCallKind, m_oDef.DeleteOperation, m_oDef.KeyField,
                                              true);
}

void cListFrame::pvMergeListRow(const RecordsetRef& Row) {
    try {
        if (!Row || !m_rsList || Row->recordCount() == 0) return;
        Row->moveFirst();
        const std::string key = C2Str(Row->value(m_oDef.KeyField));
        if (key.empty()) return;
        const std::string criterion = m_oDef.KeyField + "='" + SqlQuote(key) + "'";
        auto rows = m_rsList->clone();
        if (!rows->find(criterion)) rows->addNew();
        for (size_t i = 0; i < Row->fieldCount(); ++i) {
            const std::string& name = Row->fieldDef(i).name;
            if (rows->fieldIndex(name) >= 0) rows->setValue(name, Row->value(i));
        }
        rows->update();
        m_rsList->updateBatch();
        m_oGridExt->Refresh();
        m_oGridExt->MoveToRow(criterion);
    } catch (...) {
        PrintError("pvMergeListRow", m_oDef.ObjectName);
    }
}

void cListFrame::QueryTerminate(bool& Cancel) {
    try {
        std::vector<pelta::Variant> objects{pelta::Variant(pelta::ObjectRef(m_oDetailForm)),
                                            pelta::Variant(pelta::ObjectRef(m_oForm))};
        QueryTerminateObjects(Cancel, objects);
    } catch (...) {
        PrintError("IZonTerminate_QueryTerminate", m_oDef.ObjectName);
    }
}

void cListFrame::Terminate() {
    try {
        if (m_oForm) m_oForm->Events() = {};
        if (m_oGridExt) m_oGridExt->Events() = {};
        TerminateRefs(m_oDetailForm, m_oForm);
        m_oGridExt.reset();
        m_oDetailOpener.reset();
        m_rsList.reset();
        m_oConnection.reset();
        m_oSite.reset();
    } catch (...) {
        PrintError("IZonTerminate_Terminate", m_oDef.ObjectName);
    }
}

}  // namespace PeltaNom15
