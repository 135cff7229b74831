// The quick find of the items list and the selector contract: every prefix,
// weight barcodes, the selection record, the walk over it, item information
// and the caches InitFilter drops.
#include "items_support.h"
#include "library/items/ctxItemsQuickFind.h"

namespace screentest {
namespace {

using pelta::Decimal;
using pelta::Variant;

class ItemsQuickFindTest : public ItemsTest {
protected:
    // Quick find, answering the record it prepared.
    bool find(const std::string& text, RecordsetRef* record = nullptr) {
        Variant result;
        bool ok = items->QuickFind(text, result);
        if (record)
            *record = pelta::Ref<pelta::Recordset>(pelta::query<pelta::Recordset>(result.object()));
        return ok;
    }
    std::string current() { return g()->CurrentValue("Code").toString(); }
    std::string ean(const std::string& code, int n) {
        return scalar(
                   "SELECT BarCode FROM nom_itemsbarcodes b JOIN nom_items i ON i.ID = b.Itm_ID "
                   "WHERE i.Code = ?1 ORDER BY b.rowid LIMIT 1 OFFSET " +
                       std::to_string(n),
                   Variant(code))
            .toString();
    }
};

TEST(ItemsWeightCode, TemplateBecomesAPatternAndDecodesWeightLotAndThirdValue) {
    EXPECT_EQ(WeightPattern("21ww.wwwc"), "21??????");
    EXPECT_TRUE(MatchesPattern("21??????", "21012345"));
    EXPECT_FALSE(MatchesPattern("21??????", "2101234"));
    EXPECT_FALSE(MatchesPattern("21??????", "22012345"));
    const auto w = DecodeWeightCode("21ww.wwwc", "21012345");
    EXPECT_EQ(w.Weight, "01.234");
    EXPECT_EQ(w.Lot, "");
    const auto l = DecodeWeightCode("2lllw.wwd.dc", "2987123456");
    EXPECT_EQ(l.Lot, "987");
    EXPECT_EQ(l.Weight, "1.23");
    EXPECT_EQ(l.Third, "4.5");
    // Filter clauses quote what they are given; code lists match anywhere.
    EXPECT_EQ(LikeClause("Name", "O'B", true), "(Name LIKE 'O''B*')");
    EXPECT_EQ(LikeClause("BarCodes", "12", true), "(BarCodes LIKE '*12*')");
}

TEST_F(ItemsQuickFindTest, EveryPrefixFindsExactlyOneItem) {
    // "/" a code: the exact code before any partial match.
    EXPECT_TRUE(find("/0000001"));
    EXPECT_EQ(current(), "0000001");
    EXPECT_TRUE(find("/0000039"));
    EXPECT_EQ(current(), "0000039");
    EXPECT_FALSE(find("/00000")) << "a part of many codes";
    // "//" a barcode, with the measure it was given for.
    EXPECT_TRUE(find("//" + ean("0000007", 1)));
    EXPECT_EQ(current(), "0000007");
    EXPECT_EQ(items->QuickFindState().Measure, measure("каш"));
    // "///" a supplier code.
    RecordsetRef record;
    EXPECT_TRUE(find("///sup-0000008", &record));
    EXPECT_EQ(current(), "0000008");
    ASSERT_TRUE(record);
    EXPECT_EQ(record->value("PriceMeasure_ID"), Variant(measure("каш")));
    // A GUID positions without any search of texts.
    EXPECT_TRUE(find(itemId("0000012")));
    EXPECT_EQ(current(), "0000012");
    // Without a prefix, by name unless codes come first.
    const std::string name = scalar("SELECT Name FROM nom_items WHERE Code = '0000021'").toString();
    EXPECT_TRUE(find(name));
    EXPECT_EQ(current(), "0000021");
    EXPECT_FALSE(find("0000022"));
    pelta::fw::services()->host()->setOption("SearchByCodeFirst", Variant(true));
    EXPECT_TRUE(find("0000022"));
    EXPECT_EQ(current(), "0000022");
    EXPECT_TRUE(find(ean("0000023", 0)));
    EXPECT_EQ(current(), "0000023");
}

TEST_F(ItemsQuickFindTest, TooShortOrAmbiguousTextsFindNothingAndMoveNothing) {
    row("0000005");
    for (const char* text : {"///", "//", "//1", "/", "/0000"}) {
        EXPECT_FALSE(find(text)) << text;
        EXPECT_EQ(current(), "0000005") << text;
    }
    // A barcode two items share is not resolved.
    addBarcode("0000002", "SHARED-1");
    addBarcode("0000003", "SHARED-1");
    refresh();
    row("0000005");
    EXPECT_FALSE(find("//SHARED-1"));
    EXPECT_EQ(current(), "0000005");
}

TEST_F(ItemsQuickFindTest, WeightBarcodeGivesItemQuantityAndNoLot) {
    addBarcode("0000009", "21ww.wwwc", measure("кг"));
    refresh();
    RecordsetRef record;
    ASSERT_TRUE(find("//21012345", &record));
    EXPECT_EQ(current(), "0000009");
    ASSERT_TRUE(record);
    EXPECT_EQ(norm(record->value("QuickFindQuantity")), norm(D("1.234")));
    EXPECT_TRUE(record->value("QuickFindLot").isNull());
    EXPECT_EQ(record->value("PriceMeasure_ID"), Variant(measure("кг")));
    // A shared all-digit barcode falls through to the weight templates.
    addBarcode("0000002", "21055550");
    addBarcode("0000003", "21055550");
    refresh();
    ASSERT_TRUE(find("//21055550", &record));
    EXPECT_EQ(current(), "0000009");
    EXPECT_EQ(norm(record->value("QuickFindQuantity")), norm(D("5.555")));
}

TEST_F(ItemsQuickFindTest, WholeBarcodeBeatsOneThatContainsIt) {
    addBarcode("0000011", "12345");
    addBarcode("0000013", "9912345");
    refresh();
    EXPECT_TRUE(find("//12345"));
    EXPECT_EQ(current(), "0000011");
    EXPECT_TRUE(find("//99123"));
    EXPECT_EQ(current(), "0000013");
}

TEST_F(ItemsQuickFindTest, FindingsOfOneSearchNeitherOutliveItNorReachOtherItems) {
    addBarcode("0000009", "21ww.wwwc", measure("кг"));
    refresh();
    ASSERT_TRUE(find("//21012345"));
    ASSERT_TRUE(items->QuickFindState().Quantity);
    // The next search starts clean.
    RecordsetRef record;
    ASSERT_TRUE(find("/0000014", &record));
    EXPECT_FALSE(items->QuickFindState().Quantity);
    EXPECT_TRUE(items->QuickFindState().Measure.empty());
    EXPECT_TRUE(record->value("QuickFindQuantity").isNull());
    // A failed search forgets the last findings as well.
    ASSERT_TRUE(find("//" + ean("0000007", 1)));
    EXPECT_FALSE(find("//no-such-code"));
    EXPECT_TRUE(items->QuickFindState().Measure.empty());
    // The measure found for one item is not given to another.
    ASSERT_TRUE(find("//" + ean("0000007", 1)));
    row("0000008");
    Variant current, search, result;
    ASSERT_TRUE(items->ShowSelect(current, search, result));
    auto rs = pelta::Ref<pelta::Recordset>(pelta::query<pelta::Recordset>(result.object()));
    EXPECT_EQ(rs->value("Code"), Variant("0000008"));
    EXPECT_EQ(rs->value("PriceMeasure_ID"), Variant(measure("бр")));
}

TEST_F(ItemsQuickFindTest, ScannerSearchesBarcodesUnlessCodesComeFirst) {
    exec("UPDATE nom_items SET Code = 'A18' WHERE Code = '0000018'");
    refresh();
    auto* grid = g();
    grid->scannerReceive(ean("0000017", 0));
    EXPECT_EQ(current(), "0000017");
    grid->scannerReceive("A18");
    EXPECT_EQ(current(), "0000017") << "a code is not a barcode";
    pelta::fw::services()->host()->setOption("SearchByCodeFirst", Variant(true));
    grid->scannerReceive("A18");
    EXPECT_EQ(current(), "A18");
}

TEST_F(ItemsQuickFindTest, SelectionRecordCarriesListFieldsAndTypedPriceStockFields) {
    items->InitFilter({}, {}, {}, {}, {}, idOf("nom_stores", "Name", "Централен склад"));
    g()->SetMultiSelect(true);
    g()->SetSelectedBookmarks({row("0000002"), row("0000004")});
    Variant current, search, result;
    ASSERT_TRUE(items->ShowSelect(current, search, result));
    auto rs = pelta::Ref<pelta::Recordset>(pelta::query<pelta::Recordset>(result.object()));
    ASSERT_TRUE(rs);
    ASSERT_EQ(rs->recordCount(), 2);
    auto def = [&](const char* name) {
        return rs->fieldDef(static_cast<size_t>(rs->fieldIndex(name)));
    };
    EXPECT_EQ(def("BasePrice").type, pelta::FieldType::Decimal);
    EXPECT_EQ(def("BasePrice").precision, 19);
    EXPECT_EQ(def("BasePrice").scale, 8);
    EXPECT_EQ(def("BasePriceWithVat").precision, 20);
    EXPECT_EQ(def("PriceMeasure_ID").type, pelta::FieldType::Guid);
    EXPECT_EQ(def("PriceMeasureCode").definedSize, 50u);
    EXPECT_EQ(def("IsVat").type, pelta::FieldType::Boolean);
    EXPECT_EQ(def("QuickFindLot").definedSize, 50u);
    EXPECT_GE(rs->fieldIndex("Tag"), 0);
    EXPECT_GE(rs->fieldIndex("BarCodes"), 0) << "every field of the list row";

    rs->moveFirst();
    EXPECT_EQ(rs->value("Code"), Variant("0000002"));
    EXPECT_EQ(norm(rs->value("BasePrice")),
              norm(RetailPrice("0000002", currency("BGN"), measure("бр"))));
    EXPECT_EQ(rs->value("CurrencyCode"), Variant("BGN"));
    EXPECT_EQ(rs->value("SaldoCgStore_ID"), Variant(idOf("nom_stores", "Name", "Централен склад")));
    EXPECT_FALSE(rs->value("StoreSaldo").isNull());

    // The walk over the kept selection positions the list on each row.
    Variant id, name, item;
    ASSERT_TRUE(items->GetNextItem(id, name, item));
    EXPECT_EQ(id, Variant(itemId("0000002")));
    ASSERT_TRUE(items->GetNextItem(id, name, item));
    EXPECT_EQ(id, Variant(itemId("0000004")));
    EXPECT_EQ(g()->CurrentValue("Code"), Variant("0000004"));
    EXPECT_FALSE(items->GetNextItem(id, name, item));
    EXPECT_TRUE(items->Reset());
    EXPECT_FALSE(items->GetNextItem(id, name, item));
    EXPECT_TRUE(g()->SelectedBookmarks().empty());

    // Code and name merged when the site asks for it.
    site->setParameter("MergeItmCodeName", Variant(true));
    row("0000003");
    ASSERT_TRUE(items->ShowSelect(current, search, result));
    rs = pelta::Ref<pelta::Recordset>(pelta::query<pelta::Recordset>(result.object()));
    EXPECT_EQ(rs->value("Name").toString().rfind("[0000003] ", 0), 0u);
}

TEST_F(ItemsQuickFindTest, ItemInfoAndTheCachesInitFilterDrops) {
    pelta::Ref<pelta::Recordset> prices, ratios;
    ASSERT_TRUE(items->GetItemInfo(itemId("0000006"), prices, ratios));
    EXPECT_EQ(prices->recordCount(), 4) << "two currencies, two measures";
    EXPECT_EQ(ratios->recordCount(), 1);
    EXPECT_FALSE(items->GetItemInfo("{00000000-0000-0000-0000-000000000001}", prices, ratios));
    EXPECT_FALSE(items->GetItemInfo("not a key", prices, ratios));

    auto* cache = items->CacheDef();
    (void)cell("0000006", "BasePrice");
    ASSERT_TRUE(cache->IsCached("m_cItemsPrices"));
    ASSERT_TRUE(cache->IsCached("m_cPriceListBmks"));
    // A new currency drops the computed prices; the price follows.
    const std::string eur = currency("EUR");
    items->InitFilter({}, eur, {}, {}, {}, {});
    EXPECT_FALSE(cache->IsCached("m_cItemsPrices"));
    EXPECT_FALSE(cache->IsCached("m_cPriceListBmks"));
    EXPECT_TRUE(cache->IsCached("PriceList")) << "the prices of every currency are there";
    EXPECT_EQ(cell("0000006", "CurrencyCode"), Variant("EUR"));
    EXPECT_EQ(cell("0000006", "BasePrice"), norm(RetailPrice("0000006", eur, measure("бр"))));
    // A new measure drops the ratio positions too.
    (void)cell("0000006", "BasePrice");
    items->InitFilter({}, eur, measure("каш"), {}, {}, {});
    EXPECT_FALSE(cache->IsCached("m_cItemsPrices"));
    EXPECT_FALSE(cache->IsCached("m_cMeasureRatiosBmks"));
    EXPECT_EQ(cell("0000006", "BasePrice"), norm(RetailPrice("0000006", eur, measure("каш"))));
    // The null GUID and the values in use change nothing.
    (void)cell("0000006", "BasePrice");
    const std::string nullGuid = "{00000000-0000-0000-0000-000000000000}";
    items->InitFilter(nullGuid, nullGuid, nullGuid, nullGuid, nullGuid, nullGuid);
    items->InitFilter({}, eur, measure("каш"), {}, {}, {});
    EXPECT_TRUE(cache->IsCached("m_cItemsPrices"));
    // A new price-list type drops the prices themselves and fetches them.
    const std::string wholesale = idOf("nom_pricelisttypes", "Name", "Едро");
    items->InitFilter(wholesale, {}, {}, {}, {}, {});
    EXPECT_EQ(items->PriceListType(), wholesale);
    EXPECT_TRUE(cache->IsCached("PriceList"));
    ASSERT_TRUE(items->GetItemInfo(itemId("0000006"), prices, ratios));
    EXPECT_EQ(prices->recordCount(), 0);
    ASSERT_TRUE(items->GetItemInfo(itemId("0000010"), prices, ratios));
    EXPECT_EQ(prices->recordCount(), 1);
}

TEST_F(ItemsQuickFindTest, ReusedAsASelectorItTakesTheSitesParameters) {
    site->setParameter("MultiSelect", Variant(true))
        .setParameter("QuickFindText", Variant("/000003"))
        .setParameter("CurrentValue", Variant(itemId("0000035")));
    ASSERT_TRUE(pelta::queryRef<IZonListControl>(listObject)->InitClientSite(site.get()));
    EXPECT_TRUE(g()->MultiSelect());
    EXPECT_EQ(items->QuickFilter()->Text(802), "/000003");
    EXPECT_EQ(g()->rowCount(), count("SELECT COUNT(*) FROM nom_items WHERE Code LIKE '%000003%'"));
    EXPECT_EQ(current(), "0000035");
    EXPECT_TRUE(items->InitMedia("{11111111-1111-1111-1111-111111111111}", "x"));
    EXPECT_TRUE(items->InitDimValue("{22222222-2222-2222-2222-222222222222}", "y"));
    ASSERT_TRUE(pelta::queryRef<IZonListControl>(listObject)->InitClientSite(site.get()));
    EXPECT_EQ(items->GetColumnName(0), "DimMedia");
    EXPECT_EQ(items->GetColumnName(1), "Dimensions");
    EXPECT_EQ(items->GetColumnName(2), "");
}

}  // namespace
}  // namespace screentest
