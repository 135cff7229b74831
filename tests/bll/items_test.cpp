// The item operations of the service: the sets of "GetNomItems", deleting
// items, related items, cost centres, the code lists kept on each item and
// the demo catalogue.
#include "bll/items.h"
#include "bll/columnar.h"
#include "bll/operations.h"
#include "bll_support.h"
#include "platform/automation/guid.h"

namespace bll_test {
namespace {

class ItemsBllTest : public BllTest {
protected:
    std::string itemId(const std::string& code) {
        return scalar("SELECT ID FROM nom_items WHERE Code = ?1", {Variant(code)}).toString();
    }
    std::string idOf(const std::string& table, const std::string& name) {
        return scalar("SELECT ID FROM " + table + " WHERE Name = ?1", {Variant(name)}).toString();
    }
    Reply get(pelta::PropertyBag& request) { return call(*admin_, "GetNomItems", &request); }
};

TEST_F(ItemsBllTest, GetNomItemsAnswersTheSetsAskedForOrderedByItem) {
    pelta::PropertyBag request;
    auto all = get(request);
    ASSERT_TRUE(all.success);
    for (const char* set : {"List", "MeasureRatios", "PriceList", "StoreSaldo", "DiscountItems",
                            "CurrencyRatios", "Type", "DimValues", "PriceListType", "Currencies",
                            "Measures", "Store", "DiscountSchema", "Dimensions", "CustomFormats"})
        EXPECT_TRUE(all.has(set)) << set;
    EXPECT_EQ(all.rs("List")->recordCount(), 40);
    // Without a type, the default one: four prices per item.
    EXPECT_EQ(all.get("PriceList_ID"),
              scalar("SELECT Value FROM sys_settings WHERE Name = 'DefPriceList_ID'"));
    auto prices = all.rs("PriceList");
    EXPECT_EQ(prices->recordCount(), 160);
    std::string last;
    for (prices->moveFirst(); !prices->eof(); prices->moveNext()) {
        const std::string item = prices->value("Itm_ID").toString();
        EXPECT_LE(last, item);
        last = item;
    }
    // The national currency is at 1 per 1.
    auto rates = all.rs("CurrencyRatios");
    ASSERT_TRUE(rates->find("Currency_ID = '" + currencyId("BGN") + "'"));
    EXPECT_EQ(rates->value("Rate").toDecimal(), pelta::Decimal(1));
    // The code lists: U+007F before every entry and after the last.
    auto list = all.rs("List");
    ASSERT_TRUE(list->find("Code = '0000002'"));
    const std::string codes = list->value("BarCodes").toString();
    EXPECT_EQ(codes.front(), '\x7F');
    EXPECT_EQ(codes.back(), '\x7F');

    // Only the sets named in "Sets".
    request.writeProperty("Sets", Variant("StoreSaldo;discountitems"));
    request.writeProperty("StoreSaldoCgStore", Variant(idOf("nom_stores", "Магазин")));
    auto some = get(request);
    EXPECT_FALSE(some.has("List"));
    EXPECT_FALSE(some.has("PriceList"));
    EXPECT_EQ(some.rs("StoreSaldo")->recordCount(), 0) << "the shop has no stock";
    EXPECT_EQ(some.rs("DiscountItems")->recordCount(), 0) << "no schema asked for";
    request.writeProperty("Discount_ID", Variant(idOf("nom_discountschemas", "Лоялни клиенти")));
    EXPECT_EQ(get(request).rs("DiscountItems")->recordCount(), 10);
}

TEST_F(ItemsBllTest, AUserWithoutRightsToItemsIsRefused) {
    auto op = pelta::bll::Connection::open(path_, "operator", logger_);
    pelta::PropertyBag request;
    auto r = call(*op, "GetNomItems", &request);
    EXPECT_TRUE(r.success);
    EXPECT_EQ(r.bllError(), 24);
    pelta::PropertyBag del;
    del.writeProperty("ID", Variant(itemId("0000001")));
    EXPECT_EQ(call(*op, "DelNomItems", &del).bllError(), 24);
}

TEST_F(ItemsBllTest, DeletingItemsTakesTheirRowsAndStopsAtComponents) {
    const std::string product = itemId("0000001"), part = itemId("0000002");
    auto ins = admin_->database().prepare(
        "INSERT INTO nom_itemsboms (ID, Itm_ID, Component_ID, Quantity) VALUES (?1, ?2, ?3, 1)");
    ins->bindText(1, pelta::newGuidString());
    ins->bindText(2, product);
    ins->bindText(3, part);
    ins->step();
    const std::string before = dump(path_);
    pelta::PropertyBag request;
    request.writeProperty("ID", Variant(itemId("0000003") + "\x01" + part));
    auto refused = call(*admin_, "DelNomItems", &request);
    EXPECT_EQ(refused.bllError(), 19);
    EXPECT_EQ(refused.get("BllTable"), Variant("nom_itemsboms"));
    EXPECT_EQ(dump(path_), before) << "nothing of a refused delete stays";

    const std::string gone = itemId("0000003");
    request.writeProperty("ID", Variant(gone));
    EXPECT_EQ(call(*admin_, "DelNomItems", &request).bllError(), 0);
    EXPECT_TRUE(scalar("SELECT ID FROM nom_items WHERE Code = '0000003'").isNull());
    EXPECT_EQ(scalar("SELECT COUNT(*) FROM nom_prices WHERE Itm_ID = ?1", {Variant(gone)}).toLong(),
              0);
}

TEST_F(ItemsBllTest, RelatedItemsAreLinkedBothWaysOnce) {
    pelta::PropertyBag request;
    request.writeProperty(
        "ID", Variant(itemId("0000001") + "\x01" + itemId("0000002") + "\x01" + itemId("0000001")));
    request.writeProperty("Type", Variant(1));
    EXPECT_EQ(call(*admin_, "UpdNomItemsSimilar", &request).bllError(), 0);
    EXPECT_EQ(call(*admin_, "UpdNomItemsSimilar", &request).bllError(), 0);
    EXPECT_EQ(scalar("SELECT COUNT(*) FROM nom_itemssimilar").toLong(), 2);
    request.writeProperty("Type", Variant(3));
    EXPECT_FALSE(call(*admin_, "UpdNomItemsSimilar", &request).success);
    request.writeProperty("Type", Variant(2));
    request.writeProperty(
        "ID", Variant(itemId("0000001") + "\x01{00000000-0000-0000-0000-00000000000F}"));
    EXPECT_EQ(call(*admin_, "UpdNomItemsSimilar", &request).bllError(), 19);
}

TEST_F(ItemsBllTest, CostCentresAreMadeOncePerItem) {
    pelta::PropertyBag request;
    request.writeProperty("Itm_ID", Variant(itemId("0000001") + "\x01" + itemId("0000002")));
    request.writeProperty("Type", Variant(1));
    EXPECT_EQ(call(*admin_, "GenerNomItemsCostCenters", &request).bllError(), 0);
    EXPECT_EQ(call(*admin_, "GenerNomItemsCostCenters", &request).bllError(), 0);
    EXPECT_EQ(scalar("SELECT COUNT(*) FROM nom_costcenters WHERE Type = 1").toLong(), 2);
    EXPECT_EQ(scalar("SELECT c.Code FROM nom_items i JOIN nom_costcenters c ON c.ID = "
                     "i.ProjectCC_ID WHERE i.Code = '0000002'"),
              Variant("0000002"));
}

TEST_F(ItemsBllTest, CodeListsAreComposedFromBarcodesAndSupplierCodes) {
    EXPECT_EQ(pelta::bll::composeCodeList({}), "");
    EXPECT_EQ(pelta::bll::composeCodeList({"a", "b"}),
              "\x7F"
              "a\x7F"
              "b\x7F");
    EXPECT_EQ(pelta::bll::barcodePrefix("21ww.wwwc"), "21");
    EXPECT_EQ(pelta::bll::barcodePrefix("3800000000017"), "");
    EXPECT_EQ(pelta::bll::barcodePrefix("21ab"), "");
    const std::string id = itemId("0000005");
    std::vector<std::string> entries;
    auto bar = admin_->database().prepare(
        "SELECT BarCode FROM nom_itemsbarcodes WHERE Itm_ID = ?1 ORDER BY rowid");
    bar->bindText(1, id);
    while (bar->step())
        entries.emplace_back(bar->text(0));
    ASSERT_EQ(entries.size(), 2u);
    entries.push_back("2912345ww.wwwc");
    auto ins = admin_->database().prepare(
        "INSERT INTO nom_itemsbarcodes (ID, Itm_ID, BarCode) VALUES (?1, ?2, ?3)");
    ins->bindText(1, pelta::newGuidString());
    ins->bindText(2, id);
    ins->bindText(3, "2912345ww.wwwc");
    ins->step();
    pelta::bll::refreshItemCodeLists(admin_->database(), id);
    const std::string codes =
        scalar("SELECT BarCodes FROM nom_items WHERE ID = ?1", {Variant(id)}).toString();
    EXPECT_EQ(pelta::bll::composeCodeList(entries), codes);
    EXPECT_EQ(scalar("SELECT BarPrefixes FROM nom_items WHERE ID = ?1", {Variant(id)}),
              Variant(pelta::bll::composeCodeList({"2912345"})));
}

TEST_F(ItemsBllTest, TheDemoCatalogueIsTheSameForTheSameSeed) {
    const std::string other = (dir_ / "again.db").string();
    pelta::bll::DemoOptions o;
    o.banks = 2;
    o.rateDays = 3;
    o.currenciesPerRate = 3;
    pelta::bll::createDemoDatabase(other, o);
    auto checksum = [](const std::string& path) {
        auto db = pelta::bll::openDatabase(path);
        auto st = db->prepare(
            "SELECT group_concat(ID || Code || Name || COALESCE(BarCodes, ''), ',') FROM "
            "(SELECT * FROM nom_items ORDER BY Code)");
        st->step();
        auto p = db->prepare("SELECT SUM(BasePrice), COUNT(*) FROM nom_prices");
        p->step();
        return std::string(st->text(0)) + "|" + std::to_string(p->int64(0)) + "|" +
               std::to_string(p->int64(1));
    };
    EXPECT_EQ(checksum(path_), checksum(other));
}

}  // namespace
}  // namespace bll_test

namespace bll_test {
namespace {

// The rows written straight into the byte form read back as the recordset
// the ordinary reader makes: every field's shape and every value.
TEST_F(ItemsBllTest, ColumnarRowsLoadAsTheSameRecordset) {
    const std::string sql = pelta::bll::findList("ctxItems")->select + " ORDER BY i.Code";
    auto expected = pelta::bll::readRecordset(admin_->database(), sql);
    pelta::PropertyBag bag;
    bag.writeProperty(
        "List", Variant(pelta::ObjectRef(pelta::bll::ColumnarRows::read(admin_->database(), sql))));
    auto back = pelta::PropertyBag::fromContents(bag.contents());
    auto* got = pelta::query<pelta::Recordset>(back->readProperty("List").object());
    ASSERT_NE(got, nullptr);
    ASSERT_EQ(got->fieldCount(), expected->fieldCount());
    ASSERT_EQ(got->recordCount(), expected->recordCount());
    for (size_t f = 0; f < got->fieldCount(); ++f) {
        EXPECT_EQ(got->fieldDef(f).name, expected->fieldDef(f).name);
        EXPECT_EQ(got->fieldDef(f).type, expected->fieldDef(f).type) << got->fieldDef(f).name;
    }
    expected->moveFirst();
    for (got->moveFirst(); !got->eof(); got->moveNext(), expected->moveNext())
        for (size_t f = 0; f < got->fieldCount(); ++f)
            ASSERT_TRUE(got->value(f) == expected->value(f)) << got->fieldDef(f).name;
    // A second write of the same rows is refused rather than empty.
    auto once = pelta::bll::ColumnarRows::read(admin_->database(), "SELECT ID FROM nom_items");
    pelta::Bytes first;
    pelta::ByteWriter w(first);
    once->persist(w);
    EXPECT_THROW(once->persist(w), pelta::Error);
}

}  // namespace
}  // namespace bll_test
