#include "library/other/frmRatiosDetails.h"

#include <cmath>

#include "library/contracts/Constants.h"
#include "library/frame/Declarations.h"
#include "library/frame/mdBllCall.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

namespace {

DetailDefinition RatiosDetails() {
    DetailDefinition d;
    d.Caption = "Валутни курсове";
    d.ObjectName = "frmRatiosDetails";
    d.HelpID = 2122;
    d.LayoutKey = "{687449F9-346A-40D3-B676-908472759566}";
    d.ListName = "ctxRatios";
    d.ReadOperation = "GetNomCurrRatiosDetails";
    d.UpdateOperation = "UpdNomCurrRatiosDetails";
    d.DeleteOperation = "DelNomCurrRatios";
    ControlDecl bank = Control("cboBank", ControlKind::Combo, "Банка", "Pr_ID");
    bank.Prompt = "Изберете банка";
    bank.Hint = "(префикс '/' за описание)";
    d.Controls = {
        Control("dtpDate", ControlKind::Date, "Дата", "Date"),
        bank,
        Control("chkIsActive", ControlKind::CheckBox, "Активен", "IsActive"),
        Control("tabMain", ControlKind::TabStrip, {}, {}),
        Control("geRows", ControlKind::Grid, "Курсове", {}, "Курсове"),
        Control("txtNote", ControlKind::Note, "Забележка", "Note", "Допълнителни"),
        Control("rchNoteRtf", ControlKind::RichText, "Форматирана забележка", "NoteRtf",
                "Допълнителни"),
    };
    d.ModifiedFields = {"Date", "IsActive", "Pr_ID"};
    return d;
}

bool IsBlank(const pelta::Variant& v) {
    return v.isEmpty() || v.isNull() || (v.isString() && v.str().empty());
}

const ClassCreator s_oReplaced = RegisterFormClass(
    "frmRatiosDetails", [] { return pelta::ObjectRef(pelta::makeRef<frmRatiosDetails>()); });

}  // namespace

frmRatiosDetails::frmRatiosDetails() : cDetailFrame(RatiosDetails()) {}

bool frmRatiosDetails::pvInitForm() {
    m_oGridExt = CreateGridExtender(this, "geRows", {}, 2124);
    if (!m_oGridExt) return false;
    m_oGridExt->DeclareColumns({
        Column("Currency_ID", "Валута", EditorKind::Combo),
        Column("CurrencyCode", "Код", EditorKind::None),
        Column("Units", "Единици", EditorKind::Number, true, "#,##0"),
        Column("Rate", "Курс", EditorKind::Number, true, "#,##0.000000"),
        Column("ID", "ID", EditorKind::None, false),
        Column("CurrRatio_ID", "CurrRatio_ID", EditorKind::None, false),
    });
    m_oGridExt->Events().BeforeUpdate = [this](bool& Cancel) { m_oGridExt_BeforeUpdate(Cancel); };
    m_oTabExt = CreateTabExtender(this, {"Курсове", "Допълнителни"});
    m_oSplitterAdditionalExt = CreateSplitterExtender(this, "SplitterAdditional", 0.7);
    m_oSplitterAttribsExt = CreateSplitterExtender(this, "SplitterAttrib", 0.5);
    return m_oTabExt && m_oSplitterAdditionalExt && m_oSplitterAttribsExt;
}

void frmRatiosDetails::pvTakeResponse(pelta::PropertyBag& Response, bool) {
    m_rsRows = RecordsetProperty(&Response, "Rows");
    if (auto currencies = RecordsetProperty(&Response, "Currencies")) {
        m_rsCurrencies = currencies;
        m_oGridExt->SetColumnList("Currency_ID", m_rsCurrencies, "ID", {"Code", "Name"});
    }
    if (auto banks = RecordsetProperty(&Response, "Banks")) {
        m_rsBanks = banks;
        m_oForm->SetControlList("cboBank", m_rsBanks, "ID", {"Name", "Description", "GroupName"});
    }
}

void frmRatiosDetails::pvNewRecord() {
    m_rsHead->setValue("Date", pelta::Variant(pelta::Date{std::floor(pelta::now().oa)}));
}

void frmRatiosDetails::pvFillControls() {
    if (m_rsRows) m_oGridExt->Bind(m_rsRows);
}

bool frmRatiosDetails::pvIsModified() {
    return m_oGridExt->EditState();
}

bool frmRatiosDetails::pvIsCorrect() {
    if (IsBlank(m_oForm->ControlValue("cboBank"))) {
        m_oForm->ShowMessage("cboBank", "Моля изберете банка");
        return false;
    }
    return m_oGridExt->ValidateRows();
}

void frmRatiosDetails::pvUpload() {
    if (!m_rsRows || m_rsRows->fieldIndex("Pr_ID") < 0) return;
    // Each row carries the bank of its head.
    const pelta::Variant bank = m_rsHead->value("Pr_ID");
    auto rows = m_rsRows->clone();
    for (rows->moveFirst(); !rows->eof(); rows->moveNext()) {
        if (!SameValue(rows->value("Pr_ID"), bank)) {
            rows->setValue("Pr_ID", bank);
            rows->update();
        }
    }
}

void frmRatiosDetails::pvWriteSaveRequest(pelta::PropertyBag& Request) {
    Request.writeProperty("Rows", pelta::Variant(pelta::ObjectRef(m_rsRows)));
    if (m_rsCurrencies)
        Request.writeProperty("Currencies", pelta::Variant(pelta::ObjectRef(m_rsCurrencies)));
}

bool frmRatiosDetails::pvShowRowError(pelta::PropertyBag&, const std::string& RowID) {
    if (!m_oGridExt->MoveToRow("Currency_ID='" + SqlQuote(RowID) + "'") &&
        !m_oGridExt->MoveToRow("ID='" + SqlQuote(RowID) + "'"))
        return false;
    std::string currency = C2Str(m_oGridExt->CurrentValue("CurrencyCode"));
    if (currency.empty() && m_rsCurrencies) {
        auto c = m_rsCurrencies->clone();
        if (c->find("ID='" + SqlQuote(RowID) + "'")) currency = C2Str(c->value("Code"));
    }
    const std::string date = C2Str(m_oForm->ControlValue("dtpDate"));
    m_oForm->MsgBox("Дублиране на валута.\r\n\r\n" +
                        Printf("За дата %1 вече има дефиниран курс за валута %2.", date, currency),
                    vbExclamation, m_oDef.Caption);
    return true;
}

void frmRatiosDetails::m_oGridExt_BeforeUpdate(bool& Cancel) {
    try {
        if (IsBlank(m_oGridExt->CurrentValue("Units"))) {
            m_oForm->ShowMessage("geRows", "Моля въведете единица валута");
            Cancel = true;
        } else if (IsBlank(m_oGridExt->CurrentValue("Rate"))) {
            m_oForm->ShowMessage("geRows", "Моля въведете курс");
            Cancel = true;
        }
    } catch (...) {
        Cancel = true;
        ShowError("m_oGridExt_BeforeUpdate", m_oDef.ObjectName, m_oDef.Caption);
    }
}

void frmRatiosDetails::Terminate() {
    if (m_oGridExt) m_oGridExt->Events() = {};
    m_oGridExt.reset();
    m_oTabExt.reset();
    m_oSplitterAdditionalExt.reset();
    m_oSplitterAttribsExt.reset();
    m_rsRows.reset();
    m_rsCurrencies.reset();
    m_rsBanks.reset();
    cDetailFrame::Terminate();
}

}  // namespace PeltaNom15
