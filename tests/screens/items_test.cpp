// The items list opened through the registry over the real service: its
// computed columns, price conversion, row styles, filter bands and quick
// filter.
#include "items_support.h"

namespace screentest {
namespace {

using pelta::Decimal;
using pelta::Variant;

TEST_F(ItemsTest, ListOpensWithEveryItemAndItsComputedColumns) {
    EXPECT_EQ(g()->rowCount(), count("SELECT COUNT(*) FROM nom_items"));
    EXPECT_EQ(g()->Columns().size(), 78u);
    EXPECT_EQ(items->FormExtender()->Caption(), "Продукти и материали");

    // Item 1: national currency, pieces, 20% VAT, no discount.
    const std::string bgn = currency("BGN"), piece = measure("бр"), box = measure("каш");
    EXPECT_EQ(cell("0000001", "BasePrice"), norm(RetailPrice("0000001", bgn, piece)));
    EXPECT_EQ(cell("0000001", "BasePriceWithVat"),
              norm(RetailPrice("0000001", bgn, piece, "BasePriceWithVat")));
    EXPECT_EQ(cell("0000001", "CurrencyCode"), Variant("BGN"));
    EXPECT_EQ(cell("0000001", "MeasureCode"), Variant("бр"));
    EXPECT_EQ(cell("0000001", "Rate"), norm(Decimal(1)));
    EXPECT_TRUE(cell("0000001", "Discount").isNull());
    // The other prices: the box in both currencies, the piece in euro.
    const std::string more = cell("0000001", "AdditionalPrices").toString();
    EXPECT_EQ(more.rfind("каш: ", 0), 0u) << more;
    EXPECT_NE(more.find("; бр: "), std::string::npos) << more;
    EXPECT_NE(more.find(" EUR"), std::string::npos) << more;

    // Item 4 has 10% off in the loyalty schema: price less the discount,
    // then plus VAT.
    EXPECT_TRUE(cell("0000004", "Discount").isNull()) << "no schema chosen";
    items->InitFilter({}, {}, {}, {}, idOf("nom_discountschemas", "Name", "Лоялни клиенти"), {});
    const Decimal p4 = RetailPrice("0000004", bgn, piece);
    EXPECT_EQ(cell("0000004", "Discount"), norm(Decimal(10)));
    EXPECT_EQ(cell("0000004", "PriceWithDiscount"), norm((p4 * D("0.9")).round(8)));
    EXPECT_EQ(cell("0000004", "PriceWithVatDiscount"), norm((p4 * D("0.9") * D("1.2")).round(8)));

    // Stock of the central store.
    const std::string id = itemId("0000002");
    const Decimal q =
        dec("SELECT SUM(Quantity) FROM nom_storesaldo WHERE Itm_ID = ?1", 6, Variant(id));
    const Decimal r =
        dec("SELECT SUM(QuantityReserved) FROM nom_storesaldo WHERE Itm_ID = ?1", 6, Variant(id));
    EXPECT_EQ(cell("0000002", "StoreSaldo"), norm(q));
    EXPECT_EQ(cell("0000002", "StoreAvailable"), norm(q - r));
    // Code lists shown without their separators.
    EXPECT_EQ(cell("0000002", "SupplCodes"), Variant("SUP-0000002"));
    const std::string codes = cell("0000002", "BarCodes").toString();
    EXPECT_EQ(codes.find('\x7F'), std::string::npos);
    EXPECT_NE(codes.find("; "), std::string::npos);
    (void)box;
}

TEST_F(ItemsTest, PricesInAnotherCurrencyUseTheRatesOfBothAndTheirUnits) {
    const std::string eur = currency("EUR"), usd = currency("USD"), jpy = currency("JPY");
    const std::string piece = measure("бр");
    // Item 5 keeps its euro price only.
    const std::string id5 = itemId("0000005");
    exec("DELETE FROM nom_prices WHERE Itm_ID = ?1 AND NOT (Currency_ID = ?2 AND Measure_ID = '" +
             piece + "')",
         Variant(id5), Variant(eur));
    // A yen rate quoted per 100 yen.
    exec(
        "INSERT INTO nom_currratiosdetails (ID, CurrRatio_ID, Currency_ID, Pr_ID, Date, Units, "
        "Rate) SELECT '" +
        pelta::newGuidString() + "', ID, '" + jpy +
        "', Pr_ID, Date + 1000, 100, 1216180 FROM nom_currratios LIMIT 1");
    // The rates as the list uses them: the latest of each currency.
    auto rate = [&](const std::string& c) {
        return dec("SELECT Rate FROM nom_currratiosdetails WHERE Currency_ID = ?1 "
                   "ORDER BY Date DESC, Pr_ID LIMIT 1",
                   6, Variant(c)) /
               Decimal(scalar("SELECT Units FROM nom_currratiosdetails WHERE Currency_ID = ?1 "
                              "ORDER BY Date DESC, Pr_ID LIMIT 1",
                              Variant(c))
                           .toLong());
    };
    refresh();
    const Decimal euro = RetailPrice("0000005", eur, piece);

    items->InitFilter({}, usd, {}, {}, {}, {});
    EXPECT_EQ(cell("0000005", "BasePrice"), norm((euro * rate(eur) / rate(usd)).round(8)));
    EXPECT_EQ(cell("0000005", "CurrencyCode"), Variant("USD"));

    items->InitFilter({}, jpy, {}, {}, {}, {});
    EXPECT_EQ(rate(jpy), D("0.0121618"));
    EXPECT_EQ(cell("0000005", "BasePrice"), norm((euro * rate(eur) / rate(jpy)).round(8)));

    // A currency without a rate: no price, and no division.
    items->InitFilter({}, currency("GBP"), {}, {}, {}, {});
    EXPECT_EQ(cell("0000005", "BasePrice"), Variant("N/A"));
    EXPECT_EQ(cell("0000005", "PriceWithDiscount"), Variant("N/A"));
    EXPECT_EQ(styleOf("0000005", "BasePrice"), "PriceNA");
    EXPECT_EQ(cell("0000005", "Rate"), Variant("N/A"));

    // A rate of zero counts as missing.
    auto rates = pelta::Ref<pelta::Recordset>(
        pelta::query<pelta::Recordset>(items->CacheDef()->Item("CurrencyRatios").object()));
    ASSERT_TRUE(rates);
    auto usdRow = rates->clone();
    ASSERT_TRUE(usdRow->find("Currency_ID = '" + usd + "'"));
    usdRow->setValue("Rate", Variant(Decimal(0)));
    usdRow->update();
    items->InitFilter({}, usd, {}, {}, {}, {});
    EXPECT_EQ(cell("0000005", "BasePrice"), Variant("N/A"));
}

TEST_F(ItemsTest, PricesInAnotherMeasureUseTheItemsRatio) {
    const std::string bgn = currency("BGN"), piece = measure("бр"), box = measure("каш");
    const std::string id = itemId("0000003");
    const Decimal ratio =
        dec("SELECT Ratio FROM nom_itemsmeasures WHERE Itm_ID = ?1", 6, Variant(id));
    exec("DELETE FROM nom_prices WHERE Itm_ID = ?1 AND Measure_ID = ?2", Variant(id), Variant(box));
    refresh();
    const Decimal each = RetailPrice("0000003", bgn, piece);
    items->InitFilter({}, {}, box, {}, {}, {});
    EXPECT_EQ(cell("0000003", "BasePrice"), norm((each * ratio).round(8)));
    EXPECT_EQ(cell("0000003", "MeasureCode"), Variant("каш"));
    // Quantities are shown in boxes and marked so.
    const Decimal q = dec("SELECT Quantity FROM nom_storesaldo WHERE Itm_ID = ?1", 6, Variant(id));
    EXPECT_EQ(cell("0000003", "StoreSaldo"), norm((q / ratio).round(8)));
    EXPECT_EQ(styleOf("0000003", "StoreSaldo"), "MeasureRatio");
    // A measure the item has no ratio for: N/A.
    items->InitFilter({}, {}, measure("м"), {}, {}, {});
    EXPECT_EQ(cell("0000003", "BasePrice"), Variant("N/A"));
    EXPECT_EQ(cell("0000003", "StoreSaldo"), Variant("N/A"));
}

TEST_F(ItemsTest, MinimumQuantityStyleOnlyWhereAMinimumExists) {
    // Item 3 has a minimum of 20; item 2 none. Both run out.
    exec(
        "UPDATE nom_storesaldo SET Quantity = 5000000, QuantityReserved = 0 WHERE Itm_ID IN "
        "(SELECT ID FROM nom_items WHERE Code IN ('0000002', '0000003'))");
    refresh();
    EXPECT_EQ(styleOf("0000003", "StoreAvailable"), "MinQuantity");
    EXPECT_EQ(styleOf("0000002", "StoreAvailable"), "");
    EXPECT_TRUE(cell("0000002", "MinStoreSaldo").isNull());
    // Enough stock: no style either.
    exec("UPDATE nom_storesaldo SET Quantity = 50000000 WHERE Itm_ID = ?1",
         Variant(itemId("0000003")));
    refresh();
    EXPECT_EQ(styleOf("0000003", "StoreAvailable"), "");
}

TEST_F(ItemsTest, BandsSetWhatTheListShowsAndFetchOnlyTheStaleSets) {
    auto* cache = dynamic_cast<pelta::fw::CacheDefExtender*>(items->CacheDef());
    ASSERT_NE(cache, nullptr);
    auto* prices = band(items->PricesBand());
    auto* store = band(items->StoreBand());
    auto* discounts = band(items->DiscountsBand());
    ASSERT_TRUE(prices && store && discounts);
    EXPECT_EQ(prices->caption(), "Цени");
    EXPECT_EQ(store->caption(), "Наличност");
    EXPECT_EQ(discounts->caption(), "Отстъпки");
    // The price-list types offered: the default first, then the active ones.
    auto types = prices->entries(810);
    ASSERT_EQ(types.size(), 4u);
    EXPECT_EQ(types[0].second, "(Подразбиране)");
    EXPECT_EQ(store->entries(807)[0].second, "(Всички)");
    EXPECT_EQ(discounts->entries(819)[0].second, "(Няма)");

    const auto* list = cache->set("List");
    const Variant listBefore = list->value;
    const Variant pricesBefore = cache->set("PriceList")->value;

    // Wholesale prices exist for every tenth item only.
    prices->select(810, Variant(idOf("nom_pricelisttypes", "Name", "Едро")));
    EXPECT_FALSE(cache->set("PriceList")->value == pricesBefore);
    EXPECT_EQ(cache->set("List")->value, listBefore) << "the rows were not fetched again";
    EXPECT_EQ(cell("0000001", "BasePrice"), Variant("N/A"));
    EXPECT_NE(cell("0000010", "BasePrice"), Variant("N/A"));

    // The shop has no stock.
    store->select(807, Variant(idOf("nom_stores", "Name", "Магазин")));
    EXPECT_TRUE(cell("0000002", "StoreSaldo").isNull());
    store->select(807, Variant());
    EXPECT_FALSE(cell("0000002", "StoreSaldo").isNull());

    // Without a discount schema nothing is off.
    EXPECT_TRUE(cell("0000004", "Discount").isNull());
    discounts->select(819, Variant(idOf("nom_discountschemas", "Name", "Лоялни клиенти")));
    EXPECT_EQ(cell("0000004", "Discount"), norm(Decimal(10)));
    EXPECT_EQ(cache->set("List")->value, listBefore);
}

TEST_F(ItemsTest, QuickFilterQuotesWhatItIsGivenAndFiltersTypesAndCategories) {
    exec("UPDATE nom_items SET Name = 'Чай O''Brien' WHERE Code = '0000006'");
    refresh();
    auto* quick = items->QuickFilter();
    quick->SetText(802, "o'brien");
    quick->Apply();
    EXPECT_EQ(g()->rowCount(), 1);
    EXPECT_EQ(g()->CurrentValue("Code"), Variant("0000006"));
    // A quote cannot end the literal early.
    quick->SetText(802, "x' OR Code LIKE '*");
    EXPECT_NO_THROW(quick->Apply());
    EXPECT_EQ(g()->rowCount(), 0);

    // "/" searches codes, "//" barcodes, "///" supplier codes.
    quick->SetText(802, "/000001");
    quick->Apply();
    EXPECT_EQ(g()->rowCount(), count("SELECT COUNT(*) FROM nom_items WHERE Code LIKE '%000001%'"));
    quick->SetText(802, "///SUP-00000");
    quick->Apply();
    EXPECT_EQ(g()->rowCount(),
              count("SELECT COUNT(*) FROM nom_items WHERE SupplCodes IS NOT NULL"));
    quick->SetText(802, "");

    // Type and category.
    const std::string type = idOf("nom_itemtypes", "Name", "Услуга");
    quick->SetText(808, type);
    quick->Apply();
    EXPECT_EQ(g()->rowCount(),
              count("SELECT COUNT(*) FROM nom_items WHERE ItmType_ID = ?1", Variant(type)));
    quick->SetText(808, "");
    quick->SetText(809, "Групи продукти\\Напитки");
    quick->Apply();
    EXPECT_EQ(g()->rowCount(),
              count("SELECT COUNT(*) FROM nom_items i JOIN nom_dimvalues v ON v.ID = i.DimValue_ID "
                    "WHERE v.Name = 'Напитки'"));
}

TEST_F(ItemsTest, AUserWithoutRightsToTheListSeesOnlyTheNote) {
    close();
    connect("operator");
    listObject = openList("PeltaNom15.ctxItems");
    items = pelta::Ref<ctxItems>(pelta::query<ctxItems>(listObject.get()));
    ASSERT_TRUE(items);
    EXPECT_FALSE(items->FormExtender()->Refresh());
    EXPECT_EQ(items->FormExtender()->ControlValue("lblInfo"),
              Variant("Недостатъчни права за извършване на операция"));
    EXPECT_EQ(g()->rowCount(), 0);
}

TEST_F(ItemsTest, PreviewPaneSwitchesTabsThroughItsLinks) {
    row("0000007");
    const std::string general = items->PreviewText();
    EXPECT_EQ(general.rfind("[b]  Общи  [/b]|  [url=__tab__1]Продажби[/url]  |", 0), 0u) << general;
    auto* note = dynamic_cast<pelta::fw::FieldExtender*>(items->PreviewNote());
    ASSERT_NE(note, nullptr);
    // Following the link of the sales tab switches the pane, not the browser.
    EXPECT_FALSE(note->navigate("__tab__1"));
    const std::string sales = items->FormExtender()->ControlValue("nvPreview").toString();
    EXPECT_EQ(sales.rfind("  [url=__tab__0]Общи[/url]  |[b]  Продажби  [/b]|", 0), 0u) << sales;
    EXPECT_NE(sales.find("[table=2200,"), std::string::npos);
    EXPECT_NE(sales.find("Брой продажби"), std::string::npos);
    EXPECT_NE(sales.find("0.00 лв."), std::string::npos);
    EXPECT_TRUE(note->navigate("https://example.org/"));

    const std::string subtitle = items->PreviewSubtitle();
    EXPECT_NE(subtitle.find(" лв. ("), std::string::npos) << subtitle;
    EXPECT_NE(subtitle.find(" без ДДС)"), std::string::npos) << subtitle;
}

}  // namespace
}  // namespace screentest
