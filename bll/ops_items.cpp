// Items: the list with the sets it computes its columns from, deleting
// items, linking related items and generating cost centres.
#include <algorithm>

#include "bll/columnar.h"
#include "bll/items.h"
#include "bll/operations.h"
#include "bll/service.h"
#include "platform/automation/guid.h"

namespace pelta::bll {

namespace {

constexpr char kItemsScreen[] = "ctxItems";
constexpr char kSep = '\x7F';

// The list: every item with the names of what it refers to. The code lists
// are kept on the item (see refreshItemCodeLists).
// The list: every item with the names of what it refers to. The code lists
// are kept on the item (see refreshItemCodeLists). What the detail form
// alone shows (weights, duties, permits ...) stays out, so that a million
// rows stay a few hundred megabytes.
const ListDef kItemsList{
    "SELECT i.ID, i.Code, i.Name, i.Name2, i.BarCodes, i.BarPrefixes, i.BarMeasures, "
    "i.SupplCodes, i.SupplMeasures, i.Categories, i.ItmType_ID, t.Name AS ItemTypeName, "
    "v.Name AS DimValueName, i.DefCurrency_ID, i.Measure_ID, m.Code AS DefMeasureCode, "
    "sm.Code AS SecMeasureCode, i.IsVat, i.IsVatAllowed, i.Vat, i.BomCount, "
    "cc.Name AS ProjectName, i.IsActive, i.Note, i.CD, i.LD "
    "FROM nom_items i "
    "LEFT JOIN nom_itemtypes t ON t.ID = i.ItmType_ID "
    "LEFT JOIN nom_dimvalues v ON v.ID = i.DimValue_ID "
    "LEFT JOIN nom_measures m ON m.ID = i.Measure_ID "
    "LEFT JOIN nom_measures sm ON sm.ID = i.SecMeasure_ID "
    "LEFT JOIN nom_costcenters cc ON cc.ID = i.ProjectCC_ID",
    "i.ID", "i.Code"};

FieldDef decimalField(const char* name, uint8_t precision, uint8_t scale) {
    FieldDef f;
    f.name = name;
    f.type = FieldType::Decimal;
    f.precision = precision;
    f.scale = scale;
    return f;
}

FieldDef guidField(const char* name) {
    FieldDef f;
    f.name = name;
    f.type = FieldType::Guid;
    return f;
}

std::string setting(Database& db, const char* name) {
    auto st = db.prepare("SELECT Value FROM sys_settings WHERE Name = ?1");
    st->bindText(1, name);
    if (!st->step() || st->isNull(0)) return {};
    return std::string(st->text(0));
}

// Whether the request asks for `set`: "Sets" lists the wanted result
// properties separated by ";"; without it every set is sent.
bool wants(const OperationContext& ctx, std::string_view set) {
    Variant v = ctx.request.readProperty("Sets");
    if (v.isEmpty() || v.isNull()) return true;
    std::string_view all = v.isString() ? std::string_view(v.str()) : std::string_view();
    while (!all.empty()) {
        size_t sep = all.find(';');
        std::string_view name = all.substr(0, sep);
        if (name.size() == set.size() &&
            std::equal(name.begin(), name.end(), set.begin(), [](char a, char b) {
                return std::tolower(static_cast<unsigned char>(a)) ==
                       std::tolower(static_cast<unsigned char>(b));
            }))
            return true;
        if (sep == std::string_view::npos) break;
        all.remove_prefix(sep + 1);
    }
    return false;
}

void answer(OperationContext& ctx, const char* name, std::string_view sql,
            std::span<const Variant> params = {}, std::span<const FieldDef> fields = {}) {
    if (!wants(ctx, name)) return;
    ctx.response.writeProperty(name, Variant(readRecordset(ctx.db, sql, params, fields)));
}

// A set of a row or more per item: straight into the recordset's byte form.
void answerRows(OperationContext& ctx, const char* name, std::string_view sql,
                std::span<const Variant> params = {}, std::span<const FieldDef> fields = {}) {
    if (!wants(ctx, name)) return;
    ctx.response.writeProperty(name,
                               Variant(ObjectRef(ColumnarRows::read(ctx.db, sql, params, fields))));
}

// The latest rate of every currency, national currency (the default one) at
// 1 per 1 unless it has rates of its own.
Ref<Recordset> currencyRatios(Database& db) {
    const FieldDef fields[] = {guidField("Currency_ID")};
    auto rs =
        readRecordset(db,
                      "SELECT c.ID AS Currency_ID, c.Code AS CurrencyCode, d.Units, d.Rate, d.Date "
                      "FROM nom_currencies c JOIN nom_currratiosdetails d ON d.ID = "
                      "(SELECT d2.ID FROM nom_currratiosdetails d2 WHERE d2.Currency_ID = c.ID "
                      "ORDER BY d2.Date DESC, d2.Pr_ID LIMIT 1) ORDER BY c.Code",
                      {}, fields);
    const std::string national = setting(db, "DefCurrency_ID");
    if (national.empty()) return rs;
    auto probe = rs->clone();
    if (probe->recordCount() > 0 && probe->find("Currency_ID = '" + national + "'")) return rs;
    auto code = db.prepare("SELECT Code FROM nom_currencies WHERE ID = ?1");
    code->bindText(1, national);
    if (!code->step()) return rs;
    rs->addNew();
    rs->setValue("Currency_ID", Variant(national));
    rs->setValue("CurrencyCode", Variant(std::string(code->text(0))));
    rs->setValue("Units", Variant(1));
    rs->setValue("Rate", Variant(Decimal(1)));
    rs->update();
    rs->updateBatch();
    rs->moveFirst();
    return rs;
}

void getNomItems(OperationContext& ctx) {
    if (ctx.rightsOf(kItemsScreen) == 0) throw Refusal(bllerr::NoRights);

    std::string plType = ctx.text("PriceList");
    if (plType.empty()) plType = setting(ctx.db, "DefPriceList_ID");
    const std::string owner = ctx.text("CgOwner");
    const std::string store = ctx.text("StoreSaldoCgStore");
    const std::string schema = ctx.text("Discount_ID");
    ctx.response.writeProperty("PriceList_ID", Variant(plType));

    answerRows(ctx, "List", kItemsList.select + " ORDER BY " + kItemsList.orderBy);

    const FieldDef ratioFields[] = {guidField("ID")};
    answerRows(ctx, "MeasureRatios",
               "SELECT im.Itm_ID AS ID, im.Itm_ID, im.Measure_ID, m.Code AS MeasureCode, im.Ratio "
               "FROM nom_itemsmeasures im JOIN nom_measures m ON m.ID = im.Measure_ID "
               "ORDER BY im.Itm_ID, m.Code",
               {}, ratioFields);

    {
        // Prices of the type, ordered by item, currency and measure, so that
        // the rows of one item are together. The codes of currencies and
        // measures and the type's promotion flag are in the reference sets.
        const Variant params[] = {Variant(plType),
                                  owner.empty() ? Variant::null() : Variant(owner)};
        answerRows(ctx, "PriceList",
                   "SELECT p.Itm_ID, p.Currency_ID, p.Measure_ID, p.BasePrice, "
                   "p.BasePriceWithVat FROM nom_prices p "
                   "WHERE p.PlType_ID = ?1 AND p.Cg_ID IS ?2 "
                   "ORDER BY p.Itm_ID, p.Currency_ID, p.Measure_ID",
                   params);
    }

    if (wants(ctx, "StoreSaldo")) {
        const FieldDef fields[] = {
            guidField("Itm_ID"),
            decimalField("Quantity", 18, 6),
            decimalField("QuantityReserved", 18, 6),
            decimalField("QuantitySecMeasure", 18, 6),
            decimalField("TotalSum", 18, 4),
            decimalField("MinQuantity", 18, 6),
        };
        if (store.empty()) {
            // Every store: the sums per item.
            answerRows(ctx, "StoreSaldo",
                       "SELECT s.Itm_ID AS Itm_ID, SUM(s.Quantity) AS Quantity, "
                       "SUM(s.QuantityReserved) AS QuantityReserved, "
                       "SUM(s.QuantitySecMeasure) AS QuantitySecMeasure, "
                       "SUM(s.TotalSum) AS TotalSum, SUM(s.MinQuantity) AS MinQuantity "
                       "FROM nom_storesaldo s GROUP BY s.Itm_ID ORDER BY s.Itm_ID",
                       {}, fields);
        } else {
            const Variant params[] = {Variant(store)};
            answerRows(ctx, "StoreSaldo",
                       "SELECT s.Itm_ID AS Itm_ID, s.Quantity, s.QuantityReserved, "
                       "s.QuantitySecMeasure, s.TotalSum, s.MinQuantity, s.Store_ID "
                       "FROM nom_storesaldo s WHERE s.Store_ID = ?1 ORDER BY s.Itm_ID",
                       params, fields);
        }
    }

    {
        const Variant params[] = {Variant(schema)};
        answerRows(ctx, "DiscountItems",
                   "SELECT Itm_ID, Discount FROM nom_discountitems WHERE Schema_ID = ?1 "
                   "ORDER BY Itm_ID",
                   params);
    }

    if (wants(ctx, "CurrencyRatios"))
        ctx.response.writeProperty("CurrencyRatios", Variant(currencyRatios(ctx.db)));

    answer(ctx, "Type", "SELECT ID, Name FROM nom_itemtypes WHERE IsActive = 1 ORDER BY Name");
    answer(ctx, "DimValues",
           "SELECT ID, Dimension_ID, Name, FullName FROM nom_dimvalues WHERE IsActive = 1 "
           "ORDER BY FullName");
    answer(ctx, "PriceListType",
           "SELECT ID, Code, Name, IsPromo, IsActive FROM nom_pricelisttypes ORDER BY Name");
    answer(ctx, "Currencies",
           "SELECT ID, Code, Name FROM nom_currencies WHERE IsActive = 1 ORDER BY Code");
    answer(ctx, "Measures",
           "SELECT ID, Code, Name FROM nom_measures WHERE IsActive = 1 ORDER BY Code");
    answer(ctx, "Store", "SELECT ID, Code, Name FROM nom_stores WHERE IsActive = 1 ORDER BY Name");
    answer(ctx, "DiscountSchema",
           "SELECT ID, Name FROM nom_discountschemas WHERE IsActive = 1 ORDER BY Name");
    answer(ctx, "Dimensions",
           "SELECT ID, Name FROM nom_dimensions WHERE IsActive = 1 ORDER BY Name");
    {
        FieldDef name;
        name.name = "Name";
        FieldDef format;
        format.name = "Format";
        const FieldDef fields[] = {name, format};
        answer(ctx, "CustomFormats", "SELECT NULL AS Name, NULL AS Format WHERE 0", {}, fields);
    }
}

void delNomItems(OperationContext& ctx) {
    ctx.require(kItemsScreen, rights::Delete);
    deleteByKeys(ctx, "nom_items", "ID");
}

// Every selected item becomes related to every other selected item, both
// ways, as "Type" says (1 similar item, 2 sold together).
void updNomItemsSimilar(OperationContext& ctx) {
    ctx.require(kItemsScreen, rights::Edit);
    const int32_t type = ctx.request.readProperty("Type", Variant(1)).toLong();
    if (type != 1 && type != 2)
        raise(errc::InvalidProcedureCall, "The relation type must be 1 or 2", "Bll");
    std::vector<std::string> ids = splitKeys(ctx.text("ID"));
    std::sort(ids.begin(), ids.end());
    ids.erase(std::unique(ids.begin(), ids.end()), ids.end());
    auto ins = ctx.db.prepare(
        "INSERT INTO nom_itemssimilar (ID, Itm_ID, SimilarItm_ID, Type) "
        "SELECT ?1, ?2, ?3, ?4 WHERE NOT EXISTS (SELECT 1 FROM nom_itemssimilar "
        "WHERE Itm_ID = ?2 AND SimilarItm_ID = ?3 AND Type = ?4)");
    for (const auto& a : ids) {
        for (const auto& b : ids) {
            if (a == b) continue;
            ins->reset();
            ins->bindText(1, newGuidString());
            ins->bindText(2, a);
            ins->bindText(3, b);
            ins->bindInt64(4, type);
            try {
                ins->step();
            } catch (const DbError& e) {
                if (e.failure() != DbFailure::ForeignKey) throw;
                Refusal r(bllerr::ExistingLinks);
                r.with("BllTable", std::string("nom_items"))
                    .with("BllColumn", std::string("Itm_ID"))
                    .with("BllSqlError", std::string(e.description()));
                throw r;
            }
        }
    }
}

// A cost centre of "Type" (1: object/project) for each item, named and coded
// as the item, and the item linked to it; an item that has one keeps it.
void generNomItemsCostCenters(OperationContext& ctx) {
    ctx.require(kItemsScreen, rights::Edit);
    const int32_t type = ctx.request.readProperty("Type", Variant(1)).toLong();
    auto item = ctx.db.prepare("SELECT Code, Name, ProjectCC_ID FROM nom_items WHERE ID = ?1");
    auto existing = ctx.db.prepare("SELECT ID FROM nom_costcenters WHERE Type = ?1 AND Code = ?2");
    auto ins = ctx.db.prepare(
        "INSERT INTO nom_costcenters (ID, Type, Code, Name, Itm_ID, IsActive, CU, CD, LU, LD) "
        "VALUES (?1, ?2, ?3, ?4, ?5, 1, ?6, ?7, ?6, ?7)");
    auto link = ctx.db.prepare("UPDATE nom_items SET ProjectCC_ID = ?2 WHERE ID = ?1");
    for (const std::string& id : splitKeys(ctx.text("Itm_ID"))) {
        item->reset();
        item->bindText(1, id);
        if (!item->step()) continue;
        if (type == 1 && !item->isNull(2)) continue;
        const std::string code(item->text(0));
        const std::string name(item->text(1));
        existing->reset();
        existing->bindInt64(1, type);
        existing->bindText(2, code);
        std::string cc;
        if (existing->step()) {
            cc = std::string(existing->text(0));
        } else {
            cc = newGuidString();
            ins->reset();
            ins->bindText(1, cc);
            ins->bindInt64(2, type);
            ins->bindText(3, code);
            ins->bindText(4, name);
            ins->bindText(5, id);
            ins->bindText(6, ctx.userId);
            ins->bind(7, Variant(ctx.now));
            ins->step();
        }
        if (type == 1) {
            link->reset();
            link->bindText(1, id);
            link->bindText(2, cc);
            link->step();
        }
    }
}

}  // namespace

std::string composeCodeList(const std::vector<std::string>& entries) {
    if (entries.empty()) return {};
    std::string out;
    for (const auto& e : entries) {
        out += kSep;
        out += e;
    }
    out += kSep;
    return out;
}

std::string barcodePrefix(std::string_view barcode) {
    size_t digits = 0;
    while (digits < barcode.size() && barcode[digits] >= '0' && barcode[digits] <= '9')
        ++digits;
    if (digits == barcode.size()) return {};  // an ordinary barcode
    for (char c : barcode.substr(digits))
        if (c != 'w' && c != 'l' && c != 'd' && c != 'c' && c != '.' && (c < '0' || c > '9'))
            return {};  // not a weight template
    return std::string(barcode.substr(0, digits));
}

void refreshItemCodeLists(Database& db, const std::string& itemId) {
    std::vector<std::string> codes, prefixes, measures, suppl, supplMeasures;
    auto bar = db.prepare(
        "SELECT BarCode, COALESCE(Measure_ID, '') FROM nom_itemsbarcodes WHERE Itm_ID = ?1 "
        "ORDER BY rowid");
    bar->bindText(1, itemId);
    while (bar->step()) {
        codes.emplace_back(bar->text(0));
        measures.emplace_back(bar->text(1));
        std::string prefix = barcodePrefix(codes.back());
        if (!prefix.empty() &&
            std::find(prefixes.begin(), prefixes.end(), prefix) == prefixes.end())
            prefixes.push_back(std::move(prefix));
    }
    auto sc = db.prepare(
        "SELECT Code, COALESCE(Measure_ID, '') FROM nom_itemssupplcodes WHERE Itm_ID = ?1 "
        "ORDER BY rowid");
    sc->bindText(1, itemId);
    while (sc->step()) {
        suppl.emplace_back(sc->text(0));
        supplMeasures.emplace_back(sc->text(1));
    }
    // The group first, then the values of other dimensions as entered.
    std::vector<std::string> categories;
    auto cat = db.prepare(
        "SELECT DimValue_ID FROM nom_items WHERE ID = ?1 AND DimValue_ID IS NOT NULL "
        "UNION ALL SELECT * FROM (SELECT ListValue_ID FROM nom_itemsdimvalues WHERE Itm_ID = ?1 "
        "ORDER BY rowid)");
    cat->bindText(1, itemId);
    while (cat->step())
        categories.emplace_back(cat->text(0));
    auto upd = db.prepare(
        "UPDATE nom_items SET BarCodes = ?2, BarPrefixes = ?3, BarMeasures = ?4, "
        "SupplCodes = ?5, SupplMeasures = ?6, Categories = ?7 WHERE ID = ?1");
    upd->bindText(1, itemId);
    auto text = [&](int index, const std::vector<std::string>& list) {
        if (list.empty())
            upd->bindNull(index);
        else
            upd->bindText(index, composeCodeList(list));
    };
    text(2, codes);
    text(3, prefixes);
    text(4, measures);
    text(5, suppl);
    text(6, supplMeasures);
    text(7, categories);
    upd->step();
}

void registerItemOperations(OperationRegistry& r) {
    r.add("GetNomItems", &getNomItems, false);
    r.add("DelNomItems", &delNomItems, true);
    r.add("UpdNomItemsSimilar", &updNomItemsSimilar, true);
    r.add("GenerNomItemsCostCenters", &generNomItemsCostCenters, true);
    registerList(kItemsScreen, kItemsList);
    registerItemDetailOperations(r);
}

}  // namespace pelta::bll
