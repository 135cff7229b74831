// Rounding of formed prices and the prices of bills of materials.
#include "bll/pricing.h"

#include <algorithm>

#include "bll/database.h"

namespace pelta::bll {

namespace {

Decimal pow10(int n) {
    Decimal d(1);
    for (int i = 0; i < n; ++i)
        d *= Decimal(10);
    return d;
}

Decimal floorOf(const Decimal& q) {
    Decimal t = q.truncate();
    return q < t ? t - Decimal(1) : t;
}

Decimal ceilingOf(const Decimal& q) {
    Decimal t = q.truncate();
    return q > t ? t + Decimal(1) : t;
}

// The column types of this file, parsed once.
struct Types {
    ColumnType price = ColumnType::parse("DECIMAL(18,8)").value();
    ColumnType quantity = ColumnType::parse("DECIMAL(18,6)").value();
    ColumnType sum = ColumnType::parse("DECIMAL(18,4)").value();
    ColumnType percent = ColumnType::parse("DECIMAL(9,4)").value();
    ColumnType stamp = ColumnType::parse("DATETIME").value();
    ColumnType guid = ColumnType::parse("GUID").value();
};

const Types& types() {
    static const Types t;
    return t;
}

std::optional<Decimal> decimalAt(Statement& st, int column, const ColumnType& as) {
    if (st.isNull(column)) return std::nullopt;
    return st.value(column, as).toDecimal();
}

}  // namespace

Decimal roundFormedPrice(const Decimal& price, const RoundType& round, const Decimal& vatPercent,
                         int scale) {
    scale = std::clamp(scale, 0, 8);
    const Decimal factor = Decimal(1) + vatPercent / Decimal(100);
    Decimal p = price.round(8);
    if (round.vatIncluded) p = (p * factor).round(8);
    if (round.modulo != 0) {
        const Decimal unit = Decimal(1) / pow10(scale);
        const Decimal step = round.modulo > 0 ? Decimal(round.modulo) * unit
                                              : Decimal(1) / Decimal(-round.modulo) * unit;
        const Decimal offset = Decimal(round.reminder) * unit;
        static const Decimal tiny = Decimal::parse("0.0000000001").value();
        if (step.abs() > tiny) {
            Decimal q = (p - offset) / step;
            q = round.direction == 2   ? floorOf(q)
                : round.direction == 3 ? q.round(0)
                                       : ceilingOf(q);
            p = q * step + offset;
        }
    }
    if (round.vatIncluded) {
        p = p.round(scale);
        if (!factor.isZero()) p = p / factor;
    }
    return p.round(8);
}

std::optional<Decimal> componentPrice(Database& db, const std::string& itemId,
                                      const std::string& measureId) {
    auto item = db.prepare("SELECT Measure_ID, RatePrice FROM nom_items WHERE ID = ?1");
    item->bindText(1, itemId);
    if (!item->step()) return std::nullopt;
    Decimal ratio(1);
    if (!measureId.empty() && measureId != item->text(0)) {
        auto facet =
            db.prepare("SELECT Ratio FROM nom_itemsmeasures WHERE Itm_ID = ?1 AND Measure_ID = ?2");
        facet->bindText(1, itemId);
        facet->bindText(2, measureId);
        if (!facet->step()) return std::nullopt;
        ratio = facet->value(0, types().quantity).toDecimal();
    }
    if (auto standard = decimalAt(*item, 1, types().price); standard && *standard > Decimal(0))
        return (*standard * ratio).round(8);
    auto saldo =
        db.prepare("SELECT SUM(Quantity), SUM(TotalSum) FROM nom_storesaldo WHERE Itm_ID = ?1");
    saldo->bindText(1, itemId);
    if (!saldo->step()) return std::nullopt;
    auto quantity = decimalAt(*saldo, 0, types().quantity);
    auto total = decimalAt(*saldo, 1, types().sum);
    if (!quantity || !total || *quantity <= Decimal(0)) return std::nullopt;
    return (*total * ratio / *quantity).round(8);
}

void recalcBomPrices(Database& db, const std::string& itemId, const std::string& userId, Date now) {
    auto item = db.prepare("SELECT Vat, VatPriceScale FROM nom_items WHERE ID = ?1");
    item->bindText(1, itemId);
    if (!item->step()) return;
    const Decimal factor = Decimal(1) + item->value(0, types().percent).toDecimal() / Decimal(100);
    const int vatScale = std::clamp(static_cast<int>(item->int64(1)), 0, 8);

    struct Bill {
        std::string id;
        Decimal quantity;
    };
    std::vector<Bill> bills;
    auto bomSt = db.prepare("SELECT ID, Quantity FROM nom_boms WHERE Itm_ID = ?1");
    bomSt->bindText(1, itemId);
    while (bomSt->step())
        bills.push_back(
            {std::string(bomSt->text(0)), bomSt->value(1, types().quantity).toDecimal()});

    struct Row {
        std::string id, component, measure;
        std::optional<Decimal> quantity, price;
    };
    auto rowsSt = db.prepare(
        "SELECT ID, Itm_ID, COALESCE(Measure_ID, ''), Quantity, Price FROM nom_bomsdetails "
        "WHERE Bom_ID = ?1");
    auto upd = db.prepare(
        "UPDATE nom_bomsdetails SET Price = ?2, PriceWithVat = ?3, TotalSum = ?4, "
        "TotalWithVat = ?5, UnitQuantity = ?6, UnitSum = ?7, LU = ?8, LD = ?9 WHERE ID = ?1");
    auto bind = [&](int index, const std::optional<Decimal>& v, const ColumnType& as) {
        if (v)
            upd->bind(index, Variant(*v), as);
        else
            upd->bindNull(index);
    };
    std::vector<std::string> ids;
    for (const Bill& bill : bills) {
        ids.push_back(bill.id);
        std::vector<Row> rows;
        rowsSt->reset();
        rowsSt->bindText(1, bill.id);
        while (rowsSt->step())
            rows.push_back({std::string(rowsSt->text(0)), std::string(rowsSt->text(1)),
                            std::string(rowsSt->text(2)), decimalAt(*rowsSt, 3, types().quantity),
                            decimalAt(*rowsSt, 4, types().price)});
        for (Row& r : rows) {
            if (auto current = componentPrice(db, r.component, r.measure)) r.price = current;
            std::optional<Decimal> withVat, total, totalWithVat, unitQuantity, unitSum;
            if (r.price) withVat = (*r.price * factor).round(vatScale);
            if (r.quantity && r.price) {
                total = (*r.quantity * *r.price).round(8);
                totalWithVat = (*r.quantity * *withVat).round(8);
            }
            if (bill.quantity > Decimal(0)) {
                if (r.quantity) unitQuantity = (*r.quantity / bill.quantity).round(6);
                if (total) unitSum = (*total / bill.quantity).round(8);
            }
            upd->reset();
            upd->bindText(1, r.id);
            bind(2, r.price, types().price);
            bind(3, withVat, types().price);
            bind(4, total, types().price);
            bind(5, totalWithVat, types().price);
            bind(6, unitQuantity, types().quantity);
            bind(7, unitSum, types().price);
            upd->bind(8, Variant(userId), types().guid);
            upd->bind(9, Variant(now), types().stamp);
            upd->step();
        }
    }
    refreshBomTotals(db, ids);
    if (!ids.empty()) {
        auto stamp = db.prepare("UPDATE nom_boms SET LU = ?2, LD = ?3 WHERE Itm_ID = ?1");
        stamp->bindText(1, itemId);
        stamp->bind(2, Variant(userId), types().guid);
        stamp->bind(3, Variant(now), types().stamp);
        stamp->step();
    }
}

void refreshBomTotals(Database& db, const std::vector<std::string>& bomIds) {
    // Sums of the stored (scaled) values: exact.
    auto st = db.prepare(
        "UPDATE nom_boms SET NumRows = (SELECT COUNT(*) FROM nom_bomsdetails d "
        "WHERE d.Bom_ID = nom_boms.ID), TotalSum = (SELECT SUM(d.TotalSum) FROM nom_bomsdetails "
        "d WHERE d.Bom_ID = nom_boms.ID), TotalWithVat = (SELECT SUM(d.TotalWithVat) FROM "
        "nom_bomsdetails d WHERE d.Bom_ID = nom_boms.ID) WHERE ID = ?1");
    for (const std::string& id : bomIds) {
        st->reset();
        st->bindText(1, id);
        st->step();
    }
}

}  // namespace pelta::bll
