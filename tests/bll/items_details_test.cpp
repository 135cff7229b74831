// One item read and written with its lists: every set goes out and comes
// back, the scales are kept inside what rounding uses, and a refused save
// writes nothing.
#include "bll_support.h"
#include "platform/automation/guid.h"

namespace bll_test {
namespace {

class ItemDetailsBllTest : public BllTest {
protected:
    std::string itemId(const std::string& code) {
        return scalar("SELECT ID FROM nom_items WHERE Code = ?1", {Variant(code)}).toString();
    }
    Reply read(const std::string& id, bool referentials = false) {
        pelta::PropertyBag request;
        request.writeProperty("ID", Variant(id));
        request.writeProperty("Referentials", Variant(referentials));
        return call(*admin_, "GetNomItemsDetails", &request);
    }
    // A save request that sends back every set the read answered.
    Ref<pelta::PropertyBag> saveOf(const Reply& r, const std::string& id) {
        auto request = pelta::makeRef<pelta::PropertyBag>();
        request->writeProperty("ID", Variant(id));
        for (const char* name : kSets)
            request->writeProperty(name, Variant(pelta::ObjectRef(r.rs(name))));
        request->writeProperty("NeedFetch", Variant(false));
        request->writeProperty("NeedList", Variant("ctxItems|ctxPr"));
        return request;
    }

    static constexpr const char* kSets[] = {
        "Head",         "PriceList",        "SupplPrice",   "ItemsMeasures",    "ItemsParts",
        "RatePrices",   "ItemsDimensions",  "BarCodes",     "ItemsCodes",       "ItmMinQuo",
        "ItemsShelves", "ItemsAttachments", "ItemsSimilar", "ItemsPermissions", "ItemMaterialBoms",
        "Boms",         "BomsDetails",      "Activities",   "ItemsPrefSuppl",   "ItemsVariantDef"};
};

TEST_F(ItemDetailsBllTest, EverySetGoesOutAndComesBackWithTheSavedState) {
    const std::string id = itemId("0000001");
    auto r = read(id, true);
    ASSERT_TRUE(r.success);
    EXPECT_EQ(r.bllError(), 0);
    for (const char* name : kSets)
        EXPECT_TRUE(r.rs(name)) << name;
    EXPECT_TRUE(r.rs("ItemLotsSaldo"));
    for (const char* name :
         {"ItemType", "Measure", "PriceListType", "Currency", "Store", "Dimensions", "DimValues",
          "Shelves", "Groups", "Items", "StateActive", "CostCenter", "DutyTariffs", "FinStruct"})
        EXPECT_TRUE(r.rs(name)) << name;
    auto types = r.rs("ItemType");
    ASSERT_TRUE(types->find("IsDef = True"));
    EXPECT_EQ(types->value("Name"), Variant("Стока"));
    EXPECT_TRUE(r.rs("Currency")->find("IsDef = True"));
    const int64_t barcodes = r.rs("BarCodes")->recordCount();
    const int64_t prices = r.rs("PriceList")->recordCount();
    EXPECT_GT(prices, 0);
    EXPECT_FALSE(read(id).has("ItemType")) << "reference sets only when asked";

    // Scales out of range are kept inside what rounding uses; a facet is added.
    auto head = r.rs("Head");
    head->moveFirst();
    head->setValue("VatPriceScale", Variant(12));
    head->setValue("PriceScale", Variant(-3));
    head->setValue("BasicMeasureScale", Variant(9));
    head->update();
    auto facets = r.rs("ItemsMeasures");
    const int64_t hadFacets = facets->recordCount();
    const std::string box = scalar("SELECT ID FROM nom_measures WHERE Code = 'каш'").toString();
    if (!facets->clone()->find("Measure_ID = '" + box + "'")) {
        facets->addNew();
        facets->setValue("ID", Variant(pelta::newGuidString()));
        facets->setValue("Measure_ID", Variant(box));
        facets->setValue("Ratio", Variant(pelta::Decimal(12)));
        facets->update();
    }
    auto saved = call(*admin_, "UpdNomItemsDetails", saveOf(r, id).get());
    ASSERT_TRUE(saved.success);
    ASSERT_EQ(saved.bllError(), 0);
    EXPECT_EQ(scalar("SELECT VatPriceScale FROM nom_items WHERE ID = ?1", {Variant(id)}).toLong(),
              8);
    EXPECT_EQ(scalar("SELECT PriceScale FROM nom_items WHERE ID = ?1", {Variant(id)}).toLong(), 0);
    EXPECT_EQ(
        scalar("SELECT BasicMeasureScale FROM nom_items WHERE ID = ?1", {Variant(id)}).toLong(), 4);
    EXPECT_GE(saved.rs("ItemsMeasures")->recordCount(), hadFacets);
    EXPECT_TRUE(saved.rs("ItemsMeasures")->find("Measure_ID = '" + box + "'"));
    EXPECT_EQ(saved.rs("BarCodes")->recordCount(), barcodes) << "untouched lists stay";
    EXPECT_EQ(saved.rs("PriceList")->recordCount(), prices);
    ASSERT_TRUE(saved.rs("ListResult"));
    EXPECT_EQ(saved.rs("ListResult")->recordCount(), 1);
    EXPECT_EQ(saved.get("ID"), Variant(id));
}

TEST_F(ItemDetailsBllTest, ARefusedSaveWritesNothing) {
    const std::string id = itemId("0000002");
    const std::string other =
        scalar("SELECT Name FROM nom_items WHERE Code = '0000001'").toString();
    auto r = read(id);
    auto head = r.rs("Head");
    head->moveFirst();
    head->setValue("Name", Variant(other));
    head->update();
    auto bars = r.rs("BarCodes");
    bars->addNew();
    bars->setValue("ID", Variant(pelta::newGuidString()));
    bars->setValue("BarCode", Variant("9990000000001"));
    bars->update();
    const std::string before = dump(path_);
    auto refused = call(*admin_, "UpdNomItemsDetails", saveOf(r, id).get());
    EXPECT_EQ(refused.bllError(), 11);
    EXPECT_EQ(refused.get("BllItem"), Variant(other));
    EXPECT_EQ(dump(path_), before);

    // A barcode of another item.
    const std::string taken =
        scalar("SELECT BarCode FROM nom_itemsbarcodes WHERE Itm_ID <> ?1 LIMIT 1", {Variant(id)})
            .toString();
    ASSERT_FALSE(taken.empty());
    head->setValue("Name", Variant("Ново име"));
    head->update();
    bars->setValue("BarCode", Variant(taken));
    bars->update();
    refused = call(*admin_, "UpdNomItemsDetails", saveOf(r, id).get());
    EXPECT_EQ(refused.bllError(), 10);
    EXPECT_FALSE(refused.get("BllBarCode_ID").toString().empty());
    EXPECT_FALSE(refused.get("BllItem").toString().empty());
    EXPECT_EQ(dump(path_), before);

    auto op = pelta::bll::Connection::open(path_, "operator", logger_);
    pelta::PropertyBag request;
    request.writeProperty("ID", Variant(id));
    EXPECT_EQ(call(*op, "GetNomItemsDetails", &request).bllError(), 24);
    EXPECT_EQ(call(*op, "UpdNomItemsDetails", saveOf(r, id).get()).bllError(), 24);
}

}  // namespace
}  // namespace bll_test
