// Prices the service proposes and recalculates for items: the rows of the
// generated price lists that follow from a price just entered, and the
// prices of the items' bills of materials.
#include <algorithm>
#include <deque>
#include <optional>
#include <set>

#include "bll/operations.h"
#include "bll/pricing.h"
#include "bll/service.h"

namespace pelta::bll {

namespace {

constexpr char kScreen[] = "ctxItems";

std::string setting(Database& db, const char* name) {
    auto st = db.prepare("SELECT Value FROM sys_settings WHERE Name = ?1");
    st->bindText(1, name);
    if (!st->step() || st->isNull(0)) return {};
    return std::string(st->text(0));
}

FieldDef decimalField(const char* name, uint8_t scale) {
    FieldDef f = field(name, FieldType::Decimal);
    f.precision = 18;
    f.scale = scale;
    return f;
}

std::optional<Decimal> decimalOf(const Variant& v) {
    if (isBlank(v)) return std::nullopt;
    if (v.isString()) return Decimal::parse(trimmed(v));
    return v.toDecimal();
}

struct Coefficients {
    Decimal a, b;
};

// What the proposal needs to know of the item.
struct ItemFacts {
    Decimal vat;
    int vatScale = 2;
    std::string currency;
    // Its dimension values: value -> dimension, in the order given.
    std::vector<std::pair<std::string, std::string>> values;
};

class Proposal {
public:
    Proposal(Database& db, std::string item, std::string measure)
        : db_(db), item_(std::move(item)), measure_(std::move(measure)) {}

    // The mark-up in force for the item in type `type`: the item's own (by
    // measure), else that of its value in the type's dimension or the
    // nearest value above it, else the type's mark-up for everything.
    std::optional<Coefficients> coefficients(const std::string& type, const std::string& dimension,
                                             const ItemFacts& facts) {
        auto own = db_.prepare(
            "SELECT CoefficientA, CoefficientB FROM nom_pricelistitems "
            "WHERE PriceListType_ID = ?1 AND Itm_ID = ?2 AND Measure_ID = ?3");
        own->bindText(1, type);
        own->bindText(2, item_);
        own->bindText(3, measure_);
        if (own->step()) return read(*own);

        auto byValue = db_.prepare(
            "SELECT CoefficientA, CoefficientB FROM nom_pricelistdimvalues "
            "WHERE PriceListType_ID = ?1 AND ListValue_ID IS ?2 AND IsActive = 1");
        auto parentOf = db_.prepare(
            "SELECT p.ID FROM nom_dimvalues v JOIN nom_dimvalues p ON p.Dimension_ID = "
            "v.Dimension_ID AND v.FullName = p.FullName || '\\' || v.Name WHERE v.ID = ?1");
        for (const auto& [value, valueDimension] : facts.values) {
            if (valueDimension != dimension) continue;
            std::string v = value;
            for (int depth = 0; depth < 64 && !v.empty(); ++depth) {
                byValue->reset();
                byValue->bindText(1, type);
                byValue->bindText(2, v);
                if (byValue->step()) return read(*byValue);
                parentOf->reset();
                parentOf->bindText(1, v);
                v = parentOf->step() ? std::string(parentOf->text(0)) : std::string();
            }
            break;
        }
        byValue->reset();
        byValue->bindText(1, type);
        byValue->bindNull(2);
        if (byValue->step()) return read(*byValue);
        return std::nullopt;
    }

    RoundType roundType(const std::string& id) {
        RoundType r;
        if (id.empty()) return r;
        auto st = db_.prepare(
            "SELECT Modulo, Reminder, Direction, IsVatIncluded FROM nom_roundtypes WHERE ID = ?1");
        st->bindText(1, id);
        if (st->step()) {
            r.modulo = st->int64(0);
            r.reminder = st->int64(1);
            r.direction = static_cast<int>(st->int64(2));
            r.vatIncluded = st->int64(3) != 0;
        }
        return r;
    }

private:
    static Coefficients read(Statement& st) {
        static const ColumnType type = ColumnType::parse("DECIMAL(18,8)").value();
        return {st.value(0, type).toDecimal(), st.value(1, type).toDecimal()};
    }

    Database& db_;
    std::string item_;
    std::string measure_;
};

ItemFacts itemFacts(OperationContext& ctx, const std::string& item) {
    ItemFacts f;
    if (auto vat = Decimal::parse(setting(ctx.db, "Vat"))) f.vat = *vat;
    if (auto scale = Decimal::parse(setting(ctx.db, "DefVatPriceScale")))
        f.vatScale = static_cast<int>(scale->toInt64());
    f.currency = setting(ctx.db, "DefCurrency_ID");
    std::vector<std::string> values;
    auto st = ctx.db.prepare(
        "SELECT Vat, VatPriceScale, DefCurrency_ID, DimValue_ID FROM nom_items WHERE ID = ?1");
    st->bindText(1, item);
    if (st->step()) {
        f.vat = st->value(0, ColumnType::parse("DECIMAL(9,4)").value()).toDecimal();
        f.vatScale = static_cast<int>(st->int64(1));
        if (!st->isNull(2)) f.currency = std::string(st->text(2));
        if (!st->isNull(3)) values.emplace_back(st->text(3));
        auto more = ctx.db.prepare(
            "SELECT ListValue_ID FROM nom_itemsdimvalues WHERE Itm_ID = ?1 ORDER BY rowid");
        more->bindText(1, item);
        while (more->step())
            values.emplace_back(more->text(0));
    }
    // The values the form holds (perhaps not saved yet) stand for the stored.
    if (Ref<Recordset> dims = ctx.recordset("ItemsDimensions");
        dims && dims->fieldIndex("ListValue_ID") >= 0) {
        values.clear();
        auto r = dims->clone();
        if (r->recordCount() > 0)
            for (r->moveFirst(); !r->eof(); r->moveNext())
                if (r->status() != RowStatus::Deleted && !isBlank(r->value("ListValue_ID")))
                    values.push_back(r->value("ListValue_ID").toString());
    }
    auto dimension = ctx.db.prepare("SELECT Dimension_ID FROM nom_dimvalues WHERE ID = ?1");
    for (const std::string& v : values) {
        dimension->reset();
        dimension->bindText(1, v);
        if (dimension->step()) f.values.emplace_back(v, std::string(dimension->text(0)));
    }
    f.vatScale = std::clamp(f.vatScale, 0, 8);
    return f;
}

// The rows the generated price lists would get from the price "Price" the
// item has in "PriceListType" for "Measure": each active generated type
// formed on that type (or, for the supplier type, each generated on the last
// delivery price) gets (A/100 + 1) x the price + B with the mark-up in force,
// rounded by its round type; types generated from those follow from their
// proposed prices. "VAT" is the VAT percent (the item's when empty); a
// Boolean says whether the price includes VAT.
void getNomItemPlProposal(OperationContext& ctx) {
    if (ctx.rightsOf(kScreen) == 0) throw Refusal(bllerr::NoRights);
    auto list =
        emptyList({field("PriceList_ID", FieldType::Guid), field("Cg_ID", FieldType::Guid),
                   field("Itm_ID", FieldType::Guid), field("Measure_ID", FieldType::Guid),
                   decimalField("BasePrice", 8), decimalField("BasePriceWithVat", 8),
                   field("Currency_ID", FieldType::Guid), decimalField("Rate", 6),
                   field("IsVat", FieldType::Boolean), field("Note", FieldType::Text),
                   field("IsAutoGener", FieldType::Boolean),
                   field("ParentPlType_ID", FieldType::Guid), decimalField("CoefficientA", 8),
                   decimalField("CoefficientB", 8), field("RoundType_ID", FieldType::Guid)});
    ctx.response.writeProperty("List", Variant(list));

    const std::string parent = ctx.text("PriceListType");
    const std::string item = ctx.text("Itm_ID");
    const std::string measure = ctx.text("Measure");
    const std::optional<Decimal> price = decimalOf(ctx.request.readProperty("Price"));
    if (parent.empty() || !price) return;

    ItemFacts facts = itemFacts(ctx, item);
    bool includesVat = false;
    const Variant vat = ctx.request.readProperty("VAT");
    if (vat.type() == VarType::Boolean)
        includesVat = vat.toBool();
    else if (auto percent = decimalOf(vat))
        facts.vat = *percent;
    const Decimal rateVat = includesVat ? Decimal(0) : facts.vat;
    const std::string currency =
        ctx.text("Currency_ID").empty() ? facts.currency : ctx.text("Currency_ID");
    const std::string groupDimension = setting(ctx.db, "DefItmDimension_ID");
    const std::string supplier = setting(ctx.db, "SupplPriceList_ID");

    auto children = ctx.db.prepare(
        "SELECT ID, RoundType_ID, Dimension_ID FROM nom_pricelisttypes "
        "WHERE IsActive = 1 AND IsAutoGener = 1 AND ((PriceFormType = 3 AND ParentPlType_ID = "
        "?1) OR (PriceFormType = 1 AND ?1 = ?2)) ORDER BY Name");
    Proposal proposal(ctx.db, item, measure);
    std::deque<std::pair<std::string, Decimal>> queue{{parent, *price}};
    std::set<std::string> seen{parent};
    while (!queue.empty()) {
        const auto [from, base] = queue.front();
        queue.pop_front();
        struct Child {
            std::string id, roundType, dimension;
        };
        std::vector<Child> found;
        children->reset();
        children->bindText(1, from);
        if (supplier.empty())
            children->bindNull(2);
        else
            children->bindText(2, supplier);
        while (children->step())
            found.push_back(
                {std::string(children->text(0)),
                 children->isNull(1) ? std::string() : std::string(children->text(1)),
                 children->isNull(2) ? groupDimension : std::string(children->text(2))});
        for (const Child& c : found) {
            if (!seen.insert(c.id).second) continue;
            auto k = proposal.coefficients(c.id, c.dimension, facts);
            if (!k) continue;
            const Decimal raw = (k->a / Decimal(100) + Decimal(1)) * base + k->b;
            const Decimal formed =
                roundFormedPrice(raw, proposal.roundType(c.roundType), rateVat, facts.vatScale);
            const Decimal withVat =
                includesVat
                    ? formed
                    : (formed * (Decimal(1) + facts.vat / Decimal(100))).round(facts.vatScale);
            list->addNew();
            list->setValue("PriceList_ID", Variant(c.id));
            if (!item.empty()) list->setValue("Itm_ID", Variant(item));
            if (!measure.empty()) list->setValue("Measure_ID", Variant(measure));
            list->setValue("BasePrice", Variant(formed));
            list->setValue("BasePriceWithVat", Variant(withVat));
            if (!currency.empty()) list->setValue("Currency_ID", Variant(currency));
            list->setValue("IsVat", Variant(includesVat));
            list->setValue("IsAutoGener", Variant(true));
            list->setValue("ParentPlType_ID", Variant(from));
            list->setValue("CoefficientA", Variant(k->a));
            list->setValue("CoefficientB", Variant(k->b));
            if (!c.roundType.empty()) list->setValue("RoundType_ID", Variant(c.roundType));
            list->update();
            queue.emplace_back(c.id, formed);
        }
    }
    list->updateBatch();
    if (list->recordCount() > 0) list->moveFirst();
}

// Prices the bills of materials of the items "Itm_ID" (keys joined by
// U+0001) anew (see recalcBomPrices).
void updNomItemsBomPrices(OperationContext& ctx) {
    ctx.require(kScreen, rights::Edit);
    std::vector<std::string> ids = splitKeys(ctx.text("Itm_ID"));
    std::sort(ids.begin(), ids.end());
    ids.erase(std::unique(ids.begin(), ids.end()), ids.end());
    for (const std::string& id : ids)
        recalcBomPrices(ctx.db, id, ctx.userId, ctx.now);
}

}  // namespace

void registerItemPricingOperations(OperationRegistry& r) {
    r.add("GetNomItemPlProposal", &getNomItemPlProposal, false);
    r.add("UpdNomItemsBomPrices", &updNomItemsBomPrices, true);
}

}  // namespace pelta::bll
