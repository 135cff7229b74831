#include "library/partners/frmContragentsDetails.h"

#include "library/contracts/Constants.h"
#include "library/frame/Declarations.h"
#include "library/frame/mdBllCall.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdFilter.h"
#include "library/frame/mdGlobals.h"
#include "library/partners/frmContragentsAttribs.h"
#include "platform/automation/guid.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

namespace {

constexpr const char* kObjectName = "frmContragentsDetails";
constexpr const char* kLayoutKey = "{8A2D6C14-0F3E-4B7A-B5D9-1E7C3F64A922}";
constexpr const char* kLists =
    "Списъци<|Адреси на доставка|Банкови сметки|Поделения|Доставни цени|Кодове на %1 в ИС на "
    "контрагенти|Вендор кодове на продукти|Вендор кодове на контрагенти|Бонус точки|Мин/Макс "
    "количества|Дилъри и поделения|Прикачени файлове>Търговска система<Документи за "
    "продажба|Документи за покупка|Документи за заявка|Складови документи|Протоколи за "
    "инвентаризация|Касови документи|Банкови документи|Гаранционни карти|Куриерски "
    "товарителници>Счетоводна система<Счетоводни документи>Организация<Работни карти|Договори>";

DetailDefinition ContragentsDetails() {
    DetailDefinition d;
    d.Caption = "Контрагент";
    d.ObjectName = kObjectName;
    d.HelpID = 2202;
    d.LayoutKey = kLayoutKey;
    d.ListName = "ctxContragents";
    d.NeedList = "ctxPr|ctxContragents";
    d.ReadOperation = "GetNomContragentsDetails";
    d.UpdateOperation = "UpdNomContragentsDetails";
    d.DeleteOperation = "DelNomContragents";
    d.Controls = {
        Control("txtCode", ControlKind::Text, "Код", "Code"),
        Control("txtName", ControlKind::Text, "Име", "Name"),
        Control("txtAddress", ControlKind::Text, "Адрес", "Address"),
        Control("chkIsActive", ControlKind::CheckBox, "Активен", "IsActive"),
        Control("txtTaxNo", ControlKind::Text, "ДДС No.", "TaxNo"),
        Control("txtBulstat", ControlKind::Text, "Идент. No.", "Bulstat"),
        Control("cboCgType", ControlKind::Combo, "Тип", "CgType_ID"),
        Control("cboPrsOsp", ControlKind::Combo, "Получател", "PrsOsp_ID"),
        Control("cboCgDimension", ControlKind::Combo, "Дименсия", {}),
        Control("geCgDimension", ControlKind::Grid, "Дименсия", {}),
        Control("tvLists", ControlKind::Tree, "Списъци", {}),
        Control("gePersons", ControlKind::Grid, "Персони", {}, "Списъци"),
        Control("geAddresses", ControlKind::Grid, "Адреси на доставка", {}, "Адреси на доставка"),
        Control("geBankAcc", ControlKind::Grid, "Банкови сметки", {}, "Банкови сметки"),
        Control("geDepartments", ControlKind::Grid, "Поделения", {}, "Поделения"),
        Control("txtNote", ControlKind::Note, "Забележка", "Note"),
        Control("rchNoteRtf", ControlKind::RichText, "Забележка", "NoteRtf"),
    };
    for (const AttributeDecl& a : ContragentAttributes()) {
        ControlDecl c = Control(std::string("att") + a.Field, a.Kind, a.Caption, a.Field, a.Group);
        c.Format = a.Format;
        d.Controls.push_back(std::move(c));
    }
    return d;
}

// A fixed choice list "0|Име|1|Име..." as rows of ID and Name.
RecordsetRef ValueList(const std::string& Values) {
    auto rs = pelta::makeRef<pelta::Recordset>();
    rs->appendField("ID", pelta::FieldType::Long);
    rs->appendField("Name", pelta::FieldType::Text);
    rs->open();
    size_t from = 0;
    std::vector<std::string> parts;
    while (from <= Values.size()) {
        size_t at = Values.find('|', from);
        if (at == std::string::npos) at = Values.size();
        parts.push_back(Values.substr(from, at - from));
        from = at + 1;
    }
    for (size_t i = 0; i + 1 < parts.size(); i += 2) {
        rs->addNew();
        rs->setValue("ID", pelta::Variant(C2Lng(pelta::Variant(parts[i]))));
        rs->setValue("Name", pelta::Variant(parts[i + 1]));
        rs->update();
    }
    rs->updateBatch();
    return rs;
}

const ClassCreator s_oReplaced = RegisterFormClass(
    kObjectName, [] { return pelta::ObjectRef(pelta::makeRef<frmContragentsDetails>()); });

}  // namespace

frmContragentsDetails::frmContragentsDetails() : cDetailFrame(ContragentsDetails()) {}

const std::vector<std::string>& frmContragentsDetails::SubLists() {
    static const std::vector<std::string> names = {
        "PriceList",    "Person",        "BankAcc",    "Departments", "ItemsCodes",
        "SupplCodes",   "CgBonuses",     "CgMinQuo",   "DealersDeps", "CgCodes",
        "CgDimensions", "CgAttachments", "CgAddresses"};
    return names;
}

bool frmContragentsDetails::pvInitForm() {
    const GridDecl grids[] = {
        {"gePersons",
         2211,
         {Column("Code", "Код", EditorKind::Text), Column("Name", "Име", EditorKind::Text),
          Column("IsActive", "Активен", EditorKind::CheckBox),
          Column("IsMol", "МОЛ", EditorKind::CheckBox),
          Column("IsOsp", "Получател", EditorKind::CheckBox),
          Column("IsDefMol", "МОЛ по подразбиране", EditorKind::CheckBox),
          Column("IsDefOsp", "Получател по подразбиране", EditorKind::CheckBox),
          Column("IsContact", "Лице за контакт", EditorKind::CheckBox),
          Column("PhoneMobile", "Телефони", EditorKind::Text),
          Column("Email", "Ел. поща", EditorKind::Text),
          Column("ID", "ID", EditorKind::None, false),
          Column("Cg_ID", "Cg_ID", EditorKind::None, false)}},
        {"geAddresses",
         2212,
         {Column("Name", "Адрес на доставка", EditorKind::Text),
          Column("IsDefault", "По подразбиране", EditorKind::CheckBox),
          Column("PostalCode", "Пощенски код", EditorKind::Text),
          Column("ID", "ID", EditorKind::None, false)}},
        {"geBankAcc",
         2213,
         {Column("Name", "Сметка", EditorKind::Text),
          Column("AccountCode", "IBAN", EditorKind::Text),
          Column("BankCode", "BIC", EditorKind::Text),
          Column("CurrencyCode", "Валута", EditorKind::Text),
          Column("ID", "ID", EditorKind::None, false)}},
        {"geDepartments",
         2214,
         {Column("Code", "Код", EditorKind::Text), Column("Name", "Име", EditorKind::Text),
          Column("Bulstat", "Идент. No.", EditorKind::Text),
          Column("Address", "Адрес", EditorKind::Text),
          Column("DeliveryAddress_ID", "Адрес на доставка", EditorKind::Combo),
          Column("BankAcc_ID", "Банкови сметки", EditorKind::Combo),
          Column("PrsMol_ID", "МОЛ", EditorKind::Combo),
          Column("ID", "ID", EditorKind::None, false)}},
        {"geCgDimension",
         2215,
         {Column("Checked", "", EditorKind::CheckBox), Column("Name", "Име", EditorKind::None),
          Column("ID", "ID", EditorKind::None, false)}},
    };
    if (!pvCreateGrids(grids)) return false;

    m_oTreeListsExt = CreateTreeExtender(this, "tvLists");
    if (!m_oTreeListsExt) return false;
    // "Group<child|child>": an empty child is the group's own list.
    std::string lists = Printf(kLists, "продукти"), group, name;
    std::vector<std::string> path;
    int n = 0;
    auto add = [&](const std::string& text, bool isGroup) {
        const std::string parent = path.empty() ? std::string() : path.back();
        std::string key = text.empty() ? parent + "#own" : "node" + std::to_string(++n);
        m_oTreeListsExt->AddNode(parent, key, text.empty() ? parent : text);
        if (isGroup) path.push_back(key);
    };
    for (char c : lists) {
        if (c == '<') {
            add(name, true);
            name.clear();
        } else if (c == '|' || c == '>') {
            // The group's own list is the group node itself.
            if (!name.empty()) add(name, false);
            name.clear();
            if (c == '>' && !path.empty()) path.pop_back();
        } else {
            name += c;
        }
    }
    const std::string kept = C2Str(m_oForm->GetSetting("TreeLists", pelta::Variant()));
    if (!kept.empty()) m_oTreeListsExt->SelectNode(kept);
    m_oTreeListsExt->Events().NodeActivate = [this](const std::string& Key) {
        if (m_oForm) m_oForm->SaveSetting("TreeLists", pelta::Variant(Key));
    };
    m_oSplitterTreeExt = CreateSplitterExtender(this, "#1", 0.25);

    for (const AttributeDecl& a : ContragentAttributes())
        if (*a.Values)
            m_oForm->SetControlList(std::string("att") + a.Field, ValueList(a.Values), "ID",
                                    {"Name"});

    m_oTypeFieldExt = CreateFieldExtender(m_oForm.get(), "cboCgType");
    m_oNameFieldExt = CreateFieldExtender(m_oForm.get(), "txtName");
    if (!m_oTypeFieldExt || !m_oNameFieldExt) return false;
    m_oTypeFieldExt->Events().Change = [this] { pvSyncDefaultPerson(); };
    m_oNameFieldExt->Events().Change = [this] { pvSyncDefaultPerson(); };
    return m_oSplitterTreeExt != nullptr;
}

void frmContragentsDetails::pvTakeResponse(pelta::PropertyBag& Response, bool Fetched) {
    for (const std::string& name : SubLists())
        m_oRows[name] = RecordsetProperty(&Response, name);
    static const char* const kReferences[] = {
        "ContragentType", "PriceListType", "Currency",      "PersonPosition", "Measures",
        "DiscountSchema", "Osp",           "OwnPersons",    "Accounts",       "ItmDimensions",
        "ItmDimValues",   "Countries",     "Bonuses",       "ObjectType",     "Dimensions",
        "DimValues",      "CgStore",       "CustomFormats", "Cities",         "PayReasons"};
    bool any = false;
    for (const char* name : kReferences)
        if (auto rs = RecordsetProperty(&Response, name)) {
            m_oRefs[name] = rs;
            any = true;
        }
    if (any) {
        auto list = [&](const char* control, const char* reference) {
            auto rs = Reference(reference);
            if (rs && rs->fieldIndex("ID") >= 0 && rs->fieldIndex("Name") >= 0)
                m_oForm->SetControlList(control, rs, "ID", {"Name"});
        };
        list("cboCgType", "ContragentType");
        for (const AttributeDecl& a : ContragentAttributes())
            if (*a.Reference) list((std::string("att") + a.Field).c_str(), a.Reference);
    }
    if (auto persons = Rows("Person"))
        if (persons->fieldIndex("Name") >= 0)
            m_oForm->SetControlList("cboPrsOsp", persons, "ID", {"Name"});
    if (Fetched) m_bFromCopy = false;
}

void frmContragentsDetails::pvNewRecord() {
    if (m_oCopy) {
        pvTakeCopy();
        return;
    }
    // A new record carries a key of its own until the service keeps it.
    m_rsHead->setValue("ID", pelta::Variant(pelta::newGuidString()));
    m_rsHead->setValue("TaxNo", pelta::Variant("BG"));
    if (auto types = Reference("ContragentType"); types && types->recordCount() > 0) {
        auto t = types->clone();
        if (t->find("IsDef = True")) m_rsHead->setValue("CgType_ID", t->value("ID"));
    }
    const pelta::Variant priceList = pvParameter("DefPriceList_ID");
    if (!C2Str(priceList).empty()) m_rsHead->setValue("PriceList_ID", priceList);
}

void frmContragentsDetails::pvFillControls() {
    for (const auto& [control, rows] :
         std::map<std::string, std::string>{{"gePersons", "Person"},
                                            {"geAddresses", "CgAddresses"},
                                            {"geBankAcc", "BankAcc"},
                                            {"geDepartments", "Departments"}})
        if (auto rs = Rows(rows)) m_oGrids[control]->Bind(rs);
    pvBindDimension();
}

bool frmContragentsDetails::pvIsModified() {
    if (m_sKey.empty() && m_bFromCopy) return true;
    for (const auto& [name, grid] : m_oGrids)
        if (name != "geCgDimension" && grid->EditState()) return true;
    return pvDimensionModified();
}

void frmContragentsDetails::pvUpload() {
    const std::string id = C2Str(m_rsHead->value("ID"));
    const pelta::Variant user(m_oConnection->CurrentUserID());
    const pelta::Variant now(pelta::now());
    // New rows of the sub-lists carry their own key and the partner's.
    for (const std::string& name : SubLists()) {
        auto rows = Rows(name);
        if (!rows || rows->fieldIndex("ID") < 0) continue;
        auto r = rows->clone();
        r->setFilter(pelta::FilterGroup::Pending);
        if (r->recordCount() == 0) continue;
        for (r->moveFirst(); !r->eof(); r->moveNext()) {
            if (r->status() != pelta::RowStatus::New) continue;
            if (C2Str(r->value("ID")).empty())
                r->setValue("ID", pelta::Variant(pelta::newGuidString()));
            if (r->fieldIndex("Cg_ID") >= 0) r->setValue("Cg_ID", pelta::Variant(id));
            if (r->fieldIndex("CU") >= 0 && r->value("CU").isNull()) {
                r->setValue("CU", user);
                r->setValue("CD", now);
            }
            r->update();
        }
    }
    // The head points to the default delivery address.
    if (auto addresses = Rows("CgAddresses"); addresses && addresses->recordCount() > 0) {
        auto a = addresses->clone();
        pelta::Variant address = pelta::Variant::null();
        if (a->find("IsDefault = True")) address = a->value("ID");
        if (!SameValue(address, m_rsHead->value("DeliveryAddress_ID")))
            m_rsHead->setValue("DeliveryAddress_ID", address);
    }
    pvUploadDimension();
}

void frmContragentsDetails::pvWriteSaveRequest(pelta::PropertyBag& Request) {
    // A new save: no duplicate agreed to yet.
    m_bAgreedBulstat = false;
    m_bAgreedTaxNo = false;
    Request.writeProperty("ID", pelta::Variant(m_sKey));
    for (const std::string& name : SubLists())
        if (auto rs = Rows(name)) Request.writeProperty(name, pelta::Variant(pelta::ObjectRef(rs)));
}

frmContragentsDetails::SaveRefusal frmContragentsDetails::pvSaveRefused(
    pelta::PropertyBag& Response, pelta::PropertyBag& Request, int32_t) {
    const int32_t code = C2Lng(Response.readProperty("BllError"));
    const std::string partner = C2Str(Response.readProperty("BllContragent"));
    switch (code) {
        case 8108:
        case 8109: {
            bool& agreed = code == 8108 ? m_bAgreedBulstat : m_bAgreedTaxNo;
            const std::string what =
                Printf(code == 8108 ? "Дублиране на Идент. No. с контрагент '%1'"
                                    : "Дублиране на ДДС No. с контрагент '%1'",
                       partner);
            // Asked once per save: the same refusal after Yes is an error.
            if (agreed) {
                m_oForm->MsgBox(what, vbExclamation);
                return SaveRefusal::Handled;
            }
            if (m_oForm->MsgBox(what + "\r\n\r\nЖелаете ли да продължите?", vbYesNo | vbQuestion) !=
                vbYes)
                return SaveRefusal::Handled;
            agreed = true;
            Request.writeProperty("CheckBulstat", pelta::Variant(false));
            return SaveRefusal::Retry;
        }
        case 10:
            return pvDuplicateCode(Response) ? SaveRefusal::Handled : SaveRefusal::Show;
        case 11:
            m_oForm->ShowMessage("txtName", "Вече съществува контрагент с това име.",
                                 "Дублиране на име",
                                 "Използвайте текстовото поле, за да модифицирате името.");
            return SaveRefusal::Handled;
        case 8103:
            m_oForm->MsgBox(Printf("Дублиране на код на признак от категория '%1'", partner),
                            vbExclamation);
            return SaveRefusal::Handled;
        case 8104:
            m_oForm->MsgBox(Printf("Дублиране на име на признак от категория '%1'", partner) +
                                "\r\n\r\nИзползвайте текстовото поле, за да модифицирате името.",
                            vbExclamation);
            return SaveRefusal::Handled;
        default:
            return SaveRefusal::Show;
    }
}

bool frmContragentsDetails::pvExecute(int32_t CommandID) {
    if (CommandID != kCmdCopy) return false;
    pvCaptureCopy();
    // A new document that takes over the captured partner.
    m_oForm->Execute(kCmdNew);
    m_oCopy.reset();
    return true;
}

void frmContragentsDetails::Terminate() {
    if (m_oForm && m_oTreeListsExt)
        m_oForm->SaveSetting("TreeLists", pelta::Variant(m_oTreeListsExt->SelectedKey()));
    if (m_oSplitterTreeExt) m_oSplitterTreeExt->SetPosition(m_oSplitterTreeExt->Position());
    if (m_oTreeListsExt) m_oTreeListsExt->Events() = {};
    if (m_oTypeFieldExt) m_oTypeFieldExt->Events() = {};
    if (m_oNameFieldExt) m_oNameFieldExt->Events() = {};
    m_oTreeListsExt.reset();
    m_oSplitterTreeExt.reset();
    m_oTypeFieldExt.reset();
    m_oNameFieldExt.reset();
    m_rsDimChoice.reset();
    m_oCopy.reset();
    cDetailFrame::Terminate();
}

}  // namespace PeltaNom15
