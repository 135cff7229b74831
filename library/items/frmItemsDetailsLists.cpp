// The item editor's tree of lists: each node shows one grid over one of the
// item's lists, filled when the node is first shown; document nodes open the
// list controls of the suite's other libraries filtered by the item.
#include <algorithm>
#include <string_view>

#include "library/contracts/Constants.h"
#include "library/frame/Declarations.h"
#include "library/frame/mdBllCall.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "library/items/frmItemsDetails.h"
#include "platform/automation/error.h"
#include "platform/automation/guid.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

namespace {

constexpr const char* kObjectName = "frmItemsDetails";
constexpr const char* kPriceListNode = "PriceList";
constexpr const char* kLotsNode = "Наличност по партиди и складове";
constexpr const char* kBomsNode = "Производство и придобиване";

// Groups are a name with their children between angle brackets, children
// separated by "|"; the first child of "Списъци" has no caption.
constexpr const char* kTreeDefinition =
    "Списъци<|Фасети на мерки|Мин/Макс количества|Съставни продукти|Нормативни цени|Баркодове|"
    "Вендор кодове/имена|Местонахождение по стелажи|Прикачени файлове|Свързани продукти|Права на "
    "групи|Дейности|Доставни цени|Предпочитани доставчици|Дефиниция на варианти|Материал в "
    "рецепти>Производство и придобиване<(Нова рецепта)>Контрол<Наличност по партиди и "
    "складове>Търговска система<Документи за продажба|Документи за покупка|Документи за "
    "заявка|Складови документи|Протоколи за инвентаризация|Гаранционни карти>Счетоводна "
    "система<Счетоводни документи>Организация<Договори|Планиране на производството>";

struct ListNode {
    const char* Key;
    const char* SubList;
    const char* Grid;
};

const ListNode kListNodes[] = {
    {kPriceListNode, "PriceList", "gePriceList"},
    {"Фасети на мерки", "ItemsMeasures", "geMeasures"},
    {"Мин/Макс количества", "ItmMinQuo", "geMinQuo"},
    {"Съставни продукти", "ItemsParts", "geParts"},
    {"Нормативни цени", "RatePrices", "geRatePrices"},
    {"Баркодове", "BarCodes", "geBarCodes"},
    {"Вендор кодове/имена", "ItemsCodes", "geItemsCodes"},
    {"Местонахождение по стелажи", "ItemsShelves", "geShelves"},
    {"Прикачени файлове", "ItemsAttachments", "geAttachments"},
    {"Свързани продукти", "ItemsSimilar", "geSimilar"},
    {"Права на групи", "ItemsPermissions", "gePermissions"},
    {"Дейности", "Activities", "geActivities"},
    {"Доставни цени", "SupplPrice", "geSupplPrice"},
    {"Предпочитани доставчици", "ItemsPrefSuppl", "gePrefSuppl"},
    {"Дефиниция на варианти", "ItemsVariantDef", "geVariantDef"},
    {"Материал в рецепти", "ItemMaterialBoms", "geMaterialBoms"},
    {kLotsNode, "ItemLotsSaldo", "geLotsSaldo"},
};

struct DocumentNode {
    const char* Key;
    const char* ProgID;
};

const DocumentNode kDocumentNodes[] = {
    {"Документи за продажба", "PeltaTrade15.ctxInvDocuments"},
    {"Документи за покупка", "PeltaTrade15.ctxSupDocuments"},
    {"Документи за заявка", "PeltaCrm15.ctxReqDocuments"},
    {"Складови документи", "PeltaTrade15.ctxStoDocuments"},
    {"Протоколи за инвентаризация", "PeltaTrade15.ctxStoRevDocuments"},
    {"Гаранционни карти", "PeltaTrade15.ctxWcaDocuments"},
    {"Счетоводни документи", "PeltaAcc15.ctxAccDocuments"},
    {"Договори", "PeltaCrm15.ctxConDocuments"},
    {"Планиране на производството", "PeltaCrm15.ctxMrpDocuments"},
};

const ListNode* FindListNode(const std::string& Key) {
    for (const ListNode& n : kListNodes)
        if (Key == n.Key) return &n;
    return nullptr;
}

ColumnDecl Edit(const char* Field, const char* Caption, EditorKind Editor) {
    return Column(Field, Caption, Editor);
}
ColumnDecl Shown(const char* Field, const char* Caption) {
    return Column(Field, Caption, EditorKind::None);
}
ColumnDecl Hidden(const char* Field) {
    return Column(Field, Field, EditorKind::None, false);
}

constexpr EditorKind kText = EditorKind::Text;
constexpr EditorKind kNumber = EditorKind::Number;
constexpr EditorKind kCombo = EditorKind::Combo;
constexpr EditorKind kCheck = EditorKind::CheckBox;
constexpr EditorKind kPick = EditorKind::Selector;

// The grids of the lists with their columns; every editable one carries the
// row's key and the item's hidden.
std::vector<cDetailFrame::GridDecl> ListGrids() {
    auto prices = [](bool Supplier) {
        return std::vector<ColumnDecl>{Edit("PriceList_ID", "Ценова листа", kCombo),
                                       Edit("Cg_ID", Supplier ? "Доставчик" : "", kPick),
                                       Edit("Measure_ID", "Мярка", kCombo),
                                       Edit("BasePrice", "Цена", kNumber),
                                       Edit("BasePriceWithVat", "Цена с ДДС", kNumber),
                                       Edit("Currency_ID", "Валута", kCombo),
                                       Edit("Rate", "Курс", kNumber),
                                       Edit("IsVat", "ДДС вкл. в цената", kCheck),
                                       Edit("Note", "Забележка", kText),
                                       Shown("IsAutoGener", "Автоматична генерация"),
                                       Hidden("ID"),
                                       Hidden("Itm_ID")};
    };
    return {
        {"gePriceList", 2110, prices(false)},
        {"geSupplPrice", 2124, prices(true)},
        {"geMeasures",
         2111,
         {Edit("RatioPerUnits", "Количество", kNumber), Edit("Measure_ID", "Мярка", kCombo),
          Edit("RatioCoeff", "Количество", kNumber), Shown("DefMeasure_ID", "Мярка"),
          Edit("Note", "Забележка", kText), Hidden("ID"), Hidden("Itm_ID")}},
        {"geMinQuo",
         2114,
         {Edit("CgStore_ID", "Склад", kCombo), Edit("MinQuantity", "Минимално кол.", kNumber),
          Edit("MaxQuantity", "Максимално кол.", kNumber), Hidden("ID"), Hidden("Itm_ID")}},
        {"geParts",
         2115,
         {Edit("SeqNo", "No.", kNumber), Edit("PartItm_ID", "Продукт/материал", kPick),
          Edit("Quantity", "Количество", kNumber), Edit("Measure_ID", "Мярка", kCombo),
          Shown("GroupName", "Група"), Hidden("ID"), Hidden("Itm_ID")}},
        {"geRatePrices",
         2116,
         {Edit("Cg_ID", "Доставчик", kPick), Edit("RatePrice", "Базова цена", kNumber),
          Hidden("ID"), Hidden("Itm_ID")}},
        {"geBarCodes",
         2112,
         {Edit("Code", "Баркод", kText), Edit("Measure_ID", "Мярка", kCombo),
          Edit("Note", "Забележка", kText), Edit("IsDef", "По подразбиране за мярката", kCheck),
          Edit("Type", "Тип", kCombo), Hidden("ID"), Hidden("Itm_ID")}},
        {"geItemsCodes",
         2113,
         {Edit("Cg_ID", "Контрагент", kPick), Edit("Code", "Код", kText),
          Edit("Name", "Име", kText), Edit("Measure_ID", "Мярка", kCombo), Hidden("ID"),
          Hidden("Itm_ID")}},
        {"geShelves",
         2117,
         {Edit("Shelf_ID", "Стелаж", kCombo), Edit("SeqNo", "Пореден номер", kNumber),
          Edit("Note", "Забележка", kText), Hidden("ID"), Hidden("Itm_ID")}},
        {"geAttachments",
         2118,
         {Edit("SeqNo", "No.", kNumber), Edit("MediaFileUrl", "Адрес на файл", kText),
          Shown("MediaFileName", "Файл"), Edit("Note", "Забележка", kText),
          Shown("FolderName", "Папка"), Edit("IsDef", "По подразбиране", kCheck), Hidden("ID"),
          Hidden("Itm_ID")}},
        {"geSimilar",
         2119,
         {Shown("ItemCode", "Код на продукт/материал"),
          Shown("ItemBarcode", "Баркод на продукт/материал"),
          Edit("LnkItm_ID", "Продукт/материал", kPick), Edit("LnkType", "Тип", kCombo),
          Edit("LnkWeight", "Релевантност", kNumber), Edit("Note", "Забележка", kText),
          Shown("DimValueName", "Група"), Shown("IsActive", "Активен"), Hidden("ItemCategories"),
          Hidden("ID"), Hidden("Itm_ID")}},
        {"gePermissions",
         2120,
         {Edit("Group_ID", "Група", kCombo), Shown("AllowPerm", "Права"), Hidden("DenyPerm"),
          Hidden("ID"), Hidden("Itm_ID")}},
        {"geActivities",
         2121,
         {Edit("RowNo", "No.", kNumber), Edit("Process", "Процес", kText),
          Edit("Activity_ID", "Дейност", kCombo), Edit("Description", "Описание", kText),
          Edit("PlanTime", "Планирано време", kNumber), Edit("Price", "Разценка", kNumber),
          Hidden("CcStruct_ID"), Hidden("ID"), Hidden("Itm_ID")}},
        {"gePrefSuppl",
         2122,
         {Edit("SeqNo", "No.", kNumber), Edit("Cg_ID", "Доставчик", kPick),
          Edit("MinQuantity", "Минимално кол.", kNumber), Edit("StepQuantity", "Стъпка", kNumber),
          Edit("Measure_ID", "Мярка", kCombo), Edit("Note", "Забележка", kText), Hidden("ID"),
          Hidden("Itm_ID")}},
        {"geVariantDef",
         2123,
         {Edit("SeqNo", "No.", kNumber), Edit("Dimension_ID", "Дименсия", kCombo),
          Edit("DimensionView", "Изглед", kCombo), Edit("Note", "Забележка", kText), Hidden("ID"),
          Hidden("Itm_ID")}},
        {"geMaterialBoms",
         2125,
         {Shown("BomItmName", "Съставен продукт"), Shown("BomName", "Рецепта"),
          Shown("RowNo", "No."), Shown("Measure_ID", "Мярка"), Shown("Quantity", "Количество"),
          Shown("Price", "Цена"), Shown("TotalSum", "Обща стойност"),
          Shown("PriceWithVat", "Цена с ДДС"), Shown("TotalWithVat", "Обща стойност с ДДС"),
          Shown("Note", "Забележка"), Hidden("BomItm_ID"), Hidden("ID")}},
        {"geBomsDetails",
         2126,
         {Edit("RowNo", "No.", kNumber), Edit("Itm_ID", "Продукт/материал", kPick),
          Shown("ItemCode", "Код"), Edit("Measure_ID", "Мярка", kCombo),
          Shown("UnitQuantity", "Кол. за 1-ца"), Shown("UnitSum", "Ст-ст за 1-ца"),
          Edit("Quantity", "Количество", kNumber), Edit("Price", "Цена", kNumber),
          Shown("TotalSum", "Обща стойност"), Shown("PriceWithVat", "Цена с ДДС"),
          Shown("TotalWithVat", "Обща стойност с ДДС"), Edit("Note", "Забележка", kText),
          Shown("SupplPriceLastDate", "Дата на последна доставна цена"), Hidden("ID"),
          Hidden("Bom_ID")}},
        {"geLotsSaldo",
         2127,
         {Shown("Lot", "Партида"), Shown("ExpiryDate", "Дата на годност"),
          Shown("DeliveryDate", "Дата на доставка"),
          Shown("OriginCountryName", "Страна на произход"), Shown("VendorLot", "Доставна партида"),
          Shown("CgStoreName", "Склад"), Shown("LotStoreSaldo", "Наличност по партида"),
          Shown("MeasureCode", "Мярка"), Shown("StoreSaldo", "Общо налично кол. в склад"),
          Shown("StoreReserved", "Обща запазени в склад"),
          Shown("StoreAvailable", "Общо разполагаемо кол. в склад"),
          Shown("PriceAvg", "Среднопрет. цена"),
          Shown("PriceAvgB_DifferentFromZero", "Предпоследна среднопрет. цена "),
          Shown("CurrencyCode", "Валута")}},
    };
}

}  // namespace

// Fixed lists of grid cells and combos: "value|text|value|text...".
RecordsetRef FixedRows(std::string_view Values) {
    auto rs = pelta::makeRef<pelta::Recordset>();
    rs->appendField("ID", pelta::FieldType::Long);
    rs->appendField("Name", pelta::FieldType::Text);
    rs->open();
    std::vector<std::string> parts;
    size_t start = 0;
    for (size_t bar; (bar = Values.find('|', start)) != std::string_view::npos; start = bar + 1)
        parts.emplace_back(Values.substr(start, bar - start));
    parts.emplace_back(Values.substr(start));
    for (size_t i = 0; i + 1 < parts.size(); i += 2) {
        rs->addNew();
        rs->setValue("ID", pelta::Variant(static_cast<int32_t>(std::stol(parts[i]))));
        rs->setValue("Name", pelta::Variant(parts[i + 1]));
        rs->update();
    }
    rs->updateBatch();
    return rs;
}

// Grid controls sit in the group of their node, so that a host shows the
// grid of the chosen node.
std::vector<ControlDecl> ItemListControls() {
    std::vector<ControlDecl> controls;
    controls.push_back(Control("trvLists", ControlKind::Tree, "Списъци", {}, "Списъци"));
    for (const ListNode& n : kListNodes)
        controls.push_back(Control(n.Grid, ControlKind::Grid, n.Key, {}, n.Key));
    controls.push_back(Control("geBomsDetails", ControlKind::Grid, kBomsNode, {}, kBomsNode));
    return controls;
}

bool frmItemsDetails::pvCreateLists() {
    const auto grids = ListGrids();
    if (!pvCreateGrids(grids)) return false;
    m_oTreeExt = CreateTreeExtender(this, "trvLists", 2102);
    if (!m_oTreeExt) return false;
    m_oTreeExt->Events().NodeActivate = [this](const std::string& Key) { pvNodeActivate(Key); };
    m_oTreeExt->Events().BeforeExecute = [this](int32_t CommandID, bool& Handled) {
        if (CommandID == kCmdDelete && !pvBomOfNode(m_sNode).empty()) {
            Handled = true;
            pvDeleteBom();
        }
    };
    m_oGrids["geBarCodes"]->SetColumnList(
        "Type", FixedRows("0|(Auto)|1|EAN-13|2|EAN-8|3|EAN-128|4|UPC-A|5|UPC-E|-1|Тегловен"), "ID",
        {"Name"});
    m_oGrids["geSimilar"]->SetColumnList(
        "LnkType", FixedRows("1|Подобен продукт|2|Продавани заедно"), "ID", {"Name"});
    m_oGrids["geVariantDef"]->SetColumnList(
        "DimensionView",
        FixedRows("1|Стойност на дименсия|2|Стойност на дименсия и цена|3|Изображение на "
                  "продукт|4|Изображение на продукт и цена|5|Изображение на стойност на "
                  "дименсия|6|Изображение на стойност на дименсия и цена|7|Падащ списък със "
                  "стойност на дименсия|8|Падащ списък със стойност на дименсия и цена"),
        "ID", {"Name"});
    for (const char* name : {"gePriceList", "geSupplPrice"}) {
        IGridExtender* prices = m_oGrids[name].get();
        prices->Events().AfterColUpdate = [this, prices](const std::string& Column) {
            try {
                pvPriceWithVat(*prices, Column);
            } catch (...) {
                ShowError("m_oGridPrices_AfterColUpdate", kObjectName, "Продукт/материал");
            }
        };
    }
    m_oGrids["gePriceList"]->Events().AfterUpdate = [this] {
        try {
            pvProposePrices();
        } catch (...) {
            ShowError("m_oGridPriceList_AfterUpdate", kObjectName, "Продукт/материал");
        }
    };
    // Generated rows are the service's proposals.
    m_oGrids["gePriceList"]->Events().RowFormat = [this](RowFormatArgs& Args) {
        auto rows = Rows("PriceList");
        if (!rows) return;
        auto r = rows->clone();
        r->setBookmark(Args.Bookmark);
        if (r->fieldIndex("IsAutoGener") >= 0 && C2Bool(r->value("IsAutoGener")))
            Args.RowStyle = "Inactive";
    };
    m_oGrids["geLotsSaldo"]->Events().RowFormat = [this](RowFormatArgs& Args) {
        auto rows = Rows("ItemLotsSaldo");
        if (!rows) return;
        auto r = rows->clone();
        r->setBookmark(Args.Bookmark);
        for (const char* f : {"PriceAvg", "PriceAvgB_DifferentFromZero"})
            if (r->fieldIndex(f) >= 0 && (r->value(f).isNull() || r->value(f).isEmpty()))
                Args.CellStyles.emplace_back(f, "PriceNA");
    };
    return true;
}

// The drop-downs of the grids' cells from the reference lists.
void frmItemsDetails::pvSetLists() {
    struct CellList {
        const char* Grid;
        const char* Column;
        const char* Reference;
    };
    static const CellList kLists[] = {
        {"gePriceList", "PriceList_ID", "PriceListType"},
        {"gePriceList", "Measure_ID", "Measure"},
        {"gePriceList", "Currency_ID", "Currency"},
        {"geSupplPrice", "PriceList_ID", "PriceListType"},
        {"geSupplPrice", "Measure_ID", "Measure"},
        {"geSupplPrice", "Currency_ID", "Currency"},
        {"geMeasures", "Measure_ID", "Measure"},
        {"geMinQuo", "CgStore_ID", "Store"},
        {"geParts", "Measure_ID", "Measure"},
        {"geBarCodes", "Measure_ID", "Measure"},
        {"geItemsCodes", "Measure_ID", "Measure"},
        {"geShelves", "Shelf_ID", "Shelves"},
        {"gePermissions", "Group_ID", "Groups"},
        {"gePrefSuppl", "Measure_ID", "Measure"},
        {"geVariantDef", "Dimension_ID", "Dimensions"},
        {"geBomsDetails", "Measure_ID", "Measure"},
    };
    for (const CellList& l : kLists) {
        auto rs = Reference(l.Reference);
        if (rs && rs->fieldIndex("ID") >= 0 && rs->fieldIndex("Name") >= 0)
            m_oGrids[l.Grid]->SetColumnList(l.Column, rs, "ID", {"Name"});
    }
}

void frmItemsDetails::pvBuildTree() {
    const std::string keep = m_sNode;
    m_oTreeExt->Clear();
    std::vector<std::string> parents;
    std::string text;
    bool inChildren = false;
    auto add = [&](const std::string& caption) {
        const std::string parent = parents.empty() ? std::string() : parents.back();
        std::string key = caption;
        std::string shown = caption;
        if (parent == "Списъци" && caption.empty()) {
            key = kPriceListNode;
            shown = "Ценови листи";
        }
        if (caption == "(Нова рецепта)") key = kNewBomNode;
        m_oTreeExt->AddNode(parent, key, shown);
    };
    for (const char ch : std::string_view(kTreeDefinition)) {
        if (ch == '<') {
            add(text);
            parents.push_back(text);
            text.clear();
            inChildren = true;
        } else if (ch == '|' || ch == '>') {
            if (inChildren) add(text);
            text.clear();
            if (ch == '>') {
                parents.pop_back();
                inChildren = !parents.empty();
            }
        } else {
            text += ch;
        }
    }
    pvBomNodes();
    // Grids show the lists of the last answer only.
    for (const auto& [grid, rows] : m_oBound)
        m_oGrids[grid]->Bind({});
    m_oBound.clear();
    m_sNode.clear();
    std::string chosen =
        keep.empty() ? C2Str(m_oForm->GetSetting("TreeLists", pelta::Variant(kPriceListNode)))
                     : keep;
    // The placeholder of a new bill asks for a name: never chosen by itself.
    if (chosen == kNewBomNode) chosen = kBomsNode;
    if (!m_oTreeExt->SelectNode(chosen)) m_oTreeExt->SelectNode(kPriceListNode);
}

void frmItemsDetails::pvNodeActivate(const std::string& Key) {
    try {
        m_sNode = Key;
        m_oForm->SaveSetting("TreeLists", pelta::Variant(Key));
        pvEnableBomCommands();
        pvEnableBarCodeCommand();
        if (Key == kNewBomNode) {
            pvNewBom();
            return;
        }
        if (const std::string bom = pvBomOfNode(Key); !bom.empty()) {
            m_sBom = bom;
            auto rows = Rows("BomsDetails");
            if (rows && rows->fieldIndex("Bom_ID") >= 0)
                m_oGrids["geBomsDetails"]->Bind(rows, "Bom_ID", pelta::Variant(bom));
            m_oBound["geBomsDetails"] = rows;
            return;
        }
        if (Key == kLotsNode) pvRefreshLots();
        if (const ListNode* node = FindListNode(Key)) {
            auto rows = Rows(node->SubList);
            if (rows && m_oBound[node->Grid] != rows) {
                m_oGrids[node->Grid]->Bind(rows);
                m_oBound[node->Grid] = rows;
            }
            // The preview shows the barcode of the row the grid stands on.
            if (std::string_view(node->Grid) == "geBarCodes") pvBarCodeRow();
            return;
        }
        pvOpenDocuments(Key);
    } catch (...) {
        ShowError("m_oTreeExt_NodeActivate", kObjectName, "Продукт/материал");
    }
}

// The lots are read anew each time their node is shown.
void frmItemsDetails::pvRefreshLots() {
    if (Key().empty()) return;
    auto request = CreatePropertyBag(m_oForm.get());
    request->writeProperty("Itm_ID", pelta::Variant(Key()));
    auto response =
        CallBll(m_oForm.get(), m_oConnection.get(), "GetNomItemsLotsSaldo", request.get());
    if (!response) return;
    if (auto lots = RecordsetProperty(response.get(), "ItemLotsSaldo"))
        m_oRows["ItemLotsSaldo"] = lots;
}

pelta::ObjectRef frmItemsDetails::DocumentList(const std::string& NodeKey) const {
    auto it = m_oDocs.find(NodeKey);
    return it == m_oDocs.end() ? pelta::ObjectRef() : it->second;
}

void frmItemsDetails::pvOpenDocuments(const std::string& NodeKey) {
    const DocumentNode* node = nullptr;
    for (const DocumentNode& d : kDocumentNodes)
        if (NodeKey == d.Key) node = &d;
    if (!node || Key().empty()) return;
    pelta::ObjectRef list = DocumentList(NodeKey);
    if (!list) {
        list = CreateFrameworkObject(node->ProgID);
        if (!list) {
            m_oForm->MsgBox(Printf("Невъзможно създаване на форма %1", std::string(node->ProgID)),
                            vbExclamation);
            return;
        }
        if (auto* control = pelta::query<IZonListControl>(list.get()))
            if (!control->InitClientSite(m_oSite.get())) return;
        m_oDocs[NodeKey] = list;
    }
    // Production planning is filtered by the chosen bill of materials.
    std::string filter = "Itm_ID='" + SqlQuote(Key()) + "'";
    if (std::string_view(node->ProgID) == "PeltaCrm15.ctxMrpDocuments") {
        std::string bom = m_sBom;
        if (auto boms = Rows("Boms"); bom.empty() && boms && boms->recordCount() > 0) {
            auto b = boms->clone();
            if (b->find("IsDefault = True") || (b->moveFirst(), !b->eof()))
                bom = C2Str(b->value("ID"));
        }
        filter = "Bom_ID='" + SqlQuote(bom) + "'";
    }
    pelta::Variant args[] = {pelta::Variant(filter)};
    list->invoke("InitFilter", pelta::CallKind::Method, args);
}

}  // namespace PeltaNom15

namespace PeltaNom15 {

// The button of a selector attribute. Items and partners are chosen in their
// lists (pvPickRecord); a cost centre by a code or a name typed by the
// person, looked up among the cost centres of the attribute's kind, empty
// text clearing the attribute.
void frmItemsDetails::pvPickAttribute(const std::string& Field) {
    if (pvPickRecord(Field)) return;
    struct Kind {
        const char* Field;
        int32_t Type;
    };
    static const Kind kKinds[] = {{"CcStruct_ID", 0}, {"CcProject_ID", 1}, {"CcOther_ID", 2}};
    const Kind* kind = nullptr;
    for (const Kind& k : kKinds)
        if (Field == k.Field) kind = &k;
    if (!kind) return;
    const std::string caption = pvAttributeCaption(Field);
    pelta::Variant typed(m_oAttribExt->ShownText(Field));
    if (!m_oForm->InputBox("Код или име:", caption, typed)) return;
    const std::string text = C2Str(typed);
    if (text.find_first_not_of(' ') == std::string::npos) {
        m_oAttribExt->UserSetValue(Field, pelta::Variant::null());
        m_oAttribExt->SetShownText(Field, {});
        return;
    }
    auto centres = Reference("CostCenter");
    if (!centres || centres->recordCount() == 0) return;
    auto c = centres->clone();
    const std::string quoted = SqlQuote(text);
    const std::string type = "Type = " + std::to_string(kind->Type);
    c->setFilter("(" + type + " AND Code = '" + quoted + "') OR (" + type + " AND Name = '" +
                 quoted + "')");
    if (c->recordCount() == 0) {
        m_oForm->MsgBox(Printf("Не е намерен център на себестойност '%1'.", text), vbExclamation,
                        caption);
        return;
    }
    c->moveFirst();
    if (m_oAttribExt->UserSetValue(Field, c->value("ID")))
        m_oAttribExt->SetShownText(Field, C2Str(c->value("Name")));
}

// The price with VAT follows the price (and the price the price with VAT) by
// the item's VAT rate, to the item's decimals of prices with VAT.
void frmItemsDetails::pvPriceWithVat(IGridExtender& Grid, const std::string& Column) {
    if (Column != "BasePrice" && Column != "IsVat" && Column != "BasePriceWithVat") return;
    pelta::Decimal vat;
    try {
        const pelta::Variant v = m_rsHead->value("Vat");
        if (!v.isNull() && !v.isEmpty()) vat = v.toDecimal();
    } catch (const pelta::Error&) {
        return;
    }
    const pelta::Decimal factor = pelta::Decimal(1) + vat / pelta::Decimal(100);
    pelta::Variant scale = m_rsHead->fieldIndex("VatPriceScale") >= 0
                               ? m_rsHead->value("VatPriceScale")
                               : pelta::Variant();
    if (scale.isNull() || scale.isEmpty()) scale = pvParameter("DefVatPriceScale");
    const int32_t decimals =
        scale.isNull() || scale.isEmpty() ? 2 : std::clamp<int32_t>(C2Lng(scale), 0, 8);
    const bool fromPrice = Column != "BasePriceWithVat";
    const pelta::Variant given = Grid.CurrentValue(fromPrice ? "BasePrice" : "BasePriceWithVat");
    if (given.isNull() || given.isEmpty()) return;
    const pelta::Decimal value = given.toDecimal();
    if (fromPrice)
        Grid.SetCurrentValue("BasePriceWithVat", pelta::Variant((value * factor).round(decimals)));
    else if (!factor.isZero())
        Grid.SetCurrentValue("BasePrice", pelta::Variant((value / factor).round(8)));
}

// A price of a type that generated price lists are formed on: the service
// proposes their rows, which replace the generated rows of the same type and
// measure (or are added).
void frmItemsDetails::pvProposePrices() {
    auto* grid = m_oGrids["gePriceList"].get();
    auto prices = Rows("PriceList");
    if (!grid->HasCurrentRow() || !prices || C2Bool(grid->CurrentValue("IsAutoGener"))) return;
    const std::string type = C2Str(grid->CurrentValue("PriceList_ID"));
    const pelta::Variant price = grid->CurrentValue("BasePrice");
    if (type.empty() || price.isNull() || price.isEmpty()) return;
    auto request = CreatePropertyBag(m_oForm.get());
    request->writeProperty("PriceListType", pelta::Variant(type));
    request->writeProperty("Price", price);
    request->writeProperty("Itm_ID", m_rsHead->value("ID"));
    request->writeProperty("Measure", grid->CurrentValue("Measure_ID"));
    request->writeProperty("VAT", pelta::Variant(C2Bool(grid->CurrentValue("IsVat"))));
    if (auto dims = Rows("ItemsDimensions"))
        request->writeProperty("ItemsDimensions", pelta::Variant(pelta::ObjectRef(dims)));
    auto response =
        CallBll(m_oForm.get(), m_oConnection.get(), "GetNomItemPlProposal", request.get());
    if (!response) return;
    auto proposed = RecordsetProperty(response.get(), "List");
    if (!proposed || proposed->recordCount() == 0) return;
    for (proposed->moveFirst(); !proposed->eof(); proposed->moveNext()) {
        const std::string generated = C2Str(proposed->value("PriceList_ID"));
        auto row = prices->clone();
        row->setFilter("PriceList_ID = '" + SqlQuote(generated) + "' AND IsAutoGener = True");
        const std::string measure = C2Str(proposed->value("Measure_ID"));
        if (row->recordCount() > 0) row->moveFirst();
        while (!row->eof() && (row->status() == pelta::RowStatus::Deleted ||
                               C2Str(row->value("Measure_ID")) != measure))
            row->moveNext();
        if (row->eof()) {
            row->clearFilter();
            row->addNew();
            row->setValue("ID", pelta::Variant(pelta::newGuidString()));
        }
        for (size_t i = 0; i < proposed->fieldCount(); ++i) {
            const std::string& field = proposed->fieldDef(i).name;
            if (field != "ID" && row->fieldIndex(field) >= 0)
                row->setValue(field, proposed->value(i));
        }
        row->update();
    }
    grid->Refresh();
}

std::string frmItemsDetails::pvAttributeCaption(const std::string& Field) const {
    for (const AttribDecl& a : m_oDef.Attributes)
        if (a.Field == Field) return a.Caption;
    return {};
}

// The item and partner attributes are chosen in the items' and the partners'
// lists, shown as selectors; each selector is made when first needed and
// kept while the form lives. The first chosen row is taken.
bool frmItemsDetails::pvPickRecord(const std::string& Field) {
    static constexpr std::string_view kItemFields[] = {"SecItm_ID", "AccItm_ID",
                                                       "VariantParentItm_ID"};
    static constexpr std::string_view kPartnerFields[] = {"ProducerCg_ID", "ImporterCg_ID"};
    const bool item =
        std::find(std::begin(kItemFields), std::end(kItemFields), Field) != std::end(kItemFields);
    const bool partner = std::find(std::begin(kPartnerFields), std::end(kPartnerFields), Field) !=
                         std::end(kPartnerFields);
    if (!item && !partner) return false;
    pelta::ObjectRef& selector = item ? m_oItemsSelector : m_oPartnersSelector;
    if (!selector) {
        pelta::ObjectRef made = item ? CreateItemsSelector(this) : CreateContragentsSelector(this);
        auto* list = pelta::query<IZonListControl>(made.get());
        if (!list || !pelta::query<IZonSelector>(made.get())) {
            m_oForm->MsgBox(Printf("Невъзможно създаване на форма %1",
                                   std::string(item ? "ctxItems" : "ctxContragents")),
                            vbExclamation);
            return true;
        }
        if (!list->InitClientSite(m_oSite.get())) return true;
        selector = made;
    }
    pelta::Variant result;
    if (!ShowSelector(selector.get(), pvAttributeCaption(Field), result)) return true;
    pelta::Variant id, name, row;
    if (!pelta::query<IZonSelector>(selector.get())->GetNextItem(id, name, row)) return true;
    if (m_oAttribExt->UserSetValue(Field, id)) m_oAttribExt->SetShownText(Field, C2Str(name));
    return true;
}

}  // namespace PeltaNom15
