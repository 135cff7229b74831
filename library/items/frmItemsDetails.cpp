#include "library/items/frmItemsDetails.h"

#include <set>
#include <tuple>

#include "library/contracts/Constants.h"
#include "library/frame/Declarations.h"
#include "library/frame/mdBllCall.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "library/items/frmItemsAttribs.h"
#include "library/items/mdLiveRows.h"
#include "platform/automation/error.h"
#include "platform/automation/guid.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

// The tree of lists and its grids (frmItemsDetailsLists.cpp), the barcode
// preview (frmItemsDetailsBarcode.cpp).
std::vector<ControlDecl> ItemListControls();
std::vector<ControlDecl> ItemBarcodeControls();

namespace {

constexpr const char* kObjectName = "frmItemsDetails";
constexpr const char* kLayoutKey = "{3C7B9E21-4D8A-4F16-A2E5-9B0D6C1F7E38}";
constexpr const char* kCodeHint =
    "Използвайте текстовото поле, за да модифицирате кода или го оставете празно за автоматична "
    "генерация на пореден уникален номер.";
constexpr const char* kNameHint = "Използвайте текстовото поле, за да модифицирате името.";
constexpr const char* kAttribGrid = "geAttribs";

DetailDefinition ItemsDetails() {
    DetailDefinition d;
    d.Caption = "Продукт/материал";
    d.ObjectName = kObjectName;
    d.HelpID = 2102;
    d.LayoutKey = kLayoutKey;
    d.ListName = "ctxItems";
    d.NeedList = "ctxItems|ctxPr";
    d.ReadOperation = "GetNomItemsDetails";
    d.UpdateOperation = "UpdNomItemsDetails";
    d.DeleteOperation = "DelNomItems";
    d.Controls = {
        Control("txtCode", ControlKind::Text, "Код:", "Code", "Общи"),
        Control("txtName", ControlKind::Text, "Име:", "Name", "Общи"),
        Control("cboItmType", ControlKind::Combo, "Тип:", "ItmType_ID", "Общи"),
        Control("cboMeasure", ControlKind::Combo, "Мярка:", "Measure_ID", "Общи"),
        Control("cboStore", ControlKind::Combo, "Склад:", "CgStore_ID", "Общи"),
        Control("cboGroup", ControlKind::Combo, "Група:", "DimValue_ID", "Общи"),
        Control("chkIsActive", ControlKind::CheckBox, "Активен", "IsActive", "Общи"),
        Control("chkIsAccQuo", ControlKind::CheckBox, "Счет. отчитане по количество", "IsAccQuo",
                "Общи"),
        Control("chkIsAccPr", ControlKind::CheckBox, "Счет. отчитане по признаци", "IsAccPr",
                "Общи"),
        Control("txtNote", ControlKind::Note, " Забележка", "Note", "Общи"),
        Control("rchNoteRtf", ControlKind::RichText, " Забележка", "NoteRtf", "Общи"),
    };
    for (ControlDecl& c : ItemListControls())
        d.Controls.push_back(std::move(c));
    for (ControlDecl& c : ItemBarcodeControls())
        d.Controls.push_back(std::move(c));
    d.AttribGrid = kAttribGrid;
    d.AttribGroups = kItemAttribGroups;
    for (const ItemAttribute& a : ItemAttributes())
        d.Attributes.push_back(a.Decl);
    return d;
}

std::string Trim(const std::string& Text) {
    const auto b = Text.find_first_not_of(" \t");
    if (b == std::string::npos) return {};
    return Text.substr(b, Text.find_last_not_of(" \t") - b + 1);
}

bool IsAudit(const std::string& Field) {
    return Field == "CU" || Field == "CD" || Field == "LU" || Field == "LD";
}

const ClassCreator s_oRegistered = RegisterFormClass(
    kObjectName, [] { return pelta::ObjectRef(pelta::makeRef<frmItemsDetails>()); });

}  // namespace

frmItemsDetails::frmItemsDetails() : cDetailFrame(ItemsDetails()) {}

const std::vector<std::string>& frmItemsDetails::SubLists() {
    static const std::vector<std::string> names = {
        "PriceList",        "SupplPrice",   "ItemsMeasures",    "ItemsParts",       "RatePrices",
        "ItemsDimensions",  "BarCodes",     "ItemsCodes",       "ItmMinQuo",        "ItemsShelves",
        "ItemsAttachments", "ItemsSimilar", "ItemsPermissions", "ItemMaterialBoms", "Boms",
        "BomsDetails",      "Activities",   "ItemsPrefSuppl",   "ItemsVariantDef"};
    return names;
}

bool frmItemsDetails::pvInitForm() {
    if (!pvCreateLists() || !pvCreateBarCodePreview()) return false;
    // The panes keep their sizes with the form's settings.
    for (const char* setting :
         {"SplitterAdditional", "SplitterAttrib", "SplitterLists", "SplitterBarCodes"}) {
        auto splitter = CreateSplitterExtender(this, setting, 0.5);
        if (!splitter) return false;
        m_oSplitters.push_back(splitter);
    }
    m_oAttribExt->Events().ButtonClick = [this](const std::string& Field) {
        try {
            pvPickAttribute(Field);
        } catch (...) {
            ShowError("m_oAttribExt_ButtonClick", kObjectName, m_oDef.Caption);
        }
    };
    m_oForm->AddCommand(117, "Нова рецепта...\tCtrl+Shift+N", "Рецепти");
    m_oForm->AddCommand(243, "Редакция...\tF2", "Рецепти");
    m_oForm->AddCommand(310, "Дублиране\tCtrl+D", "Рецепти");
    m_oForm->AddCommand(340, "Актуализация цени на рецепта", "Рецепти");
    m_oForm->AddCommand(323, "Актуализация цени на съставки на рецепта", "Рецепти");
    return true;
}

void frmItemsDetails::pvTakeResponse(pelta::PropertyBag& Response, bool Fetched) {
    for (const std::string& name : SubLists())
        m_oRows[name] = RecordsetProperty(&Response, name);
    m_oRows["ItemLotsSaldo"] = RecordsetProperty(&Response, "ItemLotsSaldo");
    static const char* const kReferences[] = {
        "ItemType",    "Measure",    "PriceListType", "Currency",  "Store",
        "Dimensions",  "DimValues",  "Shelves",       "Groups",    "Items",
        "StateActive", "CostCenter", "DutyTariffs",   "FinStruct", "Intrastat"};
    bool any = false;
    for (const char* name : kReferences)
        if (auto rs = RecordsetProperty(&Response, name)) {
            m_oRefs[name] = rs;
            any = true;
        }
    if (any) {
        auto list = [&](const std::string& control, const char* reference) {
            auto rs = Reference(reference);
            if (rs && rs->fieldIndex("ID") >= 0 && rs->fieldIndex("Name") >= 0)
                m_oForm->SetControlList(control, rs, "ID", {"Name"});
        };
        list("cboItmType", "ItemType");
        list("cboMeasure", "Measure");
        list("cboStore", "Store");
        list("cboGroup", "DimValues");
        for (const ItemAttribute& a : ItemAttributes()) {
            auto rs = *a.Reference ? Reference(a.Reference) : RecordsetRef();
            if (!rs || rs->fieldIndex("ID") < 0 || rs->fieldIndex("Name") < 0) continue;
            const bool tree =
                a.Decl.Editor == AttribEditor::TreeList && rs->fieldIndex("P_ID") >= 0;
            m_oAttribExt->SetList(a.Decl.Field, rs, "ID", "Name", tree ? "P_ID" : "");
        }
        pvSetLists();
    }
    if (Fetched) m_bFromCopy = false;
    m_bUploaded = false;
    // After a save the lists are the saved ones: the tree shows them again.
    if (!Fetched) pvBuildTree();
}

pelta::Variant frmItemsDetails::pvDefault(const char* Name, const char* Flag) {
    auto rs = Reference(Name);
    if (!rs || rs->recordCount() == 0 || rs->fieldIndex(Flag) < 0) return {};
    auto r = rs->clone();
    return r->find(std::string(Flag) + " = True") ? r->value("ID") : pelta::Variant();
}

void frmItemsDetails::pvNewRecord() {
    auto set = [&](const std::string& field, const pelta::Variant& v) {
        if (!v.isEmpty() && m_rsHead->fieldIndex(field) >= 0) m_rsHead->setValue(field, v);
    };
    // A new record carries a key of its own until the service keeps it.
    set("ID", pelta::Variant(pelta::newGuidString()));
    if (m_oCopy) {
        for (const auto& [field, value] : m_oCopy->Head)
            set(field, value);
        m_bFromCopy = true;
        set("BomCount", pelta::Variant(0));
        if (auto measures = Rows("ItemsMeasures"); measures && m_oCopy->Measures)
            ForLiveRows(m_oCopy->Measures, [&](pelta::Recordset& r) {
                measures->addNew();
                for (size_t i = 0; i < measures->fieldCount(); ++i) {
                    const std::string& field = measures->fieldDef(i).name;
                    if (field != "Itm_ID" && !IsAudit(field) && r.fieldIndex(field) >= 0)
                        measures->setValue(field, r.value(field));
                }
                measures->setValue("ID", pelta::Variant(pelta::newGuidString()));
                measures->update();
            });
        return;
    }
    for (const char* flag : {"IsVatAllowed", "IsAccPr", "IsAccQuo", "IsVat"})
        set(flag, pelta::Variant(true));
    for (const char* flag : {"IsRatePrice", "IsDma", "IsService"})
        set(flag, pelta::Variant(false));
    set("CgStore_ID", pvParameter("DefCgStore_ID"));
    const pelta::Variant type = pvDefault("ItemType");
    set("ItmType_ID", type);
    if (!type.isEmpty()) {
        auto t = Reference("ItemType")->clone();
        if (t->find("ID = '" + SqlQuote(C2Str(type)) + "'") && t->fieldIndex("IsService") >= 0)
            set("IsService", pelta::Variant(C2Bool(t->value("IsService"))));
    }
    set("Measure_ID", pvDefault("Measure"));
    set("Currency_ID", pvDefault("Currency"));
    set("Intrastat_ID", pvDefault("Intrastat", "IsDefault"));
    set("TaxGroup", pelta::Variant(2));
    set("Vat", pvParameter("Vat"));
    set("PriceScale", pvParameter("DefPriceScale"));
    set("VatPriceScale", pvParameter("DefVatPriceScale"));
    set("BasicMeasureScale", pelta::Variant(0));
    set("BomCount", pelta::Variant(0));
}

void frmItemsDetails::pvFillControls() {
    pvBuildTree();
}

std::string frmItemsDetails::pvAttribute(const char* Field) {
    return m_oAttribExt ? C2Str(m_oAttribExt->Value(Field)) : std::string();
}

bool frmItemsDetails::pvIsModified() {
    // A new record that was sent once and refused is the user's edits.
    if (m_sKey.empty() && (m_bFromCopy || m_bUploaded)) return true;
    for (const auto& [name, grid] : m_oGrids)
        if (grid->EditState()) return true;
    // Lists changed without a grid: bills of materials, rows of a copy.
    for (const std::string& name : SubLists()) {
        auto rows = Rows(name);
        if (!rows || rows->recordCount() == 0) continue;
        auto r = rows->clone();
        r->setFilter(pelta::FilterGroup::Pending);
        if (r->recordCount() > 0) return true;
    }
    return false;
}

// ---- the checks before a save, in their order -----------------------------------------

bool frmItemsDetails::pvCheckHead() {
    if (Trim(pvText("txtName")).empty()) {
        m_oForm->ShowMessage("txtName", "Невалидно име");
        return false;
    }
    if (pvText("cboItmType").empty()) {
        m_oForm->ShowMessage("cboItmType", "Невалиден тип на продукт");
        return false;
    }
    if (pvText("cboMeasure").empty()) {
        m_oForm->ShowMessage("cboMeasure", "Невалидна мярка");
        return false;
    }
    // The group, when the default item dimension requires a value.
    const std::string dimension = C2Str(pvParameter("DefItmDimension_ID"));
    if (auto dims = Reference("Dimensions"); !dimension.empty() && dims &&
                                             dims->recordCount() > 0 &&
                                             dims->fieldIndex("IsRequired") >= 0) {
        auto d = dims->clone();
        if (d->find("ID = '" + SqlQuote(dimension) + "'")) {
            const int32_t type = C2Lng(d->value("ValueType"));
            if ((type == 1 || type == 7) && C2Bool(d->value("IsRequired")) &&
                pvText("cboGroup").empty()) {
                m_oForm->ShowMessage("cboGroup", "Невалидна дименсия");
                return false;
            }
        }
    }
    // A second measure needs its ratio among the measure facets.
    for (const char* field : {"SecMeasure_ID", "SecMeasure2_ID"}) {
        const std::string measure = pvAttribute(field);
        if (measure.empty()) continue;
        bool found = false;
        ForLiveRows(Rows("ItemsMeasures"), [&](pelta::Recordset& r) {
            found = found || C2Str(r.value("Measure_ID")) == measure;
        });
        if (!found) {
            pvShowAttribMessage(field, "Моля въведете валидно отношение м/у мерките");
            return false;
        }
    }
    struct Scale {
        const char* Field;
        const char* Caption;
        int32_t High;
    };
    for (const Scale& s : {Scale{"BasicMeasureScale", "Прецизност в осн. мярка", 4},
                           Scale{"VatPriceScale", "Прецизност крайна цена с ДДС", 8},
                           Scale{"PriceScale", "Прецизност крайна цена с TO%", 8}}) {
        const pelta::Variant v = m_oAttribExt->Value(s.Field);
        if (v.isEmpty() || v.isNull() || (v.isString() && Trim(v.str()).empty())) continue;
        bool valid = true;
        try {
            const pelta::Decimal d = v.toDecimal();
            valid = d == d.round(0) && !(d < pelta::Decimal(0)) && !(pelta::Decimal(s.High) < d);
        } catch (const pelta::Error&) {
            valid = false;
        }
        if (!valid) {
            pvShowAttribMessage(s.Field, Printf("Стойността на полето '%1' трябва да е между 0 и "
                                                "%2.",
                                                std::string(s.Caption), s.High));
            return false;
        }
    }
    // Only leaves of the directions may be chosen.
    const std::string direction = pvAttribute("FinStruct_ID");
    if (auto fin = Reference("FinStruct"); !direction.empty() && fin && fin->recordCount() > 0) {
        auto f = fin->clone();
        if (f->find("P_ID = '" + SqlQuote(direction) + "'")) {
            pvShowAttribMessage("FinStruct_ID",
                                "Могат да се избират само крайни разклонения от списъка. "
                                "Междинните възли в структурата не са позволени за избор.",
                                "Невалидно направление",
                                "Използвайте падащия списък, за да изберете елемент без "
                                "наследници в йерархията с направления.");
            return false;
        }
    }
    return true;
}

bool frmItemsDetails::pvCheckLists() {
    for (const auto& [name, grid] : m_oGrids)
        if (!grid->ValidateRows()) return false;
    // No facet on the base measure itself.
    const std::string base = pvText("cboMeasure");
    bool onBase = false;
    ForLiveRows(Rows("ItemsMeasures"), [&](pelta::Recordset& r) {
        onBase = onBase || C2Str(r.value("Measure_ID")) == base;
    });
    if (onBase) {
        std::string code = base;
        if (auto m = Reference("Measure"); m && m->recordCount() > 0) {
            auto r = m->clone();
            if (r->find("ID = '" + SqlQuote(base) + "'")) code = C2Str(r->value("Code"));
        }
        m_oForm->ShowMessage(
            "geMeasures", Printf("За основната мярка '%1' не може да бъде дефиниран фасет.", code),
            "Невалиден фасет.");
        return false;
    }
    // One price per price-list type, supplier and measure.
    auto prices = Rows("PriceList");
    if (prices && prices->fieldIndex("Measure_ID") >= 0) {
        const char* type = "PriceList_ID";
        const bool hasSupplier = prices->fieldIndex("Cg_ID") >= 0;
        // A type holds a price per currency as well.
        const bool hasCurrency = prices->fieldIndex("Currency_ID") >= 0;
        std::set<std::tuple<std::string, std::string, std::string, std::string>> seen;
        bool twice = false;
        if (prices->fieldIndex(type) >= 0)
            ForLiveRows(prices, [&](pelta::Recordset& r) {
                twice = !seen.emplace(C2Str(r.value(type)),
                                      hasSupplier ? C2Str(r.value("Cg_ID")) : std::string(),
                                      C2Str(r.value("Measure_ID")),
                                      hasCurrency ? C2Str(r.value("Currency_ID")) : std::string())
                             .second ||
                        twice;
            });
        if (twice) {
            m_oForm->ShowMessage(
                {}, "Този тип ценова листа, доставчик и мярка вече са въведени в списъка.",
                "Дублиране на запис в ценови листи",
                "Използвайте селектора на доставчик или падащите списъци за избор на тип ценова "
                "листа или мярка, за да изберете различни стойности.");
            return false;
        }
    }
    return true;
}

bool frmItemsDetails::pvIsCorrect() {
    return pvCheckHead() && pvCheckLists();
}

void frmItemsDetails::pvUpload() {
    m_bUploaded = true;
    const std::string id = C2Str(m_rsHead->value("ID"));
    // The service flag follows the type.
    if (auto types = Reference("ItemType");
        types && types->recordCount() > 0 && m_rsHead->fieldIndex("IsService") >= 0) {
        auto t = types->clone();
        if (t->find("ID = '" + SqlQuote(pvText("cboItmType")) + "'") &&
            t->fieldIndex("IsService") >= 0 &&
            !SameValue(t->value("IsService"), m_rsHead->value("IsService")))
            m_rsHead->setValue("IsService", pelta::Variant(C2Bool(t->value("IsService"))));
    }
    // New rows of the sub-lists carry their own key and the item's.
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
            // A bill's rows name their component in Itm_ID, and the bills
            // that use the item are not the item's own rows.
            if (r->fieldIndex("Itm_ID") >= 0 && name != "BomsDetails" && name != "ItemMaterialBoms")
                r->setValue("Itm_ID", pelta::Variant(id));
            r->update();
        }
    }
}

void frmItemsDetails::pvWriteSaveRequest(pelta::PropertyBag& Request) {
    Request.writeProperty("ID", pelta::Variant(m_sKey));
    for (const std::string& name : SubLists())
        if (auto rs = Rows(name)) Request.writeProperty(name, pelta::Variant(pelta::ObjectRef(rs)));
}

frmItemsDetails::SaveRefusal frmItemsDetails::pvSaveRefused(pelta::PropertyBag& Response,
                                                            pelta::PropertyBag&, int32_t) {
    const int32_t code = C2Lng(Response.readProperty("BllError"));
    const std::string item = C2Str(Response.readProperty("BllItem"));
    switch (code) {
        case 10:
            if (!C2Str(Response.readProperty("BllBarCode_ID")).empty()) {
                const std::string row = C2Str(Response.readProperty("BllRowID"));
                if (!row.empty()) m_oGrids["geBarCodes"]->MoveToRow("ID='" + SqlQuote(row) + "'");
                m_oForm->ShowMessage(
                    "geBarCodes",
                    Printf("Вече съществува баркод на продукт '%1' с този код.", item),
                    "Дублиране на код", "Използвайте текстовото поле, за да модифицирате кода");
            } else {
                m_oForm->ShowMessage("txtCode",
                                     Printf("Вече съществува продукт '%1' с този код", item),
                                     "Дублиране на код", kCodeHint);
            }
            return SaveRefusal::Handled;
        case 11:
            m_oForm->ShowMessage("txtName", "Вече съществува продукт с това име.",
                                 "Дублиране на име", kNameHint);
            return SaveRefusal::Handled;
        case 8103:
            m_oForm->ShowMessage({}, Printf("Дублиране на код на признак от категория '%1'", item),
                                 "Дублиране на код", kCodeHint);
            return SaveRefusal::Handled;
        case 8104:
            m_oForm->ShowMessage({}, Printf("Дублиране на име на признак от категория '%1'", item),
                                 "Дублиране на име", kNameHint);
            return SaveRefusal::Handled;
        default:
            return SaveRefusal::Show;
    }
}

bool frmItemsDetails::pvExecute(int32_t CommandID) {
    if (CommandID == kCmdCopy) return pvCopy();
    if (CommandID == kCmdSaveBarCode) {
        pvSaveBarCode();
        return true;
    }
    return pvBomCommand(CommandID);
}

bool frmItemsDetails::pvCopy() {
    if (!m_rsHead || m_rsHead->recordCount() == 0) return true;
    // The item as the controls show it, without what makes it itself.
    CopySource copy;
    m_rsHead->moveFirst();
    for (size_t i = 0; i < m_rsHead->fieldCount(); ++i) {
        const std::string& field = m_rsHead->fieldDef(i).name;
        if (field == "ID" || field == "Code" || IsAudit(field) || field == "BomCount" ||
            field.rfind("Bar", 0) == 0 || field.rfind("Suppl", 0) == 0)
            continue;
        copy.Head.emplace_back(field, m_rsHead->value(i));
    }
    for (const auto& c : m_oDef.Controls)
        if (!c.Field.empty() && c.Field != "Code" && m_rsHead->fieldIndex(c.Field) >= 0)
            for (auto& [field, value] : copy.Head)
                if (field == c.Field) value = pvControlField(c.Name);
    if (auto measures = Rows("ItemsMeasures")) copy.Measures = measures->clone();
    m_oCopy = std::move(copy);
    m_oForm->Execute(kCmdNew);
    m_oCopy.reset();
    return true;
}

void frmItemsDetails::Terminate() {
    m_oCopy.reset();
    if (m_oTreeExt) m_oTreeExt->Events() = {};
    m_oTreeExt.reset();
    m_oSplitters.clear();
    m_oBound.clear();
    m_oDocs.clear();
    m_oBarCodeFields.clear();
    TerminateRefs(m_oItemsSelector, m_oPartnersSelector);
    cDetailFrame::Terminate();
}

}  // namespace PeltaNom15
