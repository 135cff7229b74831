// One item with the lists kept with it: reading it for the detail form and
// saving the head and every sub-list together, by row status; and the lots
// of items in the stores.
#include <algorithm>
#include <optional>
#include <set>

#include "bll/items.h"
#include "bll/operations.h"
#include "bll/pricing.h"
#include "bll/service.h"
#include "platform/automation/guid.h"

namespace pelta::bll {

namespace {

constexpr char kScreen[] = "ctxItems";
constexpr char kTable[] = "nom_items";

// Head fields the items list keeps under other column names: {field, column}.
const std::vector<std::pair<std::string, std::string>>& headRenames() {
    static const std::vector<std::pair<std::string, std::string>> renames = {
        {"Currency_ID", "DefCurrency_ID"},
        {"DefRatePrice", "RatePrice"},
        {"CcProject_ID", "ProjectCC_ID"},
    };
    return renames;
}

// Columns of an item that the service composes itself.
const std::vector<std::string>& headKept() {
    static const std::vector<std::string> kept = {"BomCount",     "Categories",  "BarCodes",
                                                  "BarPrefixes",  "BarMeasures", "SupplCodes",
                                                  "SupplMeasures"};
    return kept;
}

std::string setting(Database& db, const char* name) {
    auto st = db.prepare("SELECT Value FROM sys_settings WHERE Name = ?1");
    st->bindText(1, name);
    if (!st->step() || st->isNull(0)) return {};
    return std::string(st->text(0));
}

// The head: every column of the item (those of the list under the form's
// names) and the names of what the selectors point to.
std::string headSelect(Database& db) {
    std::string columns;
    for (const TableColumn& c : db.columns(kTable)) {
        std::string expr = "i." + db.quote(c.name);
        for (const auto& [field, column] : headRenames())
            if (column == c.name) expr += " AS " + db.quote(field);
        columns += (columns.empty() ? "" : ", ") + expr;
    }
    return "SELECT " + columns +
           ", si.Name AS SecItmName, ai.Name AS AccItmName, pc.Name AS ProducerCgName, "
           "ic.Name AS ImporterCgName, cs.Name AS StructureName, cp.Name AS ProjectName, "
           "co.Name AS OtherName, vp.Name AS VariantParentItmName "
           "FROM nom_items i "
           "LEFT JOIN nom_items si ON si.ID = i.SecItm_ID "
           "LEFT JOIN nom_items ai ON ai.ID = i.AccItm_ID "
           "LEFT JOIN nom_contragents pc ON pc.ID = i.ProducerCg_ID "
           "LEFT JOIN nom_contragents ic ON ic.ID = i.ImporterCg_ID "
           "LEFT JOIN nom_costcenters cs ON cs.ID = i.CcStruct_ID "
           "LEFT JOIN nom_costcenters cp ON cp.ID = i.ProjectCC_ID "
           "LEFT JOIN nom_costcenters co ON co.ID = i.CcOther_ID "
           "LEFT JOIN nom_items vp ON vp.ID = i.VariantParentItm_ID "
           "WHERE i.ID = ?1";
}

#define PELTA_AUDIT(t) t ".CU, " t ".CD, " t ".LU, " t ".LD"

// A sub-list of the item. The select reads the item's rows (?1 the item, ?2
// the supplier price-list type); `table` null: read only here. Rows are
// written with the item's key and only over the item's own rows.
struct SubList {
    const char* property;
    const char* table;
    const char* select;
    std::vector<std::pair<std::string, std::string>> columnOf = {};
};

const std::vector<SubList>& subLists() {
    static const std::vector<SubList> lists = {
        {"PriceList",
         "nom_prices",
         "SELECT p.ID, p.Itm_ID, p.PlType_ID AS PriceList_ID, p.Cg_ID, c.Name AS CgName, "
         "p.Measure_ID, p.BasePrice, p.BasePriceWithVat, p.Currency_ID, p.Rate, p.IsVat, p.Note, "
         "p.IsAutoGener, " PELTA_AUDIT("p") " FROM nom_prices p "
                                            "JOIN nom_pricelisttypes t ON t.ID = p.PlType_ID "
                                            "LEFT JOIN nom_contragents c ON c.ID = p.Cg_ID "
                                            "WHERE p.Itm_ID = ?1 AND p.PlType_ID IS NOT ?2 "
                                            "ORDER BY t.Name, c.Name, p.Measure_ID, p.Currency_ID",
         {{"PriceList_ID", "PlType_ID"}}},
        {"SupplPrice", "nom_prices",
         "SELECT p.ID, p.Itm_ID, p.PlType_ID AS PriceList_ID, p.Cg_ID, c.Name AS CgName, "
         "p.Measure_ID, p.BasePrice, p.BasePriceWithVat, p.Currency_ID, p.Rate, p.IsVat, p.Note, "
         "p.IsAutoGener, " PELTA_AUDIT("p") " FROM nom_prices p "
                                            "LEFT JOIN nom_contragents c ON c.ID = p.Cg_ID "
                                            "WHERE p.Itm_ID = ?1 AND p.PlType_ID = ?2 "
                                            "ORDER BY c.Name, p.Measure_ID, p.Currency_ID"},
        {"ItemsMeasures", "nom_itemsmeasures",
         "SELECT im.ID, im.Itm_ID, COALESCE(im.RatioPerUnits, 1000000) AS RatioPerUnits, "
         "im.Measure_ID, COALESCE(im.RatioCoeff, im.Ratio) AS RatioCoeff, "
         "i.Measure_ID AS DefMeasure_ID, im.Note, m.Code AS MeasureCode, im.Ratio, " PELTA_AUDIT(
             "im") " FROM nom_itemsmeasures im JOIN nom_measures m ON m.ID = im.Measure_ID "
                   "JOIN nom_items i ON i.ID = im.Itm_ID WHERE im.Itm_ID = ?1 ORDER BY m.Code"},
        {"ItemsParts",
         "nom_itemsboms",
         "SELECT b.ID, b.Itm_ID, b.SeqNo, b.Component_ID AS PartItm_ID, c.Code AS ItemCode, "
         "c.Name AS ItemName, b.Quantity, b.Measure_ID, b.GroupName, " PELTA_AUDIT(
             "b") " FROM nom_itemsboms b JOIN nom_items c ON c.ID = b.Component_ID "
                  "WHERE b.Itm_ID = ?1 ORDER BY b.SeqNo, c.Code",
         {{"PartItm_ID", "Component_ID"}}},
        {"RatePrices", "nom_itemsrateprices",
         "SELECT r.ID, r.Itm_ID, r.Cg_ID, c.Name AS CgName, r.RatePrice, " PELTA_AUDIT(
             "r") " FROM nom_itemsrateprices r LEFT JOIN nom_contragents c ON c.ID = r.Cg_ID "
                  "WHERE r.Itm_ID = ?1 ORDER BY c.Name, r.rowid"},
        // The group (the item's DimValue_ID) comes as the row keyed by the
        // item itself; the values of other dimensions are rows of their own.
        {"ItemsDimensions", nullptr,
         "SELECT i.ID, i.ID AS Itm_ID, v.Dimension_ID, i.DimValue_ID AS ListValue_ID, "
         "v.Name AS ListValueName, " PELTA_AUDIT(
             "i") " FROM nom_items i JOIN nom_dimvalues v ON v.ID = i.DimValue_ID "
                  "WHERE i.ID = ?1 UNION ALL "
                  "SELECT d.ID, d.Itm_ID, d.Dimension_ID, d.ListValue_ID, v.Name, " PELTA_AUDIT(
                      "d") " FROM nom_itemsdimvalues d JOIN nom_dimvalues v ON v.ID = "
                           "d.ListValue_ID WHERE d.Itm_ID = ?1"},
        {"BarCodes",
         "nom_itemsbarcodes",
         "SELECT ID, Itm_ID, BarCode AS Code, Measure_ID, Note, IsDef, Type, CU, CD, LU, LD "
         "FROM nom_itemsbarcodes WHERE Itm_ID = ?1 ORDER BY rowid",
         {{"Code", "BarCode"}}},
        {"ItemsCodes", "nom_itemssupplcodes",
         "SELECT s.ID, s.Itm_ID, s.Cg_ID, c.Name AS CgName, s.Code, s.Name, "
         "s.Measure_ID, " PELTA_AUDIT(
             "s") " FROM nom_itemssupplcodes s LEFT JOIN nom_contragents c ON c.ID = s.Cg_ID "
                  "WHERE s.Itm_ID = ?1 ORDER BY s.rowid"},
        {"ItmMinQuo", "nom_itemsminquo",
         "SELECT q.ID, q.Itm_ID, q.CgStore_ID, q.MinQuantity, q.MaxQuantity, " PELTA_AUDIT(
             "q") " FROM nom_itemsminquo q JOIN nom_stores s ON s.ID = q.CgStore_ID "
                  "WHERE q.Itm_ID = ?1 ORDER BY s.Name"},
        {"ItemsShelves", "nom_itemsshelves",
         "SELECT ID, Itm_ID, Shelf_ID, SeqNo, Note, CU, CD, LU, LD FROM nom_itemsshelves "
         "WHERE Itm_ID = ?1 ORDER BY SeqNo, rowid"},
        {"ItemsAttachments", "nom_itemsattachments",
         "SELECT ID, Itm_ID, SeqNo, MediaFileUrl, MediaFile_ID, MediaFileName, Note, FolderName, "
         "IsDef, MediaThumbData, CU, CD, LU, LD FROM nom_itemsattachments WHERE Itm_ID = ?1 "
         "ORDER BY SeqNo, rowid"},
        {"ItemsSimilar",
         "nom_itemssimilar",
         "SELECT s.ID, s.Itm_ID, o.Code AS ItemCode, (SELECT b.BarCode FROM nom_itemsbarcodes b "
         "WHERE b.Itm_ID = o.ID ORDER BY b.rowid LIMIT 1) AS ItemBarcode, "
         "s.SimilarItm_ID AS LnkItm_ID, o.Name AS ItemName, s.Type AS LnkType, s.LnkWeight, "
         "s.Note, v.Name AS DimValueName, s.IsActive, o.Categories AS ItemCategories, " PELTA_AUDIT(
             "s") " FROM nom_itemssimilar s JOIN nom_items o ON o.ID = s.SimilarItm_ID "
                  "LEFT JOIN nom_dimvalues v ON v.ID = o.DimValue_ID "
                  "WHERE s.Itm_ID = ?1 ORDER BY s.Type, o.Code",
         {{"LnkItm_ID", "SimilarItm_ID"}, {"LnkType", "Type"}}},
        {"ItemsPermissions", "nom_itemspermissions",
         "SELECT p.ID, p.Itm_ID, p.Group_ID, g.Name AS GroupName, p.AllowPerm, "
         "p.DenyPerm, " PELTA_AUDIT(
             "p") " FROM nom_itemspermissions p JOIN sec_groups g ON g.ID = p.Group_ID "
                  "WHERE p.Itm_ID = ?1 ORDER BY g.Name"},
        // The rows of other items' bills in which this item is a component;
        // written apart (see writeBoms).
        {"ItemMaterialBoms", nullptr,
         "SELECT d.ID, d.Bom_ID, d.Itm_ID, p.Name AS BomItmName, b.Name AS BomName, d.RowNo, "
         "d.Measure_ID, d.Quantity, d.Price, d.TotalSum, d.PriceWithVat, d.TotalWithVat, d.Note, "
         "b.Itm_ID AS BomItm_ID, d.SupplPriceLastDate, b.Quantity AS BomQuantity, "
         "b.IsActive AS BomIsActive, b.IsDefault AS BomIsDefault, p.BomCount, " PELTA_AUDIT(
             "d") " FROM nom_bomsdetails d JOIN nom_boms b ON b.ID = d.Bom_ID "
                  "JOIN nom_items p ON p.ID = b.Itm_ID WHERE d.Itm_ID = ?1 "
                  "ORDER BY p.Code, b.Name, d.RowNo"},
        {"Boms", nullptr,
         "SELECT ID, Itm_ID, Name, IsActive, IsDefault, Quantity, NumRows, TotalSum, "
         "TotalWithVat, Note, CU, CD, LU, LD FROM nom_boms WHERE Itm_ID = ?1 "
         "ORDER BY IsActive DESC, Name"},
        {"BomsDetails", nullptr,
         "SELECT d.ID, d.Bom_ID, d.RowNo, d.Itm_ID, c.Name AS ItemName, c.Code AS ItemCode, "
         "d.Measure_ID, d.UnitQuantity, d.UnitSum, d.Quantity, d.Price, d.TotalSum, "
         "d.PriceWithVat, d.TotalWithVat, d.Note, d.SupplPriceLastDate, " PELTA_AUDIT(
             "d") " FROM nom_bomsdetails d JOIN nom_boms b ON b.ID = d.Bom_ID "
                  "JOIN nom_items c ON c.ID = d.Itm_ID WHERE b.Itm_ID = ?1 "
                  "ORDER BY b.Name, d.RowNo, d.rowid"},
        {"Activities", "nom_itemsactivities",
         "SELECT ID, Itm_ID, RowNo, Process, Activity_ID, Description, PlanTime, Price, "
         "CcStruct_ID, CU, CD, LU, LD FROM nom_itemsactivities WHERE Itm_ID = ?1 "
         "ORDER BY RowNo, rowid"},
        {"ItemsPrefSuppl", "nom_itemsprefsuppl",
         "SELECT p.ID, p.Itm_ID, p.SeqNo, p.Cg_ID, c.Name AS CgName, p.MinQuantity, "
         "p.StepQuantity, p.Measure_ID, p.Note, " PELTA_AUDIT(
             "p") " FROM nom_itemsprefsuppl p JOIN nom_contragents c ON c.ID = p.Cg_ID "
                  "WHERE p.Itm_ID = ?1 ORDER BY p.SeqNo, c.Name"},
        {"ItemsVariantDef", "nom_itemsvariantdef",
         "SELECT ID, Itm_ID, SeqNo, Dimension_ID, DimensionView, Note, CU, CD, LU, LD "
         "FROM nom_itemsvariantdef WHERE Itm_ID = ?1 ORDER BY SeqNo, rowid"},
    };
    return lists;
}

#undef PELTA_AUDIT

// The lots of items in the stores with the stores' quantities of the item.
// Quantities and prices are the stored scaled decimals; the expressions get
// their shape here.
Ref<Recordset> lotsSaldo(Database& db, const std::vector<std::string>& items,
                         const std::string& store) {
    std::string in;
    std::vector<Variant> params;
    for (const std::string& id : items) {
        params.emplace_back(id);
        in += (in.empty() ? "?" : ", ?") + std::to_string(params.size());
    }
    if (in.empty()) in = "NULL";
    std::string sql =
        "SELECT l.Lot, l.ExpiryDate, l.DeliveryDate, l.OriginCountryName, l.VendorLot, "
        "s.Name AS CgStoreName, l.Quantity AS LotStoreSaldo, m.Code AS MeasureCode, "
        "COALESCE(ss.Quantity, 0) AS StoreSaldo, COALESCE(ss.QuantityReserved, 0) AS "
        "StoreReserved, COALESCE(ss.Quantity, 0) - COALESCE(ss.QuantityReserved, 0) AS "
        "StoreAvailable, l.PriceAvg, l.PriceAvgPrev AS PriceAvgB_DifferentFromZero, "
        "c.Code AS CurrencyCode, l.Itm_ID, l.Store_ID AS CgStore_ID, i.Code AS ItemCode, "
        "i.Name AS ItemName "
        "FROM nom_itemlots l JOIN nom_items i ON i.ID = l.Itm_ID "
        "JOIN nom_stores s ON s.ID = l.Store_ID "
        "JOIN nom_measures m ON m.ID = i.Measure_ID "
        "LEFT JOIN nom_storesaldo ss ON ss.Store_ID = l.Store_ID AND ss.Itm_ID = l.Itm_ID "
        "LEFT JOIN nom_currencies c ON c.ID = COALESCE(l.Currency_ID, "
        "(SELECT Value FROM sys_settings WHERE Name = 'DefCurrency_ID')) "
        "WHERE l.Itm_ID IN (" +
        in + ")";
    if (!store.empty()) {
        params.emplace_back(store);
        sql += " AND l.Store_ID = ?" + std::to_string(params.size());
    }
    sql += " ORDER BY i.Code, s.Name, l.ExpiryDate, l.Lot";
    auto quantity = [](const char* name) {
        FieldDef f = field(name, FieldType::Decimal);
        f.precision = 18;
        f.scale = 6;
        return f;
    };
    const FieldDef fields[] = {quantity("StoreSaldo"), quantity("StoreReserved"),
                               quantity("StoreAvailable"), field("CurrencyCode", FieldType::Text)};
    return readRecordset(db, sql, params, fields);
}

void answerItem(OperationContext& ctx, const std::string& id) {
    const Variant params[] = {Variant(id), Variant(setting(ctx.db, "SupplPriceList_ID"))};
    auto head = readRecordset(ctx.db, headSelect(ctx.db), std::span(params, 1));
    ctx.response.writeProperty("Head", Variant(head));
    // The shapes of the sub-lists' expressions.
    FieldDef ratio = field("RatioPerUnits", FieldType::Decimal);
    ratio.precision = 18;
    ratio.scale = 6;
    FieldDef coeff = ratio;
    coeff.name = "RatioCoeff";
    const FieldDef shapes[] = {field("ItemBarcode", FieldType::Text), ratio, coeff};
    for (const SubList& s : subLists()) {
        const bool usesType = std::string_view(s.select).find("?2") != std::string_view::npos;
        Ref<Recordset> rows =
            readRecordset(ctx.db, s.select, std::span(params, usesType ? 2 : 1), shapes);
        ctx.response.writeProperty(s.property, Variant(rows));
    }
    ctx.response.writeProperty("ItemLotsSaldo", Variant(lotsSaldo(ctx.db, {id}, {})));
    ctx.response.writeProperty("Count", Variant(static_cast<int32_t>(head->recordCount())));
}

void answerReferentials(OperationContext& ctx) {
    auto put = [&](const char* name, Ref<Recordset> rs) {
        ctx.response.writeProperty(name, Variant(std::move(rs)));
    };
    put("ItemType", readRecordset(ctx.db,
                                  "SELECT ID, Name, IsDef, IsService FROM nom_itemtypes "
                                  "WHERE IsActive = 1 ORDER BY Name"));
    put("Measure", readRecordset(ctx.db,
                                 "SELECT ID, Code, Name, IsDef FROM nom_measures "
                                 "WHERE IsActive = 1 ORDER BY Code"));
    put("PriceListType",
        readRecordset(ctx.db,
                      "SELECT ID, Code, Name, IsPromo, IsAutoGener, PriceFormType, "
                      "ParentPlType_ID FROM nom_pricelisttypes WHERE IsActive = 1 ORDER BY Name"));
    {
        const FieldDef fields[] = {field("IsDef", FieldType::Boolean)};
        put("Currency",
            readRecordset(ctx.db,
                          "SELECT c.ID, c.Code, c.Name, CASE WHEN c.ID = (SELECT Value FROM "
                          "sys_settings WHERE Name = 'DefCurrency_ID') THEN 1 ELSE 0 END AS IsDef "
                          "FROM nom_currencies c WHERE c.IsActive = 1 ORDER BY c.Code",
                          {}, fields));
    }
    put("Store", readRecordset(ctx.db,
                               "SELECT ID, Code, Name FROM nom_stores WHERE IsActive = 1 "
                               "ORDER BY Name"));
    put("Dimensions", readRecordset(ctx.db,
                                    "SELECT ID, Name, ValueType, IsRequired FROM nom_dimensions "
                                    "WHERE IsActive = 1 ORDER BY Name"));
    put("DimValues", readRecordset(ctx.db,
                                   "SELECT ID, Dimension_ID, Name, FullName FROM nom_dimvalues "
                                   "WHERE IsActive = 1 ORDER BY FullName"));
    put("Shelves", readRecordset(ctx.db,
                                 "SELECT ID, Code, Name, Store_ID FROM nom_shelves "
                                 "WHERE IsActive = 1 ORDER BY Code"));
    put("Groups", readRecordset(ctx.db, "SELECT ID, Name FROM sec_groups ORDER BY Name"));
    put("Items", emptyKeyed());  // chosen through the item selector, not listed here
    put("StateActive", emptyKeyed());
    put("CostCenter", readRecordset(ctx.db,
                                    "SELECT ID, Type, Code, Name FROM nom_costcenters "
                                    "WHERE IsActive = 1 ORDER BY Type, Code"));
    put("DutyTariffs", readRecordset(ctx.db,
                                     "SELECT ID, Code, Name, DutyTariffPrc FROM nom_dutytariffs "
                                     "WHERE IsActive = 1 ORDER BY Code"));
    put("FinStruct", readRecordset(ctx.db,
                                   "SELECT ID, P_ID, Code, Name FROM nom_finstruct "
                                   "WHERE IsActive = 1 ORDER BY Code"));
    put("Intrastat", readRecordset(ctx.db,
                                   "SELECT ID, Code, Name, IsDefault FROM nom_intrastat "
                                   "WHERE IsActive = 1 ORDER BY Code"));
}

void getNomItemsDetails(OperationContext& ctx) {
    ctx.require(kScreen, rights::OpenDetails);
    answerItem(ctx, ctx.text("ID"));
    if (ctx.flag("Referentials")) answerReferentials(ctx);
}

// The lots of the items "Itm_ID" (keys joined by U+0001), of the store
// "CgStore" when given.
void getNomItemsLotsSaldo(OperationContext& ctx) {
    if (ctx.rightsOf(kScreen) == 0) throw Refusal(bllerr::NoRights);
    ctx.response.writeProperty(
        "ItemLotsSaldo",
        Variant(lotsSaldo(ctx.db, splitKeys(ctx.text("Itm_ID")), ctx.text("CgStore"))));
}

// --- Saving -------------------------------------------------------------------

bool hasPending(Recordset& rs) {
    rs.setFilter(FilterGroup::Pending);
    bool any = rs.recordCount() > 0;
    rs.clearFilter();
    return any;
}

// The next free number among the items' numeric codes.
std::string nextCode(Database& db) {
    auto st = db.prepare(
        "SELECT COALESCE(MAX(CAST(Code AS INTEGER)), 0) + 1 FROM nom_items "
        "WHERE Code <> '' AND Code NOT GLOB '*[^0-9]*' AND length(Code) <= 18");
    st->step();
    return std::to_string(st->int64(0));
}

std::optional<std::string> itemName(Database& db, const char* where, const Variant& value,
                                    const std::string& except) {
    auto st = db.prepare(std::string("SELECT Name FROM nom_items WHERE ") + where +
                         " AND ID IS NOT ?2 ORDER BY Code LIMIT 1");
    st->bind(1, value);
    st->bindText(2, except);
    if (!st->step()) return std::nullopt;
    return std::string(st->text(0));
}

// Scales are decimals of quantities and prices: kept inside what rounding
// can use.
void clampScale(Recordset& head, const char* name, int64_t high) {
    if (head.fieldIndex(name) < 0) return;
    const Variant v = head.value(name);
    if (v.isNull() || v.isEmpty()) return;
    const int64_t n = std::clamp<int64_t>(v.toLong(), 0, high);
    if (n != v.toLong()) head.setValue(name, Variant(static_cast<int32_t>(n)));
}

// The barcode field of a barcode set (the form's name, or the stored one).
const char* barcodeField(Recordset& rows) {
    if (rows.fieldIndex("Code") >= 0) return "Code";
    if (rows.fieldIndex("BarCode") >= 0) return "BarCode";
    return nullptr;
}

// A barcode of the item's new or changed rows that another item holds.
void checkBarcodes(OperationContext& ctx, Recordset& rows, const std::string& id) {
    const char* code = barcodeField(rows);
    if (!code) return;
    auto r = rows.clone();
    r->setFilter(FilterGroup::Pending);
    if (r->recordCount() == 0) return;
    auto st = ctx.db.prepare(
        "SELECT b.ID, i.Name FROM nom_itemsbarcodes b JOIN nom_items i ON i.ID = b.Itm_ID "
        "WHERE b.BarCode = ?1 AND b.Itm_ID <> ?2 LIMIT 1");
    for (r->moveFirst(); !r->eof(); r->moveNext()) {
        if (r->status() == RowStatus::Deleted || isBlank(r->value(code))) continue;
        st->reset();
        st->bindText(1, trimmed(r->value(code)));
        st->bindText(2, id);
        if (st->step())
            throw Refusal(bllerr::DuplicateCode)
                .with("BllBarCode_ID", Variant(std::string(st->text(0))))
                .with("BllItem", Variant(std::string(st->text(1))))
                .with("BllRowID", r->value("ID"));
    }
}

std::optional<Decimal> decimalOf(const Variant& v) {
    if (isBlank(v)) return std::nullopt;
    return v.toDecimal();
}

// A facet: `RatioPerUnits` of the measure equal `RatioCoeff` of the base
// measure; the list's `Ratio` follows from them. A row that changes only
// `Ratio` (or carries nothing else) stands for RatioPerUnits 1.
std::vector<Variant> facetValues(Recordset& row) {
    auto get = [&](const char* name) -> std::optional<Decimal> {
        return row.fieldIndex(name) >= 0 ? decimalOf(row.value(name)) : std::nullopt;
    };
    auto changed = [&](const char* name) {
        return row.fieldIndex(name) >= 0 &&
               (row.status() == RowStatus::New || !(row.value(name) == row.originalValue(name)));
    };
    std::optional<Decimal> perUnits = get("RatioPerUnits"), coeff = get("RatioCoeff"),
                           ratio = get("Ratio");
    const bool byRatio =
        ratio && (!perUnits || !coeff ||
                  (changed("Ratio") && !changed("RatioPerUnits") && !changed("RatioCoeff")));
    if (byRatio) {
        perUnits = Decimal(1);
        coeff = ratio;
    }
    if (!perUnits || !coeff) return {Variant::null(), Variant::null(), Variant::null()};
    Variant derived = perUnits->isZero() ? Variant::null() : Variant((*coeff / *perUnits).round(6));
    return {derived, Variant(*perUnits), Variant(*coeff)};
}

// How the rows of a sub-list are written.
TableWrite subListWrite(const SubList& s, const std::string& id, const std::string& supplType) {
    TableWrite spec;
    spec.table = s.table;
    spec.audit = true;
    spec.fixed = {{"Itm_ID", Variant(id)}};
    spec.columnOf = s.columnOf;
    spec.scope = "Itm_ID = {}";
    spec.scopeValue = Variant(id);
    const std::string_view name(s.property);
    if (name == "SupplPrice") {
        // Supplier prices are prices of the supplier type unless a row says
        // otherwise.
        spec.derived = {"PlType_ID"};
        spec.derive = [supplType](Recordset& row) {
            const int f = row.fieldIndex("PriceList_ID");
            Variant type = f >= 0 ? row.value(static_cast<size_t>(f)) : Variant::null();
            if (isBlank(type)) type = supplType.empty() ? Variant::null() : Variant(supplType);
            return std::vector<Variant>{type};
        };
    } else if (name == "ItemsMeasures") {
        spec.derived = {"Ratio", "RatioPerUnits", "RatioCoeff"};
        spec.derive = facetValues;
    }
    return spec;
}

Refusal goneRefusal(const char* table, const Variant& rowId) {
    Refusal r(bllerr::ConcurrentChange);
    r.with("BllTable", std::string(table))
        .with("BllSqlError", std::string("The row was changed or deleted by another user"));
    if (!isBlank(rowId)) r.with("BllRowID", rowId);
    return r;
}

Refusal nowhereRefusal(const char* table, const char* column, const Variant& rowId) {
    Refusal r(bllerr::ExistingLinks);
    r.with("BllTable", std::string(table)).with("BllColumn", std::string(column));
    if (!isBlank(rowId)) r.with("BllRowID", rowId);
    return r;
}

// The item's dimension values. The row keyed by the item is its group
// (nom_items.DimValue_ID); a new row of the group's dimension becomes the
// group while the item has none; every other value is a row of
// nom_itemsdimvalues. Dimensions follow the values.
void writeItemDimensions(OperationContext& ctx, Recordset& rows, const std::string& id) {
    if (rows.fieldIndex("ListValue_ID") < 0 || rows.fieldIndex("ID") < 0) return;
    Database& db = ctx.db;
    std::optional<std::string> group;
    {
        auto st = db.prepare("SELECT DimValue_ID FROM nom_items WHERE ID = ?1");
        st->bindText(1, id);
        if (st->step() && !st->isNull(0)) group = std::string(st->text(0));
    }
    const std::optional<std::string> before = group;
    auto dimensionOf = [&](const std::string& value) -> std::string {
        auto st = db.prepare("SELECT Dimension_ID FROM nom_dimvalues WHERE ID = ?1");
        st->bindText(1, value);
        return st->step() ? std::string(st->text(0)) : std::string();
    };
    std::string groupDimension = setting(db, "DefItmDimension_ID");
    if (groupDimension.empty() && group) groupDimension = dimensionOf(*group);

    const ColumnType guid = ColumnType::parse("GUID").value();
    const ColumnType stamp = ColumnType::parse("DATETIME").value();
    auto del = db.prepare("DELETE FROM nom_itemsdimvalues WHERE ID = ?1 AND Itm_ID = ?2");
    auto removeRow = [&](const Variant& key) {
        del->reset();
        del->bind(1, key, guid);
        del->bindText(2, id);
        del->step();
        if (db.changes() == 0) throw goneRefusal("nom_itemsdimvalues", key);
    };
    auto run = [&](Statement& st, const Variant& key) {
        try {
            st.step();
        } catch (const DbError& e) {
            if (e.failure() != DbFailure::Unique) throw;
            throw Refusal(bllerr::DuplicateValues)
                .with("BllTable", std::string("nom_itemsdimvalues"))
                .with("BllColumn", std::string("Itm_ID, ListValue_ID"))
                .with("BllSqlError", std::string(e.description()))
                .with("BllRowID", key);
        }
    };
    auto upd = db.prepare(
        "UPDATE nom_itemsdimvalues SET Dimension_ID = ?3, ListValue_ID = ?4, LU = ?5, LD = ?6 "
        "WHERE ID = ?1 AND Itm_ID = ?2");
    auto ins = db.prepare(
        "INSERT INTO nom_itemsdimvalues (ID, Itm_ID, Dimension_ID, ListValue_ID, CU, CD, LU, LD) "
        "VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?5, ?6)");

    rows.setFilter(FilterGroup::Pending);
    for (RowStatus wanted : {RowStatus::Deleted, RowStatus::Modified, RowStatus::New}) {
        if (rows.recordCount() == 0) break;
        for (rows.moveFirst(); !rows.eof(); rows.moveNext()) {
            if (rows.status() != wanted) continue;
            const bool deleted = wanted == RowStatus::Deleted;
            Variant key = deleted ? rows.originalValue("ID") : rows.value("ID");
            const bool isGroupRow = !isBlank(key) && key.toString() == id;
            if (deleted) {
                if (isGroupRow)
                    group.reset();
                else
                    removeRow(key);
                continue;
            }
            const Variant valueField = rows.value("ListValue_ID");
            if (isBlank(valueField)) {
                if (!isGroupRow) throw nowhereRefusal("nom_dimvalues", "ListValue_ID", key);
                group.reset();
                continue;
            }
            const std::string value = valueField.toString();
            const std::string dimension = dimensionOf(value);
            if (dimension.empty()) throw nowhereRefusal("nom_dimvalues", "ListValue_ID", key);
            const bool toGroup =
                isGroupRow || (!group && (groupDimension.empty() || dimension == groupDimension));
            if (toGroup) {
                group = value;
                if (!isGroupRow && wanted == RowStatus::Modified) removeRow(key);
                continue;
            }
            if (group && *group == value) {
                // The group already holds it.
                if (wanted == RowStatus::Modified && !isGroupRow) removeRow(key);
                continue;
            }
            if (isGroupRow || wanted == RowStatus::New) {
                if (isGroupRow) group.reset();
                if (isGroupRow || isBlank(key)) key = Variant(newGuidString());
                ins->reset();
                ins->bind(1, key, guid);
                ins->bindText(2, id);
                ins->bindText(3, dimension);
                ins->bindText(4, value);
                ins->bind(5, Variant(ctx.userId), guid);
                ins->bind(6, Variant(ctx.now), stamp);
                run(*ins, key);
            } else {
                upd->reset();
                upd->bind(1, key, guid);
                upd->bindText(2, id);
                upd->bindText(3, dimension);
                upd->bindText(4, value);
                upd->bind(5, Variant(ctx.userId), guid);
                upd->bind(6, Variant(ctx.now), stamp);
                run(*upd, key);
                if (db.changes() == 0) throw goneRefusal("nom_itemsdimvalues", key);
            }
        }
    }
    rows.clearFilter();
    if (group != before) {
        auto st = db.prepare("UPDATE nom_items SET DimValue_ID = ?2 WHERE ID = ?1");
        st->bindText(1, id);
        if (group)
            st->bindText(2, *group);
        else
            st->bindNull(2);
        try {
            st->step();
        } catch (const DbError& e) {
            if (e.failure() != DbFailure::ForeignKey) throw;
            throw nowhereRefusal("nom_dimvalues", "DimValue_ID", Variant(id));
        }
    }
}

// The bills of materials touched by the pending rows of `rows` (now and as
// read).
void collectBills(Recordset& rows, std::set<std::string>& bills) {
    if (rows.fieldIndex("Bom_ID") < 0) return;
    auto r = rows.clone();
    r->setFilter(FilterGroup::Pending);
    if (r->recordCount() == 0) return;
    for (r->moveFirst(); !r->eof(); r->moveNext()) {
        const Variant was = r->originalValue("Bom_ID");
        if (!isBlank(was)) bills.insert(was.toString());
        if (r->status() != RowStatus::Deleted && !isBlank(r->value("Bom_ID")))
            bills.insert(r->value("Bom_ID").toString());
    }
}

// Bills of materials, their rows, and the item's rows in other items' bills.
// Rows go first where bills go, bills are written, then the rows that stay
// or come; a row may name only a bill of the item; a bill's name is unique
// for the item (refused as a duplicate name naming the bill); the bills'
// counts of rows and totals follow.
void writeBoms(OperationContext& ctx, const std::string& id, Ref<Recordset> boms,
               Ref<Recordset> details, Ref<Recordset> material) {
    TableWrite detailSpec;
    detailSpec.table = "nom_bomsdetails";
    detailSpec.audit = true;
    detailSpec.scope = "Bom_ID IN (SELECT ID FROM nom_boms WHERE Itm_ID = {})";
    detailSpec.scopeValue = Variant(id);
    TableWrite materialSpec;
    materialSpec.table = "nom_bomsdetails";
    materialSpec.audit = true;
    materialSpec.fixed = {{"Itm_ID", Variant(id)}};
    materialSpec.scope = "Itm_ID = {}";
    materialSpec.scopeValue = Variant(id);

    std::set<std::string> bills;
    for (auto* rows : {details.get(), material.get()})
        if (rows) collectBills(*rows, bills);

    auto only = [](TableWrite spec, bool deletes) {
        spec.deletes = deletes;
        spec.updates = !deletes;
        spec.inserts = !deletes;
        return spec;
    };
    if (details) writeRows(ctx, *details, only(detailSpec, true));
    if (material) writeRows(ctx, *material, only(materialSpec, true));

    if (boms && boms->fieldIndex("ID") >= 0) {
        TableWrite spec;
        spec.table = "nom_boms";
        spec.audit = true;
        spec.fixed = {{"Itm_ID", Variant(id)}};
        spec.scope = "Itm_ID = {}";
        spec.scopeValue = Variant(id);
        spec.readOnly = {"NumRows", "TotalSum", "TotalWithVat"};
        const bool named = boms->fieldIndex("Name") >= 0;
        if (named) {
            spec.derived = {"Name"};
            spec.derive = [](Recordset& row) {
                return std::vector<Variant>{Variant(trimmed(row.value("Name")))};
            };
        }
        try {
            WriteResult written = writeRows(ctx, *boms, spec);
            bills.insert(written.keys.begin(), written.keys.end());
        } catch (Refusal& r) {
            const auto& props = r.properties();
            auto prop = [&](const char* name) {
                for (const auto& [n, v] : props)
                    if (n == name) return v;
                return Variant();
            };
            if (r.code() != bllerr::DuplicateValues || !named ||
                prop("BllColumn").toString().find("Name") == std::string::npos)
                throw;
            Refusal dup(bllerr::DuplicateName);
            dup.with("BllTable", std::string("nom_boms")).with("BllColumn", std::string("Name"));
            const Variant rowId = prop("BllRowID");
            if (!isBlank(rowId)) {
                auto row = boms->clone();
                for (row->moveFirst(); !row->eof(); row->moveNext()) {
                    if (row->status() != RowStatus::Deleted &&
                        row->value("ID").toString() == rowId.toString()) {
                        dup.with("BllItem", Variant(trimmed(row->value("Name"))));
                        break;
                    }
                }
                dup.with("BllRowID", rowId);
            }
            throw dup;
        }
    }

    if (details && details->fieldIndex("Bom_ID") >= 0) {
        // Never a row of a bill of another item.
        auto owned = ctx.db.prepare("SELECT 1 FROM nom_boms WHERE ID = ?1 AND Itm_ID = ?2");
        auto r = details->clone();
        r->setFilter(FilterGroup::Pending);
        if (r->recordCount() > 0) {
            for (r->moveFirst(); !r->eof(); r->moveNext()) {
                if (r->status() == RowStatus::Deleted) continue;
                const Variant bill = r->value("Bom_ID");
                owned->reset();
                owned->bind(1, isBlank(bill) ? Variant::null() : Variant(bill.toString()));
                owned->bindText(2, id);
                if (!owned->step()) throw nowhereRefusal("nom_boms", "Bom_ID", r->value("ID"));
            }
        }
    }
    if (details) writeRows(ctx, *details, only(detailSpec, false));
    if (material) writeRows(ctx, *material, only(materialSpec, false));
    refreshBomTotals(ctx.db, std::vector<std::string>(bills.begin(), bills.end()));
}

void updNomItemsDetails(OperationContext& ctx) {
    Ref<Recordset> head = ctx.recordset("Head");
    if (!head || head->recordCount() == 0)
        raise(errc::InvalidProcedureCall, "UpdNomItemsDetails needs a Head row", "Bll");
    head->moveFirst();
    const bool isNew = head->status() == RowStatus::New;
    ctx.require(kScreen, isNew ? rights::Create : rights::Edit);

    std::string id = isBlank(head->value("ID")) ? std::string() : head->value("ID").toString();
    if (isNew && id.empty()) {
        id = newGuidString();
        head->setValue("ID", Variant(id));
    }
    if (head->status() != RowStatus::Unmodified) {
        // What a row leaves empty takes the table's defaults.
        const std::pair<const char*, int32_t> defaults[] = {{"IsActive", 1},
                                                            {"IsVat", 1},
                                                            {"IsVatAllowed", 1},
                                                            {"IsRatePrice", 0},
                                                            {"IsDma", 0},
                                                            {"IsAccPr", 0},
                                                            {"IsAccQuo", 0},
                                                            {"IsService", 0},
                                                            {"VatPriceScale", 2},
                                                            {"PriceScale", 2},
                                                            {"BasicMeasureScale", 0},
                                                            {"TaxGroup", 2},
                                                            {"PriceMake", 0},
                                                            {"WarrantyMeasure", 0},
                                                            {"LifeMeasure", 0},
                                                            {"RowsumPrintOnly", 0},
                                                            {"IsLotRequired", 0},
                                                            {"IsPacking", 0}};
        for (const auto& [name, value] : defaults)
            if (head->fieldIndex(name) >= 0 && isBlank(head->value(name)))
                head->setValue(name, Variant(value));
        if (head->fieldIndex("Vat") >= 0 && isBlank(head->value("Vat"))) {
            Decimal vat;
            if (auto d = Decimal::parse(setting(ctx.db, "Vat"))) vat = *d;
            head->setValue("Vat", Variant(vat));
        }
        if (head->fieldIndex("Code") >= 0 && isBlank(head->value("Code")))
            head->setValue("Code", Variant(nextCode(ctx.db)));
        const std::string name = trimmed(head->value("Name"));
        if (auto other = itemName(ctx.db, "Name = ?1", Variant(name), id))
            throw Refusal(bllerr::DuplicateName).with("BllItem", Variant(*other));
        // The service flag follows the type.
        if (head->fieldIndex("IsService") >= 0 && !isBlank(head->value("ItmType_ID"))) {
            auto st = ctx.db.prepare("SELECT IsService FROM nom_itemtypes WHERE ID = ?1");
            st->bind(1, head->value("ItmType_ID"));
            if (st->step()) head->setValue("IsService", Variant(st->int64(0) != 0));
        }
        clampScale(*head, "VatPriceScale", 8);
        clampScale(*head, "PriceScale", 8);
        clampScale(*head, "BasicMeasureScale", 4);
        head->update();
    }
    if (auto barcodes = ctx.recordset("BarCodes")) checkBarcodes(ctx, *barcodes, id);

    TableWrite headSpec;
    headSpec.table = kTable;
    headSpec.audit = true;
    headSpec.checkLastChange = true;
    headSpec.columnOf = headRenames();
    headSpec.readOnly = headKept();

    bool subChanged = false;
    for (const SubList& s : subLists())
        if (auto rows = ctx.recordset(s.property)) subChanged = subChanged || hasPending(*rows);

    if (head->status() != RowStatus::Unmodified) {
        try {
            writeRows(ctx, *head, headSpec);
        } catch (Refusal& r) {
            if (r.code() == bllerr::DuplicateCode) {
                head->moveFirst();
                if (auto other = itemName(ctx.db, "Code = ?1", head->value("Code"), id))
                    r.with("BllItem", Variant(*other));
            }
            throw;
        }
    } else if (subChanged) {
        touchRow(ctx, *head, headSpec);
    }

    const std::string supplType = setting(ctx.db, "SupplPriceList_ID");
    for (const SubList& s : subLists()) {
        if (!s.table) continue;
        Ref<Recordset> rows = ctx.recordset(s.property);
        if (!rows || !hasPending(*rows)) continue;
        writeRows(ctx, *rows, subListWrite(s, id, supplType));
    }
    if (auto dims = ctx.recordset("ItemsDimensions"); dims && hasPending(*dims))
        writeItemDimensions(ctx, *dims, id);
    {
        Ref<Recordset> boms = ctx.recordset("Boms"), details = ctx.recordset("BomsDetails"),
                       material = ctx.recordset("ItemMaterialBoms");
        auto pending = [](const Ref<Recordset>& rs) { return rs && hasPending(*rs); };
        if (pending(boms) || pending(details) || pending(material))
            writeBoms(ctx, id, pending(boms) ? boms : Ref<Recordset>(),
                      pending(details) ? details : Ref<Recordset>(),
                      pending(material) ? material : Ref<Recordset>());
    }
    // What the item keeps of its lists: codes, categories and bills.
    refreshItemCodeLists(ctx.db, id);
    {
        auto st = ctx.db.prepare(
            "UPDATE nom_items SET BomCount = (SELECT COUNT(*) FROM nom_boms WHERE Itm_ID = ?1) "
            "WHERE ID = ?1");
        st->bindText(1, id);
        st->step();
    }

    ctx.response.writeProperty("ID", Variant(id));
    answerItem(ctx, id);
    // "NeedList" names the lists to refresh, joined by "|".
    const std::string need = "|" + ctx.text("NeedList") + "|";
    if (need.find(std::string("|") + kScreen + "|") != std::string::npos)
        if (const ListDef* list = findList(kScreen))
            ctx.response.writeProperty("ListResult", Variant(readListRow(ctx.db, *list, id)));
}

}  // namespace

void registerItemDetailOperations(OperationRegistry& r) {
    r.add("GetNomItemsDetails", &getNomItemsDetails, false);
    r.add("UpdNomItemsDetails", &updNomItemsDetails, true);
    r.add("GetNomItemsLotsSaldo", &getNomItemsLotsSaldo, false);
    registerItemPricingOperations(r);
}

}  // namespace pelta::bll
