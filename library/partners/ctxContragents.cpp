#include "library/partners/ctxContragents.h"

#include "library/contracts/Constants.h"
#include "library/frame/Declarations.h"
#include "library/frame/Forms.h"
#include "library/frame/mdBllCall.h"
#include "library/frame/mdBllErrors.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdFilter.h"
#include "library/frame/mdGlobals.h"
#include "platform/automation/error.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

namespace {

constexpr const char* kObjectName = "ctxContragents";
constexpr const char* kCaption = "Контрагенти";
constexpr const char* kDetailForm = "frmContragentsDetails";
constexpr const char* kMultiForm = "frmContragentsMultiDetails";
constexpr const char* kEmployeeForm = "PeltaSalaries15.frmEmployeesDetails";
constexpr const char* kNoRights = "Недостатъчни права за извършване на операция";
constexpr const char* kCannotCreate = "Невъзможно създаване на форма %1";
constexpr const char* kFindHint = "(префикс '/' за търсене по код, '//' за търсене по адрес и др.)";

struct ColumnText {
    const char* Field;
    const char* Caption;
};

// The grid's columns in their order; an empty caption marks a column the
// layout shows without one (kept hidden at first).
constexpr ColumnText kColumns[] = {
    {"Icon", "Икона"},
    {"MediaThumbPreview", "Миниатюра"},
    {"Code", "Код"},
    {"Name", "Име"},
    {"CgTypeName", "Тип"},
    {"TaxNo", "ДДС No."},
    {"Bulstat", "Ид. No."},
    {"DvskNo", "ДВСК No."},
    {"Address", "Адрес"},
    {"CorrespAddress", "Адрес за кореспонденция"},
    {"CountryName", "Държава"},
    {"CityName", "Населено място"},
    {"PostalCode", "Пощенски код"},
    {"DeliveryAddress", "Адрес на доставка"},
    {"CreditLimitation", "Кредитен лимит"},
    {"InvDaysPostponePmt", ""},
    {"SupDaysPostponePmt", ""},
    {"Phone", "Телефони"},
    {"Fax", "Факс"},
    {"Email", "Ел. поща"},
    {"WebAddress", "Адрес в интернет (URL)"},
    {"PrsOspName", "Дилър"},
    {"PriceListName", "Ценова листа"},
    {"DiscountName", "Схема ТО"},
    {"BonusName", "Схема бонус точки"},
    {"FltCategories", "Филтрирани дименсии"},
    {"InvCgOwnName", "Издател при фактуриране"},
    {"DefMolName", "МОЛ по подразбиране"},
    {"DefMolEgn", "ЕГН на МОЛ по подразбиране"},
    {"IsEmployee", "Свързан служител"},
    {"WayOfPayment", "Начин на плащане"},
    {"ContactName", "Лице за контакт"},
    {"ContactEmail", "Ел. поща на лицето за контакт"},
    {"ContactPhones", "Телефони на лицето за контакт"},
    {"NumAttachments", "Брой прикачени файлове"},
    {"MaxDaysInArrears", ""},
    {"License", "Лиценз No."},
    {"LicenseMi", "Лиценз МИ No."},
    {"PosCards", "Клиентски карти"},
    {"Name2", "Доп. име"},
    {"Note", "Забележка"},
    {"IsActive", "Активен"},
    {"DimValueName", "Група"},
    {"CU", ""},
    {"CD", ""},
    {"LU", ""},
    {"LD", ""},
    {"ID", ""},
    {"CgType_ID", ""},
    {"NoteRtf", ""},
    {"MediaThumbData", ""},
};

// Columns the control fills itself.
bool IsComputed(std::string_view Field) {
    return Field == "Icon" || Field == "MediaThumbPreview" || Field == "ContactPhones" ||
           Field == "PosCards";
}

std::vector<ColumnDecl> BaseColumns() {
    std::vector<ColumnDecl> out;
    for (const auto& t : kColumns) {
        ColumnDecl c;
        c.Key = t.Field;
        c.Caption = t.Caption;
        c.Field = IsComputed(t.Field) ? std::string() : std::string(t.Field);
        c.Visible = *t.Caption != '\0';
        const std::string_view f = t.Field;
        if (f == "CreditLimitation") c.Format = "#,##0.00######";
        if (f == "InvDaysPostponePmt" || f == "SupDaysPostponePmt") c.Format = "#,##0";
        out.push_back(std::move(c));
    }
    return out;
}

ListDefinition ContragentsList() {
    ListDefinition d;
    d.Caption = kCaption;
    d.ObjectName = kObjectName;
    d.FormHelpID = 2201;
    d.GridHelpID = 2203;
    d.GridLayoutKey = "{3C4F2A61-7D0B-4E58-9A1C-52E6B8F0D311}";
    d.DetailLayoutKey = "{8A2D6C14-0F3E-4B7A-B5D9-1E7C3F64A922}";
    d.ReadOperation = "GetNomContragents";
    d.DeleteOperation = "DelNomContragents";
    d.DetailFormClass = kDetailForm;
    d.RemovedCommands = {502, 202, 204, 304, 103, 201};
    d.Commands = {
        {kCmdNew, "Нов контрагент...\tCtrl+N", "Нов контрагент (Ctrl+N)"},
        {kCmdOpen, "Редакция контрагент...\tCtrl+O", "Редакция на контрагент (Ctrl+O)"},
        {kCmdDeleteInactive, {}, "Изтриване на неактивен контрагент (Del)"},
    };
    d.Columns = BaseColumns();
    return d;
}

std::string Text(const RecordsetRef& Rows, const char* Field) {
    if (!Rows || Rows->fieldIndex(Field) < 0) return {};
    return C2Str(Rows->value(Field));
}

}  // namespace

ctxContragents::ctxContragents() : cListFrame(ContragentsList()) {}

std::string ctxContragents::PosCardsText(std::string_view Stored) {
    // The first and the last character are the outer separators.
    if (CharCount(Stored) < 2) return {};
    size_t first = 1;
    while (first < Stored.size() && (static_cast<unsigned char>(Stored[first]) & 0xC0) == 0x80)
        ++first;
    size_t last = Stored.size() - 1;
    while (last > 0 && (static_cast<unsigned char>(Stored[last]) & 0xC0) == 0x80)
        --last;
    if (last < first) return {};
    std::string out;
    for (char c : Stored.substr(first, last - first)) {
        if (c == '\x7F')
            out += "; ";
        else
            out += c;
    }
    return out;
}

void ctxContragents::pvInitList() {
    m_oForm->DeclareControls({
        Control("tvFilter", ControlKind::Tree, "Филтър"),
        Control("splSplitterLight1", ControlKind::Splitter),
        Control("fraPreview", ControlKind::Label),
        Control("rchNote", ControlKind::RichText, "Забележка"),
        Control("ctxInfoNote1", ControlKind::Note),
    });
    m_oForm->AddCommand(kCmdEditEmployee, "Редакция служител...", "file");
    m_oForm->AddCommand(kCmdNewEmployee, "Нов служител...", "file");
    m_oForm->AddCommand(kCmdPreview, "Панел за преглед", "view");
    // The filter form is a screen of its own; without it the command is not offered.
    if (!IsClassRegistered("frmContragentsFilter")) m_oForm->ShowCommand(kCmdFilter, false);

    m_oGridExt->SetMultiSelect(true);
    m_oGridExt->Events().FetchData = [this](const pelta::Variant& Bookmark,
                                            const std::string& Column, pelta::Variant& Value) {
        m_oGridExt_FetchData(Bookmark, Column, Value);
    };
    m_oGridExt->Events().RowColChange = [this](const pelta::Variant&, const std::string&) {
        m_oGridExt_RowColChange();
    };

    m_oTreeExt = CreateTreeExtender(this, "tvFilter");
    if (m_oTreeExt)
        m_oTreeExt->Events().NodeActivate = [this](const std::string& Key) {
            m_oTreeExt_NodeActivate(Key);
        };
    m_oQuickFilterExt = CreateQuickFilterExtender(this, m_oGridExt.get(), kFindHint);
    if (m_oQuickFilterExt) {
        m_oQuickFilterExt->AddField(kFilterFind, "Търсене", {"Name"});
        m_oQuickFilterExt->AddField(kFilterGroup, "cg-grp", {});
        m_oQuickFilterExt->AddField(kFilterType, "cg-type", {"CgType_ID"});
        m_oQuickFilterExt->Events().FilterClause = [this](int32_t FilterID, const std::string& Text,
                                                          std::string& Clause, bool& Handled) {
            m_oQuickFilterExt_FilterClause(FilterID, Text, Clause, Handled);
        };
    }
    m_oSplitterExt = CreateSplitterExtender(this, "SplitterPos", 0.6);
    m_bPreviewPane = C2Lng(m_oForm->GetSetting("PreviewPane", pelta::Variant(1))) != 0;
}

void ctxContragents::pvWriteFetchRequest(pelta::PropertyBag& Request) {
    auto put = [&](const char* name, const std::string& value) {
        if (!value.empty()) Request.writeProperty(name, pelta::Variant(value));
    };
    put("CgTypes", m_sCgTypes);
    put("CgTypes2", m_sCgTypes2);
    put("Dimension_ID", m_sDimension);
    put("DimValue_ID", m_sDimValue);
    put("Media", m_sMedia);
    put("MediaValue", m_sMediaValue);
}

bool ctxContragents::pvReadFetchResponse(pelta::PropertyBag& Response) {
    const pelta::Variant refusal = Response.readProperty("BllError");
    if (!refusal.isEmpty()) {
        // Without the right to read the list the note stands in the grid's place.
        if (C2Lng(refusal) == 24)
            m_oForm->SetControlValue("ctxInfoNote1", pelta::Variant(kNoRights));
        else
            ShowBllError(m_oForm.get(), &Response);
        return false;
    }
    m_oForm->SetControlValue("ctxInfoNote1", pelta::Variant());
    m_rsTypes = RecordsetProperty(&Response, "Type");
    m_rsDimensions = RecordsetProperty(&Response, "Dimensions");
    m_rsDimValues = RecordsetProperty(&Response, "DimValues");
    m_rsDimMedia = RecordsetProperty(&Response, "DimMedia");
    m_rsCustomFormats = RecordsetProperty(&Response, "CustomFormats");
    m_rsRow.reset();
    m_bRefetch = false;
    m_vChosen.clear();
    m_lNextItem = 0;
    pvDeclareColumns();
    pvBuildTree();
    return cListFrame::pvReadFetchResponse(Response);
}

void ctxContragents::pvDeclareColumns() {
    auto columns = BaseColumns();
    if (m_rsDimensions && m_rsDimensions->recordCount() > 0) {
        auto dims = m_rsDimensions->clone();
        for (dims->moveFirst(); !dims->eof(); dims->moveNext()) {
            const std::string code = C2Str(dims->value("Code"));
            bool taken = code.empty();
            for (const auto& c : columns)
                taken = taken || c.Key == code;
            if (taken) continue;
            ColumnDecl c;
            c.Key = code;
            c.Field = code;
            c.Caption = C2Str(dims->value("Name"));
            columns.push_back(std::move(c));
        }
    }
    m_oGridExt->DeclareColumns(columns);
}

void ctxContragents::pvBuildTree() {
    if (!m_oTreeExt) return;
    const std::string selected = m_oTreeExt->SelectedKey();
    m_oTreeExt->Clear();
    m_oTreeExt->AddNode({}, "all", "(Всички)");
    auto group = [&](const char* key, const char* caption, const RecordsetRef& rows,
                     const char* prefix) {
        if (!rows) return;
        m_oTreeExt->AddNode({}, key, caption);
        if (rows->recordCount() == 0) return;
        auto r = rows->clone();
        for (r->moveFirst(); !r->eof(); r->moveNext())
            m_oTreeExt->AddNode(key, prefix + C2Str(r->value("ID")), C2Str(r->value("Name")));
    };
    group("grp-type", "Тип", m_rsTypes, "type:");
    group("grp-dim", "Дименсии", m_rsDimensions, "dim:");
    if (m_rsDimValues && m_rsDimValues->recordCount() > 0) {
        auto v = m_rsDimValues->clone();
        for (v->moveFirst(); !v->eof(); v->moveNext()) {
            const std::string parent = "dim:" + C2Str(v->value("Dimension_ID"));
            try {
                m_oTreeExt->AddNode(parent, "val:" + C2Str(v->value("ID")),
                                    C2Str(v->value("Name")));
            } catch (const pelta::Error&) {
                // A value of a dimension that is not shown.
            }
        }
    }
    group("grp-media", "Медия дименсии", m_rsDimMedia, "media:");
    // The chosen node stays chosen across fetches when it is still there.
    if (selected.empty() || !m_oTreeExt->SelectNode(selected)) m_oTreeExt->SelectNode("all");
}

void ctxContragents::m_oTreeExt_NodeActivate(const std::string& Key) {
    try {
        if (!m_oQuickFilterExt) return;
        std::string type, values;
        if (Key.rfind("type:", 0) == 0) type = Key.substr(5);
        if (Key.rfind("val:", 0) == 0 && m_rsDimValues) {
            auto v = m_rsDimValues->clone();
            if (v->recordCount() > 0 && v->find("ID = " + FilterLiteral(Key.substr(4))))
                values = C2Str(v->value("Name"));
        }
        m_oQuickFilterExt->SetText(kFilterType, type);
        m_oQuickFilterExt->SetText(kFilterGroup, values);
        if (values.empty()) m_sGroupCaption.clear();
        m_oQuickFilterExt->Apply();
    } catch (...) {
        ShowError("m_oTreeExt_NodeActivate", kObjectName, kCaption);
    }
}

void ctxContragents::m_oGridExt_FetchData(const pelta::Variant& Bookmark, const std::string& Column,
                                          pelta::Variant& Value) {
    try {
        if (!m_rsList) return;
        if (!m_rsRow) m_rsRow = m_rsList->clone();
        m_rsRow->setBookmark(Bookmark);
        if (m_rsRow->eof() || m_rsRow->bof()) return;
        if (Column == "PosCards") {
            Value = pelta::Variant(PosCardsText(Text(m_rsRow, "PosCards")));
        } else if (Column == "ContactPhones") {
            std::string phones;
            for (const char* f : {"ContactPhoneWork", "ContactPhoneMobile"}) {
                std::string p = Text(m_rsRow, f);
                if (!p.empty()) phones += (phones.empty() ? "" : "; ") + p;
            }
            Value = pelta::Variant(phones);
        } else if (Column == "Icon") {
            const bool employee = C2Bool(m_rsRow->value("IsEmployee"));
            const bool active = C2Bool(m_rsRow->value("IsActive"));
            Value = pelta::Variant(!active ? "inactive" : employee ? "employee" : "contragent");
        } else if (Column == "MediaThumbPreview") {
            Value = pelta::Variant();
        }
    } catch (...) {
        PrintError("m_oGridExt_FetchData", kObjectName);
    }
}

void ctxContragents::m_oGridExt_RowColChange() {
    try {
        if (!m_oGridExt->HasCurrentRow()) return;
        std::string note = C2Str(m_oGridExt->CurrentValue("NoteRtf"));
        if (note.empty()) note = C2Str(m_oGridExt->CurrentValue("Note"));
        m_oForm->SetControlValue("rchNote", pelta::Variant(note));
        std::string subtitle;
        for (const char* f : {"Name", "Address", "Phone", "Email"}) {
            std::string line = C2Str(m_oGridExt->CurrentValue(f));
            if (!line.empty()) subtitle += (subtitle.empty() ? "" : "\r\n") + line;
        }
        m_oForm->SetControlValue("fraPreview", pelta::Variant(subtitle));
    } catch (...) {
        PrintError("m_oGridExt_RowColChange", kObjectName);
    }
}

std::vector<std::string> ctxContragents::pvSelectedKeys() {
    std::vector<std::string> keys;
    if (!m_rsList) return keys;
    auto marks = m_oGridExt->SelectedBookmarks();
    if (marks.empty() && m_oGridExt->HasCurrentRow())
        marks.push_back(m_oGridExt->CurrentBookmark());
    auto row = m_rsList->clone();
    for (const auto& b : marks) {
        try {
            row->setBookmark(b);
        } catch (const pelta::Error&) {
            continue;
        }
        const std::string key = C2Str(row->value("ID"));
        if (IsGuid(key)) keys.push_back(key);
    }
    return keys;
}

bool ctxContragents::pvExecute(int32_t CommandID) {
    switch (CommandID) {
        case kCmdOpen:
            pvOpen();
            return true;
        case kCmdEditEmployee: {
            auto keys = pvSelectedKeys();
            if (!keys.empty()) pvOpenEmployee(keys.front());
            return true;
        }
        case kCmdNewEmployee:
            pvOpenEmployee({});
            return true;
        case kCmdPreview:
            m_bPreviewPane = !m_bPreviewPane;
            m_oForm->SaveSetting("PreviewPane", pelta::Variant(m_bPreviewPane ? 1 : 0));
            return true;
        case kCmdFilter:
            pvOpenForm("frmContragentsFilter", {});
            return true;
        default:
            return false;
    }
}

void ctxContragents::pvOpen() {
    const auto keys = pvSelectedKeys();
    if (keys.empty()) return;
    if (keys.size() > 1) {
        std::string joined;
        for (const auto& k : keys)
            joined += (joined.empty() ? "" : "\x01") + k;
        pvOpenForm(kMultiForm, joined);
        return;
    }
    // Employees are edited in the salaries' own editor.
    auto row = m_rsList->clone();
    if (row->find("ID = " + FilterLiteral(keys.front())) && C2Bool(row->value("IsEmployee"))) {
        pvOpenEmployee(keys.front());
        return;
    }
    pvShowDetails(keys.front());
}

bool ctxContragents::pvOpenForm(const std::string& ClassName, const std::string& Key) {
    if (m_oDetailOpener && !m_oDetailOpener->HasRight(kRightOpenDetails)) return false;
    pelta::ObjectRef created;
    if (ClassName.find('.') != std::string::npos)
        created = CreateFrameworkObject(ClassName);
    else if (IsClassRegistered(ClassName))
        created = CreateRegisteredClass(ClassName);
    auto form = pelta::queryRef<IDetailForm>(created);
    if (!form) {
        m_oForm->MsgBox(Printf(kCannotCreate, ClassName), vbExclamation);
        return false;
    }
    if (!form->frInit(m_oSite.get())) {
        TerminateObject(form.get());
        return false;
    }
    if (m_oOtherForm && m_oOtherForm != form) TerminateRefs(m_oOtherForm);
    m_oOtherForm = form;
    form->SetOpener([this](RecordsetRef Row) { pvMergeListRow(Row); },
                    [this] {
                        if (m_oForm) m_oForm->Refresh();
                    });
    return form->ShowDetails(Key);
}

void ctxContragents::pvOpenEmployee(const std::string& Key) {
    pvOpenForm(kEmployeeForm, Key);
}

std::string ctxContragents::GetColumnName(int32_t Index) {
    try {
        if (Index == 0) {
            std::string name;
            if (m_oConnection)
                if (auto params = m_oConnection->AppParameters())
                    if (auto p = params->Item("DefCgDimensionName")) name = C2Str(p->Value());
            return name.empty() ? std::string("Група") : name;
        }
        if (!m_rsDimensions || Index < 0 || Index > m_rsDimensions->recordCount()) return {};
        auto dims = m_rsDimensions->clone();
        dims->moveFirst();
        dims->move(Index - 1);
        return dims->eof() ? std::string() : C2Str(dims->value("Name"));
    } catch (...) {
        PrintError("IZonGridDimsSelector_GetColumnName", kObjectName);
        return {};
    }
}

void ctxContragents::Terminate() {
    try {
        if (m_oForm) m_oForm->SaveSetting("PreviewPane", pelta::Variant(m_bPreviewPane ? 1 : 0));
        if (m_oSplitterExt) m_oSplitterExt->SetPosition(m_oSplitterExt->Position());
        if (m_oTreeExt) m_oTreeExt->Events() = {};
        if (m_oQuickFilterExt) m_oQuickFilterExt->Events() = {};
        TerminateRefs(m_oOtherForm);
        m_oTreeExt.reset();
        m_oQuickFilterExt.reset();
        m_oSplitterExt.reset();
        m_rsTypes.reset();
        m_rsDimensions.reset();
        m_rsDimValues.reset();
        m_rsDimMedia.reset();
        m_rsCustomFormats.reset();
        m_rsRow.reset();
        m_vChosen.clear();
    } catch (...) {
        PrintError("IZonTerminate_Terminate", kObjectName);
    }
    cListFrame::Terminate();
}

}  // namespace PeltaNom15
