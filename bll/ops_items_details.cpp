// One item with the lists kept with it: reading it for the detail form and
// saving the head and the sub-lists together, by row status.
#include <algorithm>
#include <optional>

#include "bll/items.h"
#include "bll/operations.h"
#include "bll/service.h"
#include "platform/automation/guid.h"

namespace pelta::bll {

namespace {

constexpr char kScreen[] = "ctxItems";
constexpr char kTable[] = "nom_items";

// A sub-list whose table belongs to another part of the system: answered
// empty, taken back without being written.
Ref<Recordset> emptySubList() {
    return emptyList({field("ID", FieldType::Guid), field("Itm_ID", FieldType::Guid)});
}

// The lists of an item, in the order the form sends them. `table` null: kept
// elsewhere, answered empty; `written` false: read only here.
struct SubList {
    const char* property;
    const char* table;
    const char* select;
    bool written;
};

const SubList kSubLists[] = {
    {"PriceList", "nom_prices", "SELECT * FROM nom_prices WHERE Itm_ID = ?1 ORDER BY PlType_ID",
     true},
    {"SupplPrice", nullptr, nullptr, false},
    {"ItemsMeasures", "nom_itemsmeasures",
     "SELECT im.ID, im.Itm_ID, im.Measure_ID, m.Code AS MeasureCode, im.Ratio "
     "FROM nom_itemsmeasures im JOIN nom_measures m ON m.ID = im.Measure_ID "
     "WHERE im.Itm_ID = ?1 ORDER BY m.Code",
     true},
    {"ItemsParts", "nom_itemsboms",
     "SELECT b.ID, b.Itm_ID, b.Component_ID, c.Code AS ComponentCode, c.Name AS ComponentName, "
     "b.Quantity FROM nom_itemsboms b JOIN nom_items c ON c.ID = b.Component_ID "
     "WHERE b.Itm_ID = ?1 ORDER BY c.Code",
     true},
    {"RatePrices", nullptr, nullptr, false},
    // The item's group, the value of the default item dimension; the head's
    // DimValue_ID holds it.
    {"ItemsDimensions", "nom_items",
     "SELECT i.ID, i.ID AS Itm_ID, v.Dimension_ID, i.DimValue_ID AS ListValue_ID "
     "FROM nom_items i JOIN nom_dimvalues v ON v.ID = i.DimValue_ID WHERE i.ID = ?1",
     false},
    {"BarCodes", "nom_itemsbarcodes",
     "SELECT ID, Itm_ID, BarCode, Measure_ID FROM nom_itemsbarcodes WHERE Itm_ID = ?1 "
     "ORDER BY rowid",
     true},
    {"ItemsCodes", "nom_itemssupplcodes",
     "SELECT ID, Itm_ID, Cg_ID, Code, Measure_ID FROM nom_itemssupplcodes WHERE Itm_ID = ?1 "
     "ORDER BY rowid",
     true},
    {"ItmMinQuo", nullptr, nullptr, false},
    {"ItemsShelves", nullptr, nullptr, false},
    {"ItemsAttachments", nullptr, nullptr, false},
    {"ItemsSimilar", "nom_itemssimilar",
     "SELECT s.ID, s.Itm_ID, s.SimilarItm_ID, o.Code AS SimilarCode, o.Name AS SimilarName, "
     "s.Type FROM nom_itemssimilar s JOIN nom_items o ON o.ID = s.SimilarItm_ID "
     "WHERE s.Itm_ID = ?1 ORDER BY s.Type, o.Code",
     true},
    {"ItemsPermissions", nullptr, nullptr, false},
    {"ItemMaterialBoms", "nom_itemsboms",
     "SELECT b.ID, b.Itm_ID, p.Code AS ItemCode, p.Name AS ItemName, b.Quantity "
     "FROM nom_itemsboms b JOIN nom_items p ON p.ID = b.Itm_ID WHERE b.Component_ID = ?1 "
     "ORDER BY p.Code",
     false},
    {"Boms", nullptr, nullptr, false},
    {"BomsDetails", nullptr, nullptr, false},
    {"Activities", nullptr, nullptr, false},
    {"ItemsPrefSuppl", nullptr, nullptr, false},
    {"ItemsVariantDef", nullptr, nullptr, false},
    {"ItemLotsSaldo", nullptr, nullptr, false},
};

void answerItem(OperationContext& ctx, const std::string& id) {
    Variant key[] = {Variant(id)};
    auto head = readRecordset(ctx.db, "SELECT * FROM nom_items WHERE ID = ?1", key);
    ctx.response.writeProperty("Head", Variant(head));
    for (const SubList& s : kSubLists) {
        Ref<Recordset> rows = s.select ? readRecordset(ctx.db, s.select, key) : emptySubList();
        ctx.response.writeProperty(s.property, Variant(rows));
    }
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
    put("PriceListType", readRecordset(ctx.db,
                                       "SELECT ID, Code, Name, IsPromo FROM nom_pricelisttypes "
                                       "WHERE IsActive = 1 ORDER BY Name"));
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
    put("Shelves", emptyKeyed());
    put("Groups", emptyKeyed());
    put("Items", emptyKeyed());  // chosen through the item selector, not listed here
    put("StateActive", emptyKeyed());
    put("CostCenter", readRecordset(ctx.db,
                                    "SELECT ID, Type, Code, Name FROM nom_costcenters "
                                    "WHERE IsActive = 1 ORDER BY Type, Code"));
    put("DutyTariffs", emptyKeyed());
    put("FinStruct", emptyList({field("ID", FieldType::Guid), field("P_ID", FieldType::Guid),
                                field("Name", FieldType::Text)}));
}

void getNomItemsDetails(OperationContext& ctx) {
    ctx.require(kScreen, rights::OpenDetails);
    answerItem(ctx, ctx.text("ID"));
    if (ctx.flag("Referentials")) answerReferentials(ctx);
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

// A barcode of the item's new or changed rows that another item holds.
void checkBarcodes(OperationContext& ctx, Recordset& rows, const std::string& id) {
    if (rows.fieldIndex("BarCode") < 0) return;
    auto r = rows.clone();
    r->setFilter(FilterGroup::Pending);
    if (r->recordCount() == 0) return;
    auto st = ctx.db.prepare(
        "SELECT b.ID, i.Name FROM nom_itemsbarcodes b JOIN nom_items i ON i.ID = b.Itm_ID "
        "WHERE b.BarCode = ?1 AND b.Itm_ID <> ?2 LIMIT 1");
    for (r->moveFirst(); !r->eof(); r->moveNext()) {
        if (r->status() == RowStatus::Deleted || isBlank(r->value("BarCode"))) continue;
        st->reset();
        st->bindText(1, trimmed(r->value("BarCode")));
        st->bindText(2, id);
        if (st->step())
            throw Refusal(bllerr::DuplicateCode)
                .with("BllBarCode_ID", Variant(std::string(st->text(0))))
                .with("BllItem", Variant(std::string(st->text(1))))
                .with("BllRowID", r->value("ID"));
    }
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
    if (isNew) {
        // What a new item leaves empty takes the table's defaults.
        const std::pair<const char*, int32_t> defaults[] = {
            {"IsActive", 1}, {"IsVat", 1},         {"IsVatAllowed", 1}, {"IsRatePrice", 0},
            {"IsDma", 0},    {"IsAccPr", 0},       {"IsAccQuo", 0},     {"IsService", 0},
            {"BomCount", 0}, {"VatPriceScale", 2}, {"PriceScale", 2},   {"BasicMeasureScale", 0},
            {"TaxGroup", 2}};
        for (const auto& [name, value] : defaults)
            if (head->fieldIndex(name) >= 0 && isBlank(head->value(name)))
                head->setValue(name, Variant(value));
        if (head->fieldIndex("Vat") >= 0 && isBlank(head->value("Vat"))) {
            auto st = ctx.db.prepare("SELECT Value FROM sys_settings WHERE Name = 'Vat'");
            Decimal vat;
            if (st->step() && !st->isNull(0))
                if (auto d = Decimal::parse(st->text(0))) vat = *d;
            head->setValue("Vat", Variant(vat));
        }
    }
    if (head->status() != RowStatus::Unmodified) {
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

    bool subChanged = false;
    for (const SubList& s : kSubLists)
        if (s.written)
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

    bool codesChanged = false, partsChanged = false;
    for (const SubList& s : kSubLists) {
        if (!s.written) continue;
        Ref<Recordset> rows = ctx.recordset(s.property);
        if (!rows || !hasPending(*rows)) continue;
        TableWrite spec;
        spec.table = s.table;
        spec.fixed = {{"Itm_ID", Variant(id)}};
        writeRows(ctx, *rows, spec);
        const std::string table = s.table;
        codesChanged =
            codesChanged || table == "nom_itemsbarcodes" || table == "nom_itemssupplcodes";
        partsChanged = partsChanged || table == "nom_itemsboms";
    }
    if (codesChanged) refreshItemCodeLists(ctx.db, id);
    if (partsChanged) {
        auto st = ctx.db.prepare(
            "UPDATE nom_items SET BomCount = (SELECT COUNT(*) FROM nom_itemsboms "
            "WHERE Itm_ID = ?1) WHERE ID = ?1");
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
}

}  // namespace pelta::bll
