// The items list opened over a demo catalogue, as the host opens it.
#pragma once

#include <string>

#include "bll/items.h"
#include "framework/extenders.h"
#include "framework/list_extenders.h"
#include "framework/siblings.h"
#include "library/contracts/Constants.h"
#include "library/frame/mdGlobals.h"
#include "library/items/ctxItems.h"
#include "screen_support.h"

namespace pelta {
// Variants in test messages.
inline void PrintTo(const Variant& v, std::ostream* os) {
    *os << PeltaNom15::DumpValue(v);
}
}  // namespace pelta

namespace screentest {

class ItemsTest : public ScreenTest {
protected:
    void SetUp() override {
        ScreenTest::SetUp();
        pelta::fw::services()->host()->setOption("SearchByCodeFirst", pelta::Variant());
        open();
    }

    void TearDown() override {
        close();
        ScreenTest::TearDown();
    }

    void open() {
        listObject = openList("PeltaNom15.ctxItems");
        items = pelta::Ref<ctxItems>(pelta::query<ctxItems>(listObject.get()));
        ASSERT_TRUE(items);
        ASSERT_TRUE(items->FormExtender()->Refresh());
    }

    void close() {
        if (items) {
            bool cancel = false;
            items->QueryTerminate(cancel);
            items->Terminate();
        }
        items.reset();
        listObject.reset();
    }

    pelta::fw::GridExtender* g() { return grid(items->GridExtender()); }
    pelta::fw::FormExtender* f() { return form(items->FormExtender()); }
    pelta::fw::FilterBandExtender* band(IFilterBandExtender* b) {
        return dynamic_cast<pelta::fw::FilterBandExtender*>(b);
    }

    // A statement against the database, as another user would write it.
    void exec(const std::string& sql, const pelta::Variant& p1 = {},
              const pelta::Variant& p2 = {}) {
        auto db = pelta::bll::openDatabase(dbFile_);
        auto st = db->prepare(sql);
        if (!p1.isEmpty()) st->bind(1, p1);
        if (!p2.isEmpty()) st->bind(2, p2);
        st->step();
    }
    void addBarcode(const std::string& code, const std::string& barcode,
                    const std::string& measure = {}) {
        auto db = pelta::bll::openDatabase(dbFile_);
        auto st = db->prepare(
            "INSERT INTO nom_itemsbarcodes (ID, Itm_ID, BarCode, Measure_ID) VALUES (?1, ?2, ?3, "
            "?4)");
        st->bindText(1, pelta::newGuidString());
        st->bindText(2, itemId(code));
        st->bindText(3, barcode);
        if (measure.empty())
            st->bindNull(4);
        else
            st->bindText(4, measure);
        st->step();
        pelta::bll::refreshItemCodeLists(*db, itemId(code));
    }

    std::string itemId(const std::string& code) {
        return scalar("SELECT ID FROM nom_items WHERE Code = ?1", pelta::Variant(code)).toString();
    }
    std::string idOf(const std::string& table, const std::string& field, const std::string& v) {
        return scalar("SELECT ID FROM " + table + " WHERE " + field + " = ?1", pelta::Variant(v))
            .toString();
    }
    std::string measure(const std::string& code) { return idOf("nom_measures", "Code", code); }
    std::string currency(const std::string& code) { return idOf("nom_currencies", "Code", code); }
    // A DECIMAL column's value: the service keeps it as an integer scaled by
    // 10^scale.
    pelta::Decimal dec(const std::string& sql, int scale, const pelta::Variant& p1 = {}) {
        pelta::Decimal d = scalar(sql, p1).toDecimal();
        for (int i = 0; i < scale; ++i)
            d = d / pelta::Decimal(10);
        return d;
    }

    // The retail price of an item as the database has it.
    pelta::Decimal RetailPrice(const std::string& code, const std::string& currency,
                               const std::string& measure, const char* field = "BasePrice") {
        return dec(std::string("SELECT p.") + field +
                       " FROM nom_prices p JOIN nom_pricelisttypes t ON t.ID = p.PlType_ID "
                       "JOIN nom_items i ON i.ID = p.Itm_ID WHERE t.Name = 'Дребно' AND "
                       "i.Code = ?1 AND p.Currency_ID = '" +
                       currency + "' AND p.Measure_ID = '" + measure + "'",
                   8, pelta::Variant(code));
    }

    // The bookmark of the list row of an item.
    pelta::Variant row(const std::string& code) {
        EXPECT_TRUE(g()->MoveToRow("Code = '" + code + "'")) << code;
        return g()->CurrentBookmark();
    }
    // A cell, decimals with their trailing zeros dropped, so that values
    // compare by number.
    pelta::Variant cell(const std::string& code, const std::string& column) {
        return norm(g()->cellValue(row(code), column));
    }
    static pelta::Variant norm(const pelta::Variant& v) {
        if (v.type() != pelta::VarType::Decimal) return v;
        return pelta::Variant(*pelta::Decimal::parse(v.rawDecimal().toString()));
    }
    static pelta::Variant norm(const pelta::Decimal& d) { return norm(pelta::Variant(d)); }
    std::string styleOf(const std::string& code, const std::string& column) {
        auto args = g()->formatRow(row(code));
        for (const auto& [c, style] : args.CellStyles)
            if (c == column) return style;
        return {};
    }
    void refresh() { items->FormExtender()->Execute(kCmdRefresh); }

    static pelta::Decimal D(const char* text) { return *pelta::Decimal::parse(text); }

    pelta::ObjectRef listObject;
    pelta::Ref<ctxItems> items;
};

}  // namespace screentest
