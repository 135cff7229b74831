#include "library/items/ctxItems.h"

#include <algorithm>

#include "library/contracts/Constants.h"
#include "library/frame/Declarations.h"
#include "library/frame/mdBllCall.h"
#include "library/frame/mdBllErrors.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "library/items/ctxItemsQuickFind.h"
#include "platform/automation/error.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

namespace {

constexpr const char* kObject = "ctxItems";
constexpr const char* kCaption = "Продукти и материали";
constexpr const char* kAskDeleteInactive =
    "Желаете ли да изтриете избраните неактивни номенклатури?";
constexpr const char* kNoRights = "Недостатъчни права за извършване на операция";
constexpr const char* kCannotCreateForm = "Невъзможно създаване на форма %1";
constexpr const char* kQuickFindHint =
    "(префикс '/' за код, '//' за баркод, '///' за код на доставчик)";
constexpr const char* kNullGuid = "{00000000-0000-0000-0000-000000000000}";
constexpr const char* kDmaDetails = "PeltaDma15.frmDmaDetails";

constexpr const char* kPriceFormat = "#,##0.00######";
constexpr const char* kQuantityFormat = "#,##0.000#####";
constexpr const char* kCountFormat = "General Number";

// Commands and filters of the list.
enum : int32_t {
    kCmdNewDma = 119,
    kCmdOpenDma = 125,
    kCmdSimilar = 319,
    kCmdItemCard = 323,
    kCmdImport = 329,
    kCmdReserved = 334,
    kCmdSupplier = 342,
    kCmdBomPrices = 352,
    kCmdCostCenters = 363,
    kCmdOtherAssets = 701,
    kCmdRefreshStock = 895,
    kFltQuickFind = 802,
    kFltStore = 807,
    kFltType = 808,
    kFltCategory = 809,
    kFltPriceListType = 810,
    kFltCurrency = 812,
    kFltMeasure = 813,
    kFltDiscount = 819,
    kFltFrame1 = 898,
    kFltFrame2 = 899,
};

std::vector<ColumnDecl> ItemColumns() {
    return {
        Computed("Icon", "Икона"),
        Computed("MediaThumbPreview", "Миниатюра"),
        Bound("Code", "Код"),
        Bound("Name", "Име"),
        Computed("StoreAvailable", "Разполагаемо кол.", true, kQuantityFormat),
        Computed("StoreSaldo", "Наличност на склад осн. мярка", true, kQuantityFormat),
        Bound("DefMeasureCode", "Осн. мярка"),
        Computed("StoreSaldoSecMeasure", "Наличност на склад доп. мярка", true, kQuantityFormat),
        Bound("SecMeasureCode", "Доп. мярка"),
        Computed("StoreReserved", "Запазени кол.", true, kQuantityFormat),
        Bound("StoreAvgPrice", "Среднопрет. цена", true, kPriceFormat),
        Bound("BasePrice", "Цена", true, kPriceFormat),
        Bound("BasePriceWithVat", "Цена с ДДС", true, kPriceFormat),
        Bound("MeasureCode", "Мярка"),
        Bound("CurrencyCode", "Валута"),
        Bound("Rate", "Курс", true, kPriceFormat),
        Computed("AdditionalPrices", "Доп. цени с ДДС"),
        Bound("DimValueName", "Група"),
        Bound("AltValueName", "Алт. дименсия"),
        Bound("IsVat", "ДДС вкл. в цената"),
        Computed("IsPromo", "Промоционална цена"),
        Computed("PromoPlType_ID", "Промоционална ц. листа"),
        Bound("IsVatAllowed", "Разрешено вкл. ДДС в цената"),
        Bound("Discount", "ТО%", true, kPriceFormat),
        Computed("PriceWithDiscount", "Крайна цена с ТО", true, kPriceFormat),
        Computed("PriceWithVatDiscount", "Крайна цена с ТО и ДДС", true, kPriceFormat),
        Bound("CgStoreName", "Склад по подразбиране"),
        Bound("IsRatePrice", "Отч. по норм. цена"),
        Bound("RatePrice", "Норм. цена", true, kPriceFormat),
        Bound("FltCategories", "Филтрирани дименсии"),
        Computed("MinStoreSaldo", "Мин. наличност на склад", true, kQuantityFormat),
        Bound("ItemTypeName", "Тип"),
        Bound("SecItmName", "Трансформ. при фактуриране"),
        Computed("BarCodes", "Баркодове"),
        Computed("SupplCodes", "Вендор кодове"),
        Bound("MinOrderQuo", "Минимално кол. за заявка", true, kQuantityFormat),
        Bound("WeightBruto", "Бруто тегло", true, kQuantityFormat),
        Bound("WeightNeto", "Нето тегло", true, kQuantityFormat),
        Bound("Vat", "ДДС ставка"),
        Bound("VatPriceScale", "Прецизност цена с ДДС"),
        Bound("Excise", "Акциз за осн. мярка", true, kPriceFormat),
        Bound("DutyTariffPrc", "Мито ставка"),
        Bound("DutyTariffCode", "Митнически код"),
        Bound("Priority", "Приоритет"),
        Bound("Intrastat", "Интрастат код"),
        Bound("WarrantyPeriodText", "Гаранционен срок"),
        Bound("LifePeriodText", "Срок на годност"),
        Bound("ProducerCgName", "Производител"),
        Bound("ImporterCgName", "Вносител"),
        Bound("OperatingDetails", "Експлоатационна информация"),
        Bound("IsDma", "Свързан ДА"),
        Bound("IsAccPr", "Счет. отчитане по признаци"),
        Bound("IsAccQuo", "Счет. отчитане по количество"),
        Bound("NumAttachments", "Брой прикачени файлове", true, kCountFormat),
        Bound("MediaFileCode", ""),
        Bound("Permit", "Разрешително"),
        Bound("Concentration", "Концентрация"),
        Bound("MarginalPriceVat", "Пределна цена с ДДС", true, kPriceFormat),
        Bound("PriceGroup", "Ценова група"),
        Bound("Shelves", "Стелажи"),
        Bound("Name2", "Доп. име"),
        Bound("VariantParentItmName", "Основен вариант"),
        Bound("BomCount", "Брой рецепти", true, kCountFormat),
        Bound("IsActive", "Активен"),
        Bound("Note", "Забележка"),
        Bound("StructureName", ""),
        Bound("ProjectName", "Обект/проект"),
        Bound("OtherName", "Друг център на себестойност"),
        Bound("FinStructName", "Направление"),
        Bound("CU", "CU", false),
        Bound("CD", "CD", false),
        Bound("LU", "LU", false),
        Bound("LD", "LD", false),
        Bound("ID", "ID", false),
        Computed("Measure_ID", "Measure_ID", false),
        Computed("Currency_ID", "Currency_ID", false),
        Bound("NoteRtf", "NoteRtf", false),
        Bound("MediaThumbData", "MediaThumbData", false),
    };
}

ListDefinition ItemsList() {
    ListDefinition d;
    d.Caption = kCaption;
    d.ObjectName = kObject;
    d.FormHelpID = 2001;
    d.GridHelpID = 2003;
    d.GridLayoutKey = "{3C1A7F52-9B64-4E0D-8A21-5F6E2D9C4B10}";
    d.DetailLayoutKey = "{8E2B4D61-0C7A-4F39-B5D8-1A9E6C3F7D22}";
    d.ReadOperation = "GetNomItems";
    d.DeleteOperation = "DelNomItems";
    d.DetailFormClass = "frmItemsDetails";
    d.RemovedCommands = {502, 202, 204, 304, 103, 201};
    d.Commands = {
        {kCmdNew, "Нов продукт...\tCtrl+N", "Нов продукт (Ctrl+N)"},
        {kCmdOpen, "Редакция продукт...\tCtrl+O", "Редакция на продукт (Ctrl+O)"},
        {kCmdDeleteInactive, {}, "Изтриване на неактивен продукт (Del)"},
    };
    d.Columns = ItemColumns();
    return d;
}

// A price-list type, currency ... as given to InitFilter: taken when it is
// not the null GUID and differs from the one in use.
bool TakeFilter(const std::string& Given, std::string& InUse) {
    if (Given == kNullGuid || Given == InUse) return false;
    InUse = Given;
    return true;
}

std::string Joined(const std::vector<std::string>& Parts, const std::string& Separator) {
    std::string out;
    for (const auto& p : Parts)
        out += (out.empty() ? "" : Separator) + p;
    return out;
}

}  // namespace

ctxItems::ctxItems()
    : cListFrame(ItemsList()),
      m_oQuickFind(std::make_unique<cItemsQuickFind>()),
      m_oBag(pelta::makeRef<pelta::PropertyBag>()) {}

ctxItems::~ctxItems() = default;

const cQuickFindState& ctxItems::QuickFindState() const noexcept {
    return m_oQuickFindState;
}

// ---- initialisation ---------------------------------------------------------------------

bool ctxItems::InitClientSite(IClientSite* Site) {
    if (!m_oForm) return cListFrame::InitClientSite(Site);
    try {
        pvReinit(Site);
        return true;
    } catch (...) {
        PrintError("IZonListControl_InitClientSite", kObject);
        return false;
    }
}

void ctxItems::pvInitList() {
    m_oCacheDef = CreateCacheDefExtender(this, m_oDef.ReadOperation);
    if (!m_oCacheDef)
        pelta::raise(pelta::errc::ObjectRequired, "The cache definition cannot be created",
                     "ctxItems.pvInitList");
    pvInitCache();
    m_oPricing = std::make_unique<cItemsPricing>(m_oCacheDef.get(), m_oSel);

    // The preview pane, its subtitle and the list's information note.
    ControlDecl note;
    note.Name = "nvPreview";
    note.Kind = ControlKind::RichText;
    note.ReadOnly = true;
    ControlDecl subtitle;
    subtitle.Name = "lblPreviewSubtitle";
    subtitle.Kind = ControlKind::Label;
    ControlDecl info;
    info.Name = "lblInfo";
    info.Kind = ControlKind::Label;
    m_oForm->DeclareControls({note, subtitle, info});
    m_oNoteExt = CreateFieldExtender(m_oForm.get(), "nvPreview");
    if (m_oNoteExt)
        m_oNoteExt->Events().BeforeNavigate = [this](const std::string& Url, bool& Cancel) {
            m_oNoteExt_BeforeNavigate(Url, Cancel);
        };
    m_oSplitterExt = CreateSplitterExtender(this, "SplitterPos", 0.6);
    m_lPreviewTab = 0;
    (void)m_oForm->GetSetting("PreviewPane", pelta::Variant(true));

    // Menu: the list's commands and the band of the other assets.
    m_oForm->AddCommand(kCmdOtherAssets, "Други средства", "Други средства");
    m_oForm->AddCommand(kCmdNewDma, "", "Други средства");
    m_oForm->AddCommand(kCmdOpenDma, "", "Други средства");
    m_oForm->AddCommand(kCmdSimilar, "Свързани продукти...", "tools");
    m_oForm->SetCommandTooltip(kCmdSimilar, "Настройка свързани продукти");
    m_oForm->AddCommand(kCmdItemCard, "Картон на продукт/материал", "tools");
    m_oForm->AddCommand(kCmdBomPrices, "Актуализация цени на рецепти", "tools");
    m_oForm->AddCommand(kCmdCostCenters, "Генериране центрове на себестойност тип Обект/Проект",
                        "tools");
    m_oForm->AddCommand(kCmdRefreshStock, "Актуализация количества от склада", "grid");
    m_oForm->EnableCommand(kCmdBomPrices, false);

    pvInitFilters();

    auto& g = m_oGridExt->Events();
    g.FetchData = [this](const pelta::Variant& Bookmark, const std::string& Column,
                         pelta::Variant& Value) {
        try {
            m_oGridExt_FetchData(Bookmark, Column, Value);
        } catch (...) {
            Value = pelta::Variant();
            PrintError("m_oGridExt_FetchData", kObject);
        }
    };
    g.RowFormat = [this](RowFormatArgs& Args) {
        try {
            m_oGridExt_RowFormat(Args);
        } catch (...) {
            PrintError("m_oGridExt_RowFormat", kObject);
        }
    };
    g.ScannerReceive = [this](const std::string& Code) {
        try {
            m_oGridExt_ScannerReceive(Code);
        } catch (...) {
            ShowError("m_oGridExt_ScannerReceive", kObject, kCaption);
        }
    };
    g.SelectionChange = [this] { pvUpdateCommands(); };
    g.RowColChange = [this](const pelta::Variant&, const std::string&) {
        try {
            pvUpdateCommands();
            m_oForm->SetControlValue("nvPreview", pelta::Variant(PreviewText()));
            m_oForm->SetControlValue("lblPreviewSubtitle", pelta::Variant(PreviewSubtitle()));
        } catch (...) {
            PrintError("m_oGridExt_RowColChange", kObject);
        }
    };
}

void ctxItems::pvInitCache() {
    struct Decl {
        const char* name;
        int32_t slot;
        std::vector<std::string> keys;
        bool derived;
    };
    const Decl sets[] = {
        {itemsets::List, 2, {"ID"}, false},
        {itemsets::MeasureRatios, 4, {"ID"}, false},
        {itemsets::PriceList, 5, {"Itm_ID", "Currency_ID", "Measure_ID"}, false},
        {itemsets::ItemsCurrencyMeasure, 6, {}, true},
        {itemsets::PriceListBmks, 7, {}, true},
        {itemsets::PriceAdditional, 8, {}, true},
        {itemsets::MeasureRatiosBmks, 9, {}, true},
        {itemsets::ItemsPrices, 10, {}, true},
        {itemsets::StoreSaldo, 11, {"Itm_ID"}, false},
        {itemsets::StoreSaldoBmks, 12, {}, true},
        {itemsets::DiscountItems, 13, {"Itm_ID"}, false},
        {itemsets::Discounts, 14, {}, true},
        {itemsets::CurrencyRatios, 15, {}, false},
        {"Type", 18, {}, false},
        {"DimValues", 19, {}, false},
        {"PriceListType", 20, {}, false},
        {"Currencies", 21, {}, false},
        {"Measures", 22, {}, false},
        {"Store", 1, {}, false},
        {"DiscountSchema", 23, {}, false},
        {"Dimensions", 28, {}, false},
        {"CustomFormats", 30, {}, false},
    };
    for (const auto& s : sets)
        m_oCacheDef->AddSet(s.name, s.slot, s.keys, s.derived);
}

void ctxItems::pvInitFilters() {
    m_oQuickFilterExt = CreateQuickFilterExtender(this, m_oGridExt.get(), kQuickFindHint);
    if (m_oQuickFilterExt) {
        m_oQuickFilterExt->AddField(kFltQuickFind, "Търсене",
                                    {"Name", "Code", "BarCodes", "SupplCodes", "Name2"});
        m_oQuickFilterExt->AddField(kFltType, "Тип", {"ItmType_ID"});
        m_oQuickFilterExt->AddField(kFltCategory, "Група", {"Categories"});
        m_oQuickFilterExt->AddField(kFltFrame1, "", {"Note"});
        m_oQuickFilterExt->AddField(kFltFrame2, "", {"Name2"});
        m_oQuickFilterExt->Events().FilterClause = [this](int32_t FilterID, const std::string& Text,
                                                          std::string& Clause, bool& Handled) {
            m_oQuickFilterExt_FilterClause(FilterID, Text, Clause, Handled);
        };
    }
    m_oPricesExt = CreateFilterBandExtender(this, "Цени");
    m_oStoreExt = CreateFilterBandExtender(this, "Наличност");
    m_oDiscountsExt = CreateFilterBandExtender(this, "Отстъпки");
    for (auto* band : {m_oPricesExt.get(), m_oStoreExt.get(), m_oDiscountsExt.get()}) {
        if (!band) continue;
        band->Events().Change = [this](int32_t FilterID, const pelta::Variant& Value) {
            try {
                m_oBand_Change(FilterID, Value);
            } catch (...) {
                ShowError("m_oBand_Change", kObject, kCaption);
            }
        };
        band->Events().Click = [this](int32_t FilterID) {
            try {
                m_oBand_Click(FilterID);
            } catch (...) {
                ShowError("m_oBand_Click", kObject, kCaption);
            }
        };
    }
    pvFillFilterLists();
    if (m_oPricesExt) m_oPricesExt->AddButton(kCmdSupplier, "");
    if (m_oStoreExt) m_oStoreExt->AddButton(kCmdRefreshStock, "");
}

// The lists of the filters, from the reference sets of the last fetch.
void ctxItems::pvFillFilterLists() {
    auto set = [this](const char* name) {
        return pelta::Ref<pelta::Recordset>(
            pelta::query<pelta::Recordset>(m_oCacheDef->Item(name).object()));
    };
    if (m_oPricesExt) {
        RecordsetRef active;
        if (auto types = set("PriceListType")) {
            active = types->clone();
            active->setFilter("IsActive = True");
        }
        m_oPricesExt->AddList(kFltPriceListType, "Ценова листа", active, "ID", "Name",
                              "(Подразбиране)");
        m_oPricesExt->AddList(kFltCurrency, "Валута", set("Currencies"), "ID", "Code", "");
        m_oPricesExt->AddList(kFltMeasure, "Мярка", set("Measures"), "ID", "Code", "");
    }
    if (m_oStoreExt)
        m_oStoreExt->AddList(kFltStore, "Склад", set("Store"), "ID", "Name", "(Всички)");
    if (m_oDiscountsExt)
        m_oDiscountsExt->AddList(kFltDiscount, "Отстъпки", set("DiscountSchema"), "ID", "Name",
                                 "(Няма)");
    if (m_oQuickFilterExt) {
        m_oQuickFilterExt->SetFieldList(kFltType, set("Type"), "ID", "Name", "(Всички)");
        m_oQuickFilterExt->SetFieldList(kFltCategory, set("DimValues"), "ID", "FullName", "");
    }
}

void ctxItems::pvReinit(IClientSite* Site) {
    if (Site) m_oSite = Site;
    auto param = [&](const char* name) {
        return m_oSite ? m_oSite->Parameter(name) : pelta::Variant();
    };
    const pelta::Variant multi = param("MultiSelect");
    if (!multi.isEmpty()) m_oGridExt->SetMultiSelect(C2Bool(multi));
    const std::string text = C2Str(param("QuickFindText"));
    if (m_oQuickFilterExt && !text.empty() && !IsGuid(text))
        m_oQuickFilterExt->SetText(kFltQuickFind, text);
    if (m_bMediaChanged) {
        // The extra dimension columns follow the pairs given.
        m_vDimColumns.clear();
        if (!m_sMediaType.empty()) m_vDimColumns.push_back("DimMedia");
        if (!m_sDimension.empty()) m_vDimColumns.push_back("Dimensions");
        m_bMediaChanged = false;
    }
    m_oForm->Refresh();
    if (m_oQuickFilterExt && !text.empty() && !IsGuid(text)) m_oQuickFilterExt->Apply();
    const std::string current = C2Str(param("CurrentValue"));
    if (IsGuid(current)) m_oGridExt->MoveToRow("ID = '" + SqlQuote(current) + "'");
}

void ctxItems::QueryTerminate(bool& Cancel) {
    try {
        if (m_oForm) m_oForm->SaveSetting("PreviewPane", pelta::Variant(m_lPreviewTab >= 0));
    } catch (...) {
        PrintError("IZonTerminate_QueryTerminate", kObject);
    }
    cListFrame::QueryTerminate(Cancel);
}

void ctxItems::Terminate() {
    for (auto* band : {m_oPricesExt.get(), m_oStoreExt.get(), m_oDiscountsExt.get()})
        if (band) band->Events() = {};
    if (m_oQuickFilterExt) m_oQuickFilterExt->Events() = {};
    if (m_oNoteExt) m_oNoteExt->Events() = {};
    m_oPricesExt.reset();
    m_oStoreExt.reset();
    m_oDiscountsExt.reset();
    m_oQuickFilterExt.reset();
    m_oNoteExt.reset();
    m_oSplitterExt.reset();
    m_oPricing.reset();
    m_oCacheDef.reset();
    m_rsSelection.reset();
    m_rsReader.reset();
    m_oQuickFind->Invalidate();
    cListFrame::Terminate();
}

// ---- fetch ------------------------------------------------------------------------------

// The sets of a row or more per item come in calls of their own, so that
// the bytes of one call are let go before the next arrives.
static const std::vector<std::vector<std::string>>& PerItemCalls() {
    static const std::vector<std::vector<std::string>> calls = {
        {itemsets::PriceList},
        {itemsets::MeasureRatios, itemsets::StoreSaldo, itemsets::DiscountItems},
    };
    return calls;
}

void ctxItems::pvWriteFetchRequest(pelta::PropertyBag& Request) {
    Request.writeProperty("PriceList", pelta::Variant(m_oSel.PriceListType));
    Request.writeProperty("CgOwner", pelta::Variant(m_oSel.Supplier));
    Request.writeProperty("StoreSaldoCgStore", pelta::Variant(m_oSel.Store));
    Request.writeProperty("Discount_ID", pelta::Variant(m_oSel.DiscountSchema));
    if (m_bFullRefresh) Request.writeProperty("FlushCache", pelta::Variant(true));
    std::vector<std::string> sets;
    for (const auto& name : m_oCacheDef->Missing()) {
        bool later = false;
        for (const auto& call : PerItemCalls())
            if (std::find(call.begin(), call.end(), name) != call.end()) later = true;
        if (!later) sets.push_back(name);
    }
    Request.writeProperty("Sets", pelta::Variant(Joined(sets, ";")));
}

bool ctxItems::pvFetchPerItemSets() {
    const auto missing = m_oCacheDef->Missing();
    for (const auto& call : PerItemCalls()) {
        std::vector<std::string> sets;
        for (const auto& name : call)
            if (std::find(missing.begin(), missing.end(), name) != missing.end())
                sets.push_back(name);
        if (sets.empty()) continue;
        auto request = CreatePropertyBag(m_oForm.get());
        if (!request) return false;
        pvWriteFetchRequest(*request);
        request->writeProperty("Sets", pelta::Variant(Joined(sets, ";")));
        auto response =
            CallBll(m_oForm.get(), m_oConnection.get(), m_oDef.ReadOperation, request.get());
        if (!response || !pvStoreSets(*response)) return false;
    }
    return true;
}

bool ctxItems::pvReadFetchResponse(pelta::PropertyBag& Response) {
    if (!pvStoreSets(Response) || !pvFetchPerItemSets()) return false;
    m_rsList = pelta::Ref<pelta::Recordset>(
        pelta::query<pelta::Recordset>(m_oCacheDef->Item(itemsets::List).object()));
    if (!m_rsList) return false;
    m_bFullRefresh = false;
    m_oForm->SetControlValue("lblInfo", pelta::Variant(""));
    return true;
}

bool ctxItems::pvStoreSets(pelta::PropertyBag& Response) {
    if (const int32_t code = C2Lng(Response.readProperty("BllError")); code != 0) {
        if (code == 24) {
            // No right to the list: neither rows nor preview, only the note.
            m_oForm->SetControlValue("lblInfo", pelta::Variant(kNoRights));
            m_oForm->SetControlValue("nvPreview", pelta::Variant(""));
            m_oForm->ShowCommand(kCmdNew, false);
        } else {
            ShowBllError(m_oForm.get(), &Response);
        }
        return false;
    }
    bool references = false;
    if (Response.hasProperty("PriceList_ID"))
        m_oSel.PriceListInUse = C2Str(Response.readProperty("PriceList_ID"));
    for (const auto& name : Response.names()) {
        auto rs = RecordsetProperty(&Response, name);
        if (!rs) continue;
        try {
            m_oCacheDef->SetItem(name, pelta::Variant(pelta::ObjectRef(rs)));
        } catch (const pelta::Error&) {
            continue;  // a set the list does not use
        }
        if (name == itemsets::List) {
            m_oCacheDef->Drop(itemsets::ItemsCurrencyMeasure);
            m_rsReader.reset();
            m_oQuickFind->Invalidate();
            m_vLastBookmark.clear();
        } else if (name == itemsets::PriceList || name == itemsets::MeasureRatios ||
                   name == itemsets::CurrencyRatios || name == itemsets::StoreSaldo ||
                   name == itemsets::DiscountItems) {
            m_vLastBookmark.clear();
        } else {
            references = true;
        }
    }
    if (references) pvFillFilterLists();
    return true;
}

void ctxItems::pvBindList() {
    if (!m_rsList) return;
    if (m_oGridExt->Rows() == m_rsList)
        m_oGridExt->Refresh();  // the same rows: keep the current row and the marks
    else
        cListFrame::pvBindList();
    pvUpdateCommands();
}

// ---- dropping cached sets ---------------------------------------------------------------

void ctxItems::pvDropComputedPrices() {
    m_oCacheDef->Drop(itemsets::PriceListBmks);
    m_oCacheDef->Drop(itemsets::PriceAdditional);
    m_oCacheDef->Drop(itemsets::ItemsPrices);
    m_vLastBookmark.clear();
}

void ctxItems::pvDropPrices() {
    m_oCacheDef->Drop(itemsets::PriceList);
    pvDropComputedPrices();
}

void ctxItems::pvDropStore() {
    m_oCacheDef->Drop(itemsets::StoreSaldo);
    m_oCacheDef->Drop(itemsets::StoreSaldoBmks);
    m_vLastBookmark.clear();
}

void ctxItems::pvDropDiscounts() {
    m_oCacheDef->Drop(itemsets::DiscountItems);
    m_oCacheDef->Drop(itemsets::Discounts);
    m_vLastBookmark.clear();
}

void ctxItems::pvDropAll() {
    for (const auto& name :
         {itemsets::List, itemsets::ItemsCurrencyMeasure, itemsets::MeasureRatios,
          itemsets::MeasureRatiosBmks, itemsets::CurrencyRatios, "Type", "DimValues",
          "PriceListType", "Currencies", "Measures", "Store", "DiscountSchema", "Dimensions",
          "CustomFormats"})
        m_oCacheDef->Drop(name);
    pvDropPrices();
    pvDropStore();
    pvDropDiscounts();
}

void ctxItems::pvRefresh(bool Full) {
    if (Full) {
        pvDropAll();
        m_bFullRefresh = true;
    }
    m_oForm->Refresh();
}

// ---- commands ---------------------------------------------------------------------------

bool ctxItems::pvExecute(int32_t CommandID) {
    switch (CommandID) {
        case kCmdRefresh:
            pvRefresh(true);
            return true;
        case kCmdDeleteInactive:
            pvDeleteInactiveItems();
            return true;
        case kCmdNewDma:
            pvDmaDetails(false);
            return true;
        case kCmdOpenDma:
            pvDmaDetails(true);
            return true;
        case kCmdSimilar:
            pvLinkSimilar();
            return true;
        case kCmdItemCard:
            pvItemCard();
            return true;
        case kCmdSupplier:
            pvChooseSupplier();
            return true;
        case kCmdBomPrices:
            pvBomPrices();
            return true;
        case kCmdCostCenters:
            pvCostCenters();
            return true;
        case kCmdRefreshStock:
            pvDropStore();
            pvRefresh(false);
            return true;
        default:
            return false;
    }
}

// The list is kept between refreshes: a deleted item is read away.
void ctxItems::pvDetailDeleted() {
    pvRefresh(true);
}

std::vector<std::string> ctxItems::pvSelectedIDs(bool OnlyInactive) {
    std::vector<std::string> ids;
    if (!m_rsList) return ids;
    auto marked = m_oGridExt->SelectedBookmarks();
    if (marked.empty() && m_oGridExt->HasCurrentRow())
        marked.push_back(m_oGridExt->CurrentBookmark());
    auto* rs = &pvReader();
    for (const auto& bookmark : marked) {
        try {
            rs->setBookmark(bookmark);
        } catch (const pelta::Error&) {
            continue;
        }
        if (OnlyInactive && C2Bool(rs->value("IsActive"))) continue;
        std::string id = C2Str(rs->value("ID"));
        if (!id.empty()) ids.push_back(std::move(id));
    }
    return ids;
}

std::string ctxItems::pvSelectedIDsText(bool OnlyInactive) {
    return Joined(pvSelectedIDs(OnlyInactive), "\x01");
}

bool ctxItems::pvCallWrite(const std::string& Operation, pelta::PropertyBag& Request) {
    auto response = CallBll(m_oForm.get(), m_oConnection.get(), Operation, &Request);
    if (!response) return false;
    return ShowBllError(m_oForm.get(), response.get()) == 0;
}

void ctxItems::pvDeleteInactiveItems() {
    if (m_oForm->MsgBox(kAskDeleteInactive, vbYesNo | vbQuestion) != vbYes) return;
    const std::string ids = pvSelectedIDsText(true);
    if (ids.empty()) return;
    auto request = CreatePropertyBag(m_oForm.get());
    request->writeProperty("ID", pelta::Variant(ids));
    if (pvCallWrite("DelNomItems", *request)) pvRefresh(true);
}

void ctxItems::pvLinkSimilar() {
    const std::string ids = pvSelectedIDsText();
    if (ids.empty()) return;
    int32_t choice = Clamp(C2Lng(m_oForm->GetSetting("SimilarType", pelta::Variant(1))), 1, 2);
    if (!m_oForm->InputList("Свързване на избрани", "Тип", {"Подобен продукт", "Продавани заедно"},
                            choice))
        return;
    m_oForm->SaveSetting("SimilarType", pelta::Variant(choice));
    auto request = CreatePropertyBag(m_oForm.get());
    request->writeProperty("ID", pelta::Variant(ids));
    request->writeProperty("Type", pelta::Variant(choice));
    pvCallWrite("UpdNomItemsSimilar", *request);
}

void ctxItems::pvBomPrices() {
    const std::string ids = pvSelectedIDsText();
    if (ids.empty()) return;
    auto request = CreatePropertyBag(m_oForm.get());
    request->writeProperty("Itm_ID", pelta::Variant(ids));
    request->writeProperty("PriceList", pelta::Variant(m_oSel.PriceListType));
    if (!pvCallWrite("UpdNomItemsBomPrices", *request)) return;
    pvDropPrices();
    pvRefresh(false);
}

void ctxItems::pvCostCenters() {
    const std::string ids = pvSelectedIDsText();
    if (ids.empty()) return;
    auto request = CreatePropertyBag(m_oForm.get());
    request->writeProperty("Itm_ID", pelta::Variant(ids));
    request->writeProperty("Type", pelta::Variant(1));
    if (pvCallWrite("GenerNomItemsCostCenters", *request)) pvRefresh(true);
}

void ctxItems::pvDmaDetails(bool Current) {
    std::string criterion;
    if (Current) {
        if (!m_oGridExt->HasCurrentRow()) return;
        criterion = "ID='" + SqlQuote(C2Str(m_oGridExt->CurrentValue("ID"))) + "'";
    }
    pelta::ObjectRef form = CreateFrameworkObject(kDmaDetails);
    if (!form) {
        m_oForm->MsgBox(Printf(kCannotCreateForm, kDmaDetails), vbExclamation);
        return;
    }
    pelta::Variant args[] = {pelta::Variant(pelta::ObjectRef(m_oSite))};
    form->invoke("InitClientSite", pelta::CallKind::Method, args);
    pelta::Variant show[] = {pelta::Variant(criterion)};
    form->invoke("ShowDocument", pelta::CallKind::Method, show);
}

void ctxItems::pvItemCard() {
    if (!m_oGridExt->HasCurrentRow()) return;
    auto report = pelta::queryRef<IZonReport>(CreateStoLedgerItemReport(m_oSite.get()));
    if (!report) return;
    auto preset = [&](const char* caption, const char* name, const pelta::Variant& value) {
        pelta::Variant args[] = {pelta::Variant(caption), pelta::Variant(name), value};
        report->invoke("PresetFilter", pelta::CallKind::Method, args);
    };
    preset("Мярка", "Measures", m_oGridExt->CurrentValue("Measure_ID"));
    preset("Валута", "Currencies", m_oGridExt->CurrentValue("Currency_ID"));
    preset("Продукт", "Items", m_oGridExt->CurrentValue("ID"));
    preset("Склад", "Store", pelta::Variant(m_oSel.Store));
    pelta::Variant choices[] = {
        pelta::Variant("Type"),
        pelta::Variant(std::vector<pelta::Variant>{pelta::Variant("Стойностен"),
                                                   pelta::Variant("Количествен")}),
        pelta::Variant(std::vector<pelta::Variant>{pelta::Variant(0), pelta::Variant(2)})};
    report->invoke("PresetChoices", pelta::CallKind::Method, choices);
    report->ShowReport(pelta::Variant(pelta::ObjectRef(m_oSite)));
}

void ctxItems::pvChooseSupplier() {
    auto selector = pelta::queryRef<IZonSelector>(CreateContragentsSelector(this));
    if (!selector) return;
    pelta::Variant current(m_oSel.Supplier), search, result;
    if (!selector->ShowSelect(current, search, result)) return;
    pelta::Variant id, name, item;
    if (!selector->GetNextItem(id, name, item)) return;
    const std::string chosen = C2Str(id);
    if (!IsGuid(chosen) || chosen == m_oSel.Supplier) return;
    m_oSel.Supplier = chosen;
    pvDropPrices();
    pvRefresh(false);
}

// Command 352 needs a selected row with a bill of materials.
void ctxItems::pvUpdateCommands() {
    if (!m_oForm || !m_oGridExt || !m_rsList) return;
    auto marked = m_oGridExt->SelectedBookmarks();
    if (marked.empty() && m_oGridExt->HasCurrentRow())
        marked.push_back(m_oGridExt->CurrentBookmark());
    bool bom = false;
    auto* rs = &pvReader();
    for (const auto& b : marked) {
        try {
            rs->setBookmark(b);
            if (C2Lng(rs->value("BomCount")) > 0) bom = true;
        } catch (const pelta::Error&) {
        }
        if (bom) break;
    }
    m_oForm->EnableCommand(kCmdBomPrices, bom);
}

// ---- filters ----------------------------------------------------------------------------

void ctxItems::m_oQuickFilterExt_FilterClause(int32_t FilterID, const std::string& Text,
                                              std::string& Clause, bool& Handled) {
    Handled = true;
    Clause.clear();
    const bool begins = [] {
        auto host = HostApplication();
        return host && C2Lng(host->Option("MatchMode")) == 1;
    }();
    switch (FilterID) {
        case kFltQuickFind: {
            std::vector<std::string> parts;
            if (Text.rfind("///", 0) == 0) {
                if (Text.size() > 3)
                    parts.push_back(LikeClause("SupplCodes", Text.substr(3), begins));
            } else if (Text.rfind("//", 0) == 0) {
                if (Text.size() > 2)
                    parts.push_back(LikeClause("BarCodes", Text.substr(2), begins));
            } else if (Text.rfind("/", 0) == 0) {
                if (Text.size() > 1) parts.push_back(LikeClause("Code", Text.substr(1), begins));
            } else {
                for (const char* f : {"Name", "Code", "BarCodes", "SupplCodes", "Name2"})
                    parts.push_back(LikeClause(f, Text, begins));
            }
            Clause = Joined(parts, " OR ");
            break;
        }
        case kFltType:
            if (IsGuid(Text)) Clause = "ItmType_ID = '" + SqlQuote(Text) + "'";
            break;
        case kFltCategory: {
            // A value by its ID, or by the last segment of its path.
            std::string id = IsGuid(Text) ? Text : std::string();
            if (id.empty()) {
                const std::string name = Text.substr(
                    Text.find_last_of('\\') == std::string::npos ? 0 : Text.find_last_of('\\') + 1);
                auto values = pelta::Ref<pelta::Recordset>(
                    pelta::query<pelta::Recordset>(m_oCacheDef->Item("DimValues").object()));
                if (values && !name.empty()) {
                    auto rs = values->clone();
                    if (rs->recordCount() > 0 && rs->find("Name = '" + SqlQuote(name) + "'"))
                        id = C2Str(rs->value("ID"));
                }
            }
            Clause = id.empty() ? "Categories = NULL AND Categories <> NULL"
                                : "Categories LIKE '*\x7F" + SqlQuote(id) + "\x7F*'";
            break;
        }
        default:
            Handled = false;
            break;
    }
}

void ctxItems::m_oBand_Change(int32_t FilterID, const pelta::Variant& Value) {
    const std::string v = C2Str(Value);
    switch (FilterID) {
        case kFltPriceListType:
            if (v == m_oSel.PriceListType) return;
            m_oSel.PriceListType = v;
            pvDropPrices();
            pvRefresh(false);
            break;
        case kFltCurrency:
            if (v == m_oSel.Currency) return;
            m_oSel.Currency = v;
            pvDropComputedPrices();
            m_oGridExt->Refresh();
            break;
        case kFltMeasure:
            if (v == m_oSel.Measure) return;
            m_oSel.Measure = v;
            m_oCacheDef->Drop(itemsets::MeasureRatiosBmks);
            pvDropComputedPrices();
            m_oGridExt->Refresh();
            break;
        case kFltStore:
            if (v == m_oSel.Store) return;
            m_oSel.Store = v;
            pvDropStore();
            pvRefresh(false);
            break;
        case kFltDiscount:
            if (v == m_oSel.DiscountSchema) return;
            m_oSel.DiscountSchema = v;
            pvDropDiscounts();
            pvRefresh(false);
            break;
        default:
            break;
    }
}

void ctxItems::m_oBand_Click(int32_t FilterID) {
    m_oForm->Execute(FilterID);
}

// ---- selector: InitFilter and the rest of IZonItemsSelector -----------------------------

void ctxItems::InitFilter(const std::string& PriceListType, const std::string& Currency,
                          const std::string& Measure, const std::string& Supplier,
                          const std::string& DiscountSchema, const std::string& Store) {
    try {
        bool fetch = false;
        if (TakeFilter(PriceListType, m_oSel.PriceListType)) {
            pvDropPrices();
            fetch = true;
        }
        if (TakeFilter(Supplier, m_oSel.Supplier)) {
            pvDropPrices();
            fetch = true;
        }
        // Prices computed in the old currency or measure go as well.
        if (TakeFilter(Currency, m_oSel.Currency)) pvDropComputedPrices();
        if (TakeFilter(Measure, m_oSel.Measure)) {
            m_oCacheDef->Drop(itemsets::MeasureRatiosBmks);
            pvDropComputedPrices();
        }
        if (TakeFilter(DiscountSchema, m_oSel.DiscountSchema)) {
            pvDropDiscounts();
            fetch = true;
        }
        if (TakeFilter(Store, m_oSel.Store)) {
            pvDropStore();
            fetch = true;
        }
        if (m_oPricesExt) {
            m_oPricesExt->SetValue(kFltPriceListType, pelta::Variant(m_oSel.PriceListType));
            m_oPricesExt->SetValue(kFltCurrency, pelta::Variant(m_oSel.Currency));
            m_oPricesExt->SetValue(kFltMeasure, pelta::Variant(m_oSel.Measure));
        }
        if (m_oStoreExt) m_oStoreExt->SetValue(kFltStore, pelta::Variant(m_oSel.Store));
        if (m_oDiscountsExt)
            m_oDiscountsExt->SetValue(kFltDiscount, pelta::Variant(m_oSel.DiscountSchema));
        if (fetch && m_rsList) m_oForm->Refresh();
    } catch (...) {
        RaiseError("IZonItemsSelector_InitFilter", kObject);
    }
}

bool ctxItems::InitMedia(const std::string& Type, const std::string& Value) {
    if (Type != m_sMediaType || Value != m_sMediaValue) m_bMediaChanged = true;
    m_sMediaType = Type;
    m_sMediaValue = Value;
    return true;
}

bool ctxItems::InitDimValue(const std::string& Dimension, const std::string& Value) {
    if (Dimension != m_sDimension || Value != m_sDimValue) m_bMediaChanged = true;
    m_sDimension = Dimension;
    m_sDimValue = Value;
    return true;
}

std::string ctxItems::DiscountSchema() {
    return m_oSel.DiscountSchema;
}

std::string ctxItems::PriceListType() {
    return m_oSel.PriceListType;
}

std::string ctxItems::GetColumnName(int32_t Index) {
    if (Index < 0 || static_cast<size_t>(Index) >= m_vDimColumns.size()) return {};
    return m_vDimColumns[static_cast<size_t>(Index)];
}

}  // namespace PeltaNom15
