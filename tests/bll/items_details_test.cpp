// One item read and written with its lists: every set goes out and comes
// back, every field the form sends is kept, the items list sees what the
// detail sets wrote, the scales are kept inside what rounding uses, a key of
// another item's row changes nothing, and a refused save writes nothing.
#include "bll/operations.h"
#include "items_support.h"

namespace bll_test {
namespace {

using pelta::Decimal;

TEST_F(ItemDetailsBllTest, EverySetGoesOutAndComesBackWithTheSavedState) {
    const std::string id = itemId("0000001");
    auto r = read(id, true);
    ASSERT_TRUE(r.success);
    EXPECT_EQ(r.bllError(), 0);
    for (const char* name : kSets)
        EXPECT_TRUE(r.rs(name)) << name;
    EXPECT_TRUE(r.rs("ItemLotsSaldo"));
    for (const char* name : {"ItemType", "Measure", "PriceListType", "Currency", "Store",
                             "Dimensions", "DimValues", "Shelves", "Groups", "Items", "StateActive",
                             "CostCenter", "DutyTariffs", "FinStruct", "Intrastat"})
        EXPECT_TRUE(r.rs(name)) << name;
    auto types = r.rs("ItemType");
    ASSERT_TRUE(types->find("IsDef = True"));
    EXPECT_EQ(types->value("Name"), Variant("Стока"));
    EXPECT_TRUE(r.rs("Currency")->find("IsDef = True"));
    EXPECT_TRUE(r.rs("Intrastat")->find("IsDefault = True")) << "the form's default";
    EXPECT_EQ(r.rs("Intrastat")->recordCount(), 3);
    EXPECT_GE(r.rs("DutyTariffs")->recordCount(), 3);
    EXPECT_GE(r.rs("Shelves")->recordCount(), 3);
    EXPECT_TRUE(r.rs("Groups")->find("Name = 'Operators'"));
    // The directions are a tree: some nodes have children, the leaves none.
    auto fin = r.rs("FinStruct");
    ASSERT_GE(fin->recordCount(), 5);
    int inner = 0, leaves = 0;
    for (fin->moveFirst(); !fin->eof(); fin->moveNext()) {
        auto children = fin->clone();
        const bool hasChildren = children->find("P_ID = '" + fin->value("ID").toString() + "'");
        (hasChildren ? inner : leaves) += 1;
    }
    EXPECT_GE(inner, 2);
    EXPECT_GE(leaves, 3);
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
    const std::string metre = measureId("м");
    addRow(*facets, {{"Measure_ID", Variant(metre)},
                     {"RatioPerUnits", Variant(Decimal(1))},
                     {"RatioCoeff", Variant(Decimal(12))}});
    auto saved = save(r, id);
    ASSERT_TRUE(saved.success);
    ASSERT_EQ(saved.bllError(), 0);
    EXPECT_EQ(scalar("SELECT VatPriceScale FROM nom_items WHERE ID = ?1", {Variant(id)}).toLong(),
              8);
    EXPECT_EQ(scalar("SELECT PriceScale FROM nom_items WHERE ID = ?1", {Variant(id)}).toLong(), 0);
    EXPECT_EQ(
        scalar("SELECT BasicMeasureScale FROM nom_items WHERE ID = ?1", {Variant(id)}).toLong(), 4);
    EXPECT_EQ(saved.rs("ItemsMeasures")->recordCount(), hadFacets + 1);
    EXPECT_TRUE(saved.rs("ItemsMeasures")->find("Measure_ID = '" + metre + "'"));
    EXPECT_EQ(saved.rs("BarCodes")->recordCount(), barcodes) << "untouched lists stay";
    EXPECT_EQ(saved.rs("PriceList")->recordCount(), prices);
    ASSERT_TRUE(saved.rs("ListResult"));
    EXPECT_EQ(saved.rs("ListResult")->recordCount(), 1);
    EXPECT_EQ(saved.get("ID"), Variant(id));
}

// Every attribute of the form's grid is kept; the head carries the form's
// names where the list keeps another column, and the names of what the
// selectors point to.
TEST_F(ItemDetailsBllTest, TheHeadKeepsEveryAttributeUnderTheFormsNames) {
    const std::string id = itemId("0000002");
    auto r = read(id, true);
    auto head = r.rs("Head");
    ASSERT_EQ(head->recordCount(), 1);
    for (const char* stored : {"DefCurrency_ID", "RatePrice", "ProjectCC_ID"})
        EXPECT_LT(head->fieldIndex(stored), 0) << stored << " goes by the form's name";

    const std::string other = itemId("0000003"), third = itemId("0000004");
    const std::string partner = scalar("SELECT ID FROM nom_contragents ORDER BY Code").toString();
    const std::string importer =
        scalar("SELECT ID FROM nom_contragents ORDER BY Code DESC").toString();
    const std::string eur = currencyId("EUR");
    const auto cc = [&](int type, const char* code, const char* name) {
        const std::string key = pelta::newGuidString();
        auto st = admin_->database().prepare(
            "INSERT INTO nom_costcenters (ID, Type, Code, Name, IsActive) VALUES (?1, ?2, ?3, ?4, "
            "1)");
        st->bindText(1, key);
        st->bindInt64(2, type);
        st->bindText(3, code);
        st->bindText(4, name);
        st->step();
        return key;
    };
    const std::string structure = cc(2, "S1", "Звено"), project = cc(1, "P1", "Обект"),
                      otherCc = cc(3, "O1", "Друго");
    const auto refId = [&](const char* set, const char* criteria) {
        auto rs = r.rs(set)->clone();
        EXPECT_TRUE(rs->find(criteria)) << set << " " << criteria;
        return rs->value("ID").toString();
    };
    const std::string tariff = refId("DutyTariffs", "Code = '2202'");
    const std::string intrastat = refId("Intrastat", "IsDefault = True");
    const std::string leaf = refId("FinStruct", "Code = '122'");

    const std::vector<std::pair<std::string, Variant>> values = {
        {"Name2", Variant("Second name")},
        {"Currency_ID", Variant(eur)},
        {"SecMeasure_ID", Variant(measureId("каш"))},
        {"PriceMake", Variant(2)},
        {"WeightNeto", Variant(D("1.25"))},
        {"WeightBruto", Variant(D("1.5"))},
        {"VolumeNeto", Variant(D("0.75"))},
        {"VolumeBruto", Variant(D("0.8"))},
        {"BasicMeasureScale", Variant(3)},
        {"VatPriceScale", Variant(4)},
        {"PriceScale", Variant(5)},
        {"SecItm_ID", Variant(other)},
        {"SecMeasure2_ID", Variant(measureId("каш"))},
        {"AccItm_ID", Variant(third)},
        {"IsRatePrice", Variant(true)},
        {"DefRatePrice", Variant(D("4.12345678"))},
        {"WarrantyPeriod", Variant(24)},
        {"WarrantyMeasure", Variant(1)},
        {"LifePeriod", Variant(18)},
        {"LifeMeasure", Variant(1)},
        {"ProducerCg_ID", Variant(partner)},
        {"ImporterCg_ID", Variant(importer)},
        {"Vat", Variant(D("9"))},
        {"Excise", Variant(D("0.5"))},
        {"Ecotax", Variant(D("0.07"))},
        {"DutyTariff_id", Variant(tariff)},
        {"IsVatAllowed", Variant(false)},
        {"Intrastat_ID", Variant(intrastat)},
        {"IntrAddMeasure_ID", Variant(measureId("л"))},
        {"RowsumPrintOnly", Variant(true)},
        {"DefaultLot", Variant("L-0")},
        {"DefaultClass", Variant("I")},
        {"TaxGroup", Variant(3)},
        {"OperatingDetails", Variant("Съхранявайте на сухо")},
        {"LabelText", Variant("Текст за етикет")},
        {"Description", Variant("Описание")},
        {"Kind", Variant("сорт")},
        {"Kind2", Variant("сорт 2")},
        {"Caliber", Variant("калибър")},
        {"Caliber2", Variant("калибър 2")},
        {"Origin", Variant("България")},
        {"Origin2", Variant("Гърция")},
        {"Packing", Variant("кашон")},
        {"Packing2", Variant("палет")},
        {"Permit", Variant("Р-1")},
        {"Concentration", Variant("40%")},
        {"MarginalPriceVat", Variant(D("99.99"))},
        {"PriceGroup", Variant("7")},
        {"CcStruct_ID", Variant(structure)},
        {"CcProject_ID", Variant(project)},
        {"CcOther_ID", Variant(otherCc)},
        {"FinStruct_ID", Variant(leaf)},
        {"MinOrderQuo", Variant(D("12"))},
        {"Priority", Variant(2)},
        {"IsLotRequired", Variant(true)},
        {"IsPacking", Variant(true)},
        {"VariantParentItm_ID", Variant(other)},
    };
    head->moveFirst();
    for (const auto& [name, value] : values) {
        ASSERT_GE(head->fieldIndex(name), 0) << name;
        head->setValue(name, value);
    }
    head->update();
    auto saved = save(r, id);
    ASSERT_EQ(saved.bllError(), 0);
    auto back = read(id).rs("Head");
    back->moveFirst();
    for (const auto& [name, value] : values)
        EXPECT_TRUE(same(back->value(name), value)) << name << ": " << back->value(name).toString();
    // Shown names of the selectors.
    const auto nameOf = [&](const char* table, const std::string& key) {
        return scalar(std::string("SELECT Name FROM ") + table + " WHERE ID = ?1", {Variant(key)});
    };
    EXPECT_EQ(back->value("SecItmName"), nameOf("nom_items", other));
    EXPECT_EQ(back->value("AccItmName"), nameOf("nom_items", third));
    EXPECT_EQ(back->value("VariantParentItmName"), nameOf("nom_items", other));
    EXPECT_EQ(back->value("ProducerCgName"), nameOf("nom_contragents", partner));
    EXPECT_EQ(back->value("ImporterCgName"), nameOf("nom_contragents", importer));
    EXPECT_EQ(back->value("StructureName"), Variant("Звено"));
    EXPECT_EQ(back->value("ProjectName"), Variant("Обект"));
    EXPECT_EQ(back->value("OtherName"), Variant("Друго"));
    // The list reads the stored columns.
    EXPECT_EQ(scalar("SELECT DefCurrency_ID FROM nom_items WHERE ID = ?1", {Variant(id)}),
              Variant(eur));
    EXPECT_EQ(scalar("SELECT ProjectCC_ID FROM nom_items WHERE ID = ?1", {Variant(id)}),
              Variant(project));
    auto row = saved.rs("ListResult");
    ASSERT_EQ(row->recordCount(), 1);
    EXPECT_TRUE(same(row->value("DefCurrency_ID"), Variant(eur)));
    EXPECT_EQ(row->value("ProjectName"), Variant("Обект"));

    // What the service composes is not taken from the head.
    auto again = read(id);
    head = again.rs("Head");
    head->moveFirst();
    const Variant codes = head->value("BarCodes");
    head->setValue("BarCodes", Variant("\x7F"
                                       "forged\x7F"));
    head->setValue("BomCount", Variant(9));
    head->update();
    ASSERT_EQ(save(again, id).bllError(), 0);
    EXPECT_TRUE(same(scalar("SELECT BarCodes FROM nom_items WHERE ID = ?1", {Variant(id)}), codes));
    EXPECT_EQ(scalar("SELECT BomCount FROM nom_items WHERE ID = ?1", {Variant(id)}).toLong(), 0);

    // A link's target going away clears the link.
    pelta::PropertyBag del;
    del.writeProperty("ID", Variant(third));
    ASSERT_EQ(call(*admin_, "DelNomItems", &del).bllError(), 0);
    EXPECT_TRUE(scalar("SELECT AccItm_ID FROM nom_items WHERE ID = ?1", {Variant(id)}).isNull());
}

// The rows of every sub-list: added with every field the form edits, read back
// with the same values, changed and deleted.
TEST_F(ItemDetailsBllTest, EverySubListKeepsWhatTheFormSends) {
    const std::string id = itemId("0000005");
    auto& db = admin_->database();
    const std::string supplierType = pelta::newGuidString();
    {
        auto st = db.prepare(
            "INSERT INTO nom_pricelisttypes (ID, Code, Name, IsActive) VALUES (?1, 'S', 'Доставни "
            "цени', 1)");
        st->bindText(1, supplierType);
        st->step();
        auto set =
            db.prepare("UPDATE sys_settings SET Value = ?1 WHERE Name = 'SupplPriceList_ID'");
        set->bindText(1, supplierType);
        set->step();
    }
    const std::string cc = pelta::newGuidString();
    {
        auto st = db.prepare(
            "INSERT INTO nom_costcenters (ID, Type, Code, Name, IsActive) VALUES (?1, 2, 'W', "
            "'Цех', 1)");
        st->bindText(1, cc);
        st->step();
    }
    const std::string partner = scalar("SELECT ID FROM nom_contragents ORDER BY Code").toString();
    const std::string wholesale = idWhere("nom_pricelisttypes", "Name", "Едро");
    const std::string shelf = idWhere("nom_shelves", "Code", "A-01");
    const std::string shop = idWhere("nom_stores", "Name", "Магазин");
    const std::string group = idWhere("sec_groups", "Name", "Operators");
    const std::string dimension = scalar("SELECT ID FROM nom_dimensions").toString();
    const pelta::Bytes thumb = {0x89, 'P', 'N', 'G', 0, 1, 2};

    struct SetCase {
        const char* set;
        std::vector<std::pair<std::string, Variant>> values;
        std::pair<std::string, Variant> change;
        const char* table;
    };
    const std::vector<SetCase> cases = {
        {"PriceList",
         {{"PriceList_ID", Variant(wholesale)},
          {"Cg_ID", Variant(partner)},
          {"Measure_ID", Variant(measureId("кг"))},
          {"BasePrice", Variant(D("1.23456789"))},
          {"BasePriceWithVat", Variant(D("1.48148147"))},
          {"Currency_ID", Variant(currencyId("EUR"))},
          {"Rate", Variant(D("1.95583"))},
          {"IsVat", Variant(true)},
          {"Note", Variant("бележка")},
          {"IsAutoGener", Variant(false)}},
         {"BasePrice", Variant(D("2.5"))},
         "nom_prices"},
        {"SupplPrice",
         {{"Cg_ID", Variant(partner)},
          {"Measure_ID", Variant(measureId("каш"))},
          {"BasePrice", Variant(D("10.1"))},
          {"BasePriceWithVat", Variant(D("12.12"))},
          {"Currency_ID", Variant(currencyId("BGN"))},
          {"Rate", Variant(D("1"))},
          {"IsVat", Variant(false)},
          {"Note", Variant("доставка")},
          {"IsAutoGener", Variant(true)}},
         {"Note", Variant("друга доставка")},
         "nom_prices"},
        {"ItemsMeasures",
         {{"RatioPerUnits", Variant(D("4"))},
          {"Measure_ID", Variant(measureId("м"))},
          {"RatioCoeff", Variant(D("1"))},
          {"Note", Variant("четвърт")}},
         {"RatioCoeff", Variant(D("3"))},
         "nom_itemsmeasures"},
        {"ItemsParts",
         {{"SeqNo", Variant(1)},
          {"PartItm_ID", Variant(itemId("0000006"))},
          {"Quantity", Variant(D("2.5"))},
          {"Measure_ID", Variant(measureId("бр"))},
          {"GroupName", Variant("Основа")}},
         {"Quantity", Variant(D("3"))},
         "nom_itemsboms"},
        {"RatePrices",
         {{"Cg_ID", Variant(partner)}, {"RatePrice", Variant(D("3.14159265"))}},
         {"RatePrice", Variant(D("2"))},
         "nom_itemsrateprices"},
        {"BarCodes",
         {{"Code", Variant("3809999999996")},
          {"Measure_ID", Variant(measureId("бр"))},
          {"Note", Variant("нов")},
          {"IsDef", Variant(true)},
          {"Type", Variant(1)}},
         {"Note", Variant("стар")},
         "nom_itemsbarcodes"},
        {"ItemsCodes",
         {{"Cg_ID", Variant(partner)},
          {"Code", Variant("V-100")},
          {"Name", Variant("Име при доставчика")},
          {"Measure_ID", Variant(measureId("каш"))}},
         {"Name", Variant("Друго име")},
         "nom_itemssupplcodes"},
        {"ItmMinQuo",
         {{"CgStore_ID", Variant(shop)},
          {"MinQuantity", Variant(D("5"))},
          {"MaxQuantity", Variant(D("50.5"))}},
         {"MaxQuantity", Variant(D("60"))},
         "nom_itemsminquo"},
        {"ItemsShelves",
         {{"Shelf_ID", Variant(shelf)}, {"SeqNo", Variant(2)}, {"Note", Variant("горе")}},
         {"SeqNo", Variant(3)},
         "nom_itemsshelves"},
        {"ItemsAttachments",
         {{"SeqNo", Variant(1)},
          {"MediaFileUrl", Variant("https://example.com/item.png")},
          {"MediaFile_ID", Variant(pelta::newGuidString())},
          {"MediaFileName", Variant("item.png")},
          {"Note", Variant("снимка")},
          {"FolderName", Variant("Снимки")},
          {"IsDef", Variant(true)},
          {"MediaThumbData", Variant(thumb)}},
         {"Note", Variant("друга снимка")},
         "nom_itemsattachments"},
        {"ItemsSimilar",
         {{"LnkItm_ID", Variant(itemId("0000007"))},
          {"LnkType", Variant(2)},
          {"LnkWeight", Variant(7)},
          {"Note", Variant("заедно")},
          {"IsActive", Variant(false)}},
         {"LnkWeight", Variant(8)},
         "nom_itemssimilar"},
        {"ItemsPermissions",
         {{"Group_ID", Variant(group)}, {"AllowPerm", Variant(5)}, {"DenyPerm", Variant(2)}},
         {"DenyPerm", Variant(0)},
         "nom_itemspermissions"},
        {"Activities",
         {{"RowNo", Variant(1)},
          {"Process", Variant("Рязане")},
          {"Activity_ID", Variant(pelta::newGuidString())},
          {"Description", Variant("Рязане на парчета")},
          {"PlanTime", Variant(D("1.5"))},
          {"Price", Variant(D("12.5"))},
          {"CcStruct_ID", Variant(cc)}},
         {"PlanTime", Variant(D("2"))},
         "nom_itemsactivities"},
        {"ItemsPrefSuppl",
         {{"SeqNo", Variant(1)},
          {"Cg_ID", Variant(partner)},
          {"MinQuantity", Variant(D("10"))},
          {"StepQuantity", Variant(D("5"))},
          {"Measure_ID", Variant(measureId("каш"))},
          {"Note", Variant("основен")}},
         {"StepQuantity", Variant(D("6"))},
         "nom_itemsprefsuppl"},
        {"ItemsVariantDef",
         {{"SeqNo", Variant(1)},
          {"Dimension_ID", Variant(dimension)},
          {"DimensionView", Variant(4)},
          {"Note", Variant("по група")}},
         {"DimensionView", Variant(5)},
         "nom_itemsvariantdef"},
    };
    auto rowsIn = [&](const char* table) {
        return scalar(std::string("SELECT COUNT(*) FROM ") + table).toLong();
    };
    std::vector<int64_t> before;
    for (const SetCase& c : cases)
        before.push_back(rowsIn(c.table));

    // Added, all in one save.
    auto r = read(id);
    std::vector<std::string> keys;
    for (const SetCase& c : cases)
        keys.push_back(addRow(*r.rs(c.set), c.values));
    auto saved = save(r, id);
    ASSERT_TRUE(saved.success);
    ASSERT_EQ(saved.bllError(), 0);
    auto back = read(id);
    for (size_t i = 0; i < cases.size(); ++i) {
        auto rs = back.rs(cases[i].set);
        ASSERT_TRUE(seek(*rs, keys[i])) << cases[i].set;
        for (const auto& [name, value] : cases[i].values)
            EXPECT_TRUE(same(rs->value(name), value)) << cases[i].set << "." << name;
        EXPECT_TRUE(same(rs->value("Itm_ID"), Variant(id))) << cases[i].set;
        EXPECT_FALSE(rs->value("CD").isNull()) << cases[i].set;
        EXPECT_TRUE(same(rs->value("CU"), Variant(admin_->CurrentUserID()))) << cases[i].set;
    }
    // What the form names otherwise is stored under the list's columns.
    EXPECT_TRUE(same(back.rs("SupplPrice")->value("PriceList_ID"), Variant(supplierType)))
        << "supplier prices are of the supplier type";
    EXPECT_EQ(
        scalar("SELECT Ratio FROM nom_itemsmeasures WHERE ID = ?1", {Variant(keys[2])}).toString(),
        "250000")
        << "one metre is a quarter of the base measure";
    EXPECT_EQ(
        scalar("SELECT COUNT(*) FROM nom_itemsbarcodes WHERE BarCode = '3809999999996'").toLong(),
        1);
    EXPECT_EQ(back.rs("ItemsSimilar")->value("ItemCode"), Variant("0000007"));
    EXPECT_FALSE(back.rs("ItemsParts")->value("ItemName").toString().empty());

    // Changed.
    for (size_t i = 0; i < cases.size(); ++i) {
        auto rs = back.rs(cases[i].set);
        ASSERT_TRUE(seek(*rs, keys[i]));
        rs->setValue(cases[i].change.first, cases[i].change.second);
        rs->update();
    }
    ASSERT_EQ(save(back, id).bllError(), 0);
    auto changed = read(id);
    for (size_t i = 0; i < cases.size(); ++i) {
        auto rs = changed.rs(cases[i].set);
        ASSERT_TRUE(seek(*rs, keys[i])) << cases[i].set;
        EXPECT_TRUE(same(rs->value(cases[i].change.first), cases[i].change.second))
            << cases[i].set << "." << cases[i].change.first;
        for (const auto& [name, value] : cases[i].values) {
            if (name == cases[i].change.first) continue;
            EXPECT_TRUE(same(rs->value(name), value)) << cases[i].set << "." << name;
        }
    }
    EXPECT_EQ(
        scalar("SELECT Ratio FROM nom_itemsmeasures WHERE ID = ?1", {Variant(keys[2])}).toString(),
        "750000");

    // Deleted.
    for (size_t i = 0; i < cases.size(); ++i) {
        auto rs = changed.rs(cases[i].set);
        ASSERT_TRUE(seek(*rs, keys[i]));
        rs->deleteRecord();
    }
    ASSERT_EQ(save(changed, id).bllError(), 0);
    auto gone = read(id);
    for (size_t i = 0; i < cases.size(); ++i) {
        EXPECT_FALSE(seek(*gone.rs(cases[i].set), keys[i])) << cases[i].set;
        EXPECT_EQ(rowsIn(cases[i].table), before[i]) << cases[i].table;
    }
}

// Facets are kept as the form enters them; the list's ratio follows exactly,
// and a client that changes only the ratio still changes the facet.
TEST_F(ItemDetailsBllTest, TheListSeesPricesRatiosAndBarcodesWrittenThroughTheDetails) {
    const std::string id = itemId("0000008");
    const std::string type =
        scalar("SELECT Value FROM sys_settings WHERE Name = 'DefPriceList_ID'").toString();
    const std::string bgn = currencyId("BGN"), litre = measureId("л"), metre = measureId("м");
    auto r = read(id);
    addRow(*r.rs("ItemsMeasures"), {{"Measure_ID", Variant(litre)},
                                    {"RatioPerUnits", Variant(D("3"))},
                                    {"RatioCoeff", Variant(D("2"))}});
    addRow(*r.rs("ItemsMeasures"), {{"Measure_ID", Variant(metre)},
                                    {"RatioPerUnits", Variant(D("8"))},
                                    {"RatioCoeff", Variant(D("1"))}});
    addRow(*r.rs("PriceList"), {{"PriceList_ID", Variant(type)},
                                {"Measure_ID", Variant(litre)},
                                {"Currency_ID", Variant(bgn)},
                                {"BasePrice", Variant(D("7.77"))},
                                {"BasePriceWithVat", Variant(D("9.324"))}});
    addRow(*r.rs("BarCodes"), {{"Code", Variant("2345678ww.wwwc")}, {"Type", Variant(-1)}});
    ASSERT_EQ(save(r, id).bllError(), 0);

    pelta::PropertyBag request;
    auto list = call(*admin_, "GetNomItems", &request);
    auto ratios = list.rs("MeasureRatios");
    ratios->setFilter("Itm_ID = '" + id + "'");
    ASSERT_TRUE(ratios->find("Measure_ID = '" + litre + "'"));
    EXPECT_EQ(ratios->value("Ratio").toDecimal(), D("0.666667")) << "2/3 to the list's scale";
    ASSERT_TRUE(ratios->find("Measure_ID = '" + metre + "'"));
    EXPECT_EQ(ratios->value("Ratio").toDecimal(), D("0.125")) << "1/8 exactly";
    auto prices = list.rs("PriceList");
    prices->setFilter("Itm_ID = '" + id + "' AND Measure_ID = '" + litre + "'");
    ASSERT_EQ(prices->recordCount(), 1);
    EXPECT_EQ(prices->value("BasePrice").toDecimal(), D("7.77"));
    auto items = list.rs("List");
    ASSERT_TRUE(items->find("ID = '" + id + "'"));
    EXPECT_NE(items->value("BarCodes")
                  .toString()
                  .find("\x7F"
                        "2345678ww.wwwc\x7F"),
              std::string::npos);
    EXPECT_NE(items->value("BarPrefixes").toString().find("2345678"), std::string::npos);

    // A client that knows only the ratio.
    auto again = read(id);
    auto facets = again.rs("ItemsMeasures");
    ASSERT_TRUE(facets->find("Measure_ID = '" + metre + "'"));
    facets->setValue("Ratio", Variant(D("2.5")));
    facets->update();
    ASSERT_EQ(save(again, id).bllError(), 0);
    auto now = read(id).rs("ItemsMeasures");
    ASSERT_TRUE(now->find("Measure_ID = '" + metre + "'"));
    EXPECT_EQ(now->value("RatioPerUnits").toDecimal(), Decimal(1));
    EXPECT_EQ(now->value("RatioCoeff").toDecimal(), D("2.5"));
    EXPECT_EQ(now->value("Ratio").toDecimal(), D("2.5"));
    EXPECT_TRUE(same(now->value("DefMeasure_ID"),
                     scalar("SELECT Measure_ID FROM nom_items WHERE ID = ?1", {Variant(id)})));
}

// The group is the item's DimValue_ID (the row keyed by the item); values of
// other dimensions are rows of their own; the categories the list filters
// by follow both.
TEST_F(ItemDetailsBllTest, DimensionValuesKeepTheGroupAndTheOtherValues) {
    const std::string id = itemId("0000009");
    auto& db = admin_->database();
    const std::string colours = pelta::newGuidString(), red = pelta::newGuidString();
    {
        auto d =
            db.prepare("INSERT INTO nom_dimensions (ID, Name, IsActive) VALUES (?1, 'Цвят', 1)");
        d->bindText(1, colours);
        d->step();
        auto v = db.prepare(
            "INSERT INTO nom_dimvalues (ID, Dimension_ID, Name, FullName, IsActive) VALUES (?1, "
            "?2, 'Червен', 'Цвят\\Червен', 1)");
        v->bindText(1, red);
        v->bindText(2, colours);
        v->step();
    }
    const std::string drinks = idWhere("nom_dimvalues", "Name", "Напитки");
    auto r = read(id);
    auto dims = r.rs("ItemsDimensions");
    ASSERT_EQ(dims->recordCount(), 1);
    dims->moveFirst();
    EXPECT_EQ(dims->value("ID").toString(), id) << "the group is keyed by the item";
    dims->setValue("ListValue_ID", Variant(drinks));
    dims->update();
    const std::string colourRow = addRow(*dims, {{"ListValue_ID", Variant(red)}});
    ASSERT_EQ(save(r, id).bllError(), 0);
    EXPECT_EQ(scalar("SELECT DimValue_ID FROM nom_items WHERE ID = ?1", {Variant(id)}),
              Variant(drinks));
    auto back = read(id);
    dims = back.rs("ItemsDimensions");
    ASSERT_EQ(dims->recordCount(), 2);
    ASSERT_TRUE(seek(*dims, colourRow));
    EXPECT_EQ(dims->value("Dimension_ID"), Variant(colours)) << "the dimension follows the value";
    EXPECT_EQ(scalar("SELECT Categories FROM nom_items WHERE ID = ?1", {Variant(id)}).toString(),
              "\x7F" + drinks + "\x7F" + red + "\x7F");
    EXPECT_EQ(back.rs("Head")->value("DimValue_ID"), Variant(drinks));

    // The group taken away and given again as a new row.
    ASSERT_TRUE(seek(*dims, id));
    dims->deleteRecord();
    const std::string food = idWhere("nom_dimvalues", "Name", "Храни");
    addRow(*dims, {{"Dimension_ID",
                    scalar("SELECT Value FROM sys_settings WHERE Name = 'DefItmDimension_ID'")},
                   {"ListValue_ID", Variant(food)}});
    ASSERT_EQ(save(back, id).bllError(), 0);
    EXPECT_EQ(scalar("SELECT DimValue_ID FROM nom_items WHERE ID = ?1", {Variant(id)}),
              Variant(food));
    EXPECT_EQ(
        scalar("SELECT COUNT(*) FROM nom_itemsdimvalues WHERE Itm_ID = ?1", {Variant(id)}).toLong(),
        1);
    // A value that is nowhere is refused and nothing stays.
    auto last = read(id);
    addRow(*last.rs("ItemsDimensions"), {{"ListValue_ID", Variant(pelta::newGuidString())}});
    const std::string snapshot = dump(path_);
    auto refused = save(last, id);
    EXPECT_EQ(refused.bllError(), 19);
    EXPECT_EQ(refused.get("BllTable"), Variant("nom_dimvalues"));
    EXPECT_EQ(dump(path_), snapshot);
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
    addRow(*bars, {{"Code", Variant("9990000000001")}});
    addRow(*r.rs("ItemsShelves"),
           {{"Shelf_ID", Variant(idWhere("nom_shelves", "Code", "A-02"))}, {"SeqNo", Variant(1)}});
    const std::string before = dump(path_);
    auto refused = save(r, id);
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
    bars->moveLast();
    bars->setValue("Code", Variant(taken));
    bars->update();
    refused = save(r, id);
    EXPECT_EQ(refused.bllError(), 10);
    EXPECT_FALSE(refused.get("BllBarCode_ID").toString().empty());
    EXPECT_FALSE(refused.get("BllItem").toString().empty());
    EXPECT_EQ(dump(path_), before);

    // A row of a sub-list that breaks a rule of its own, after everything
    // else was written.
    bars->setValue("Code", Variant("9990000000001"));
    bars->update();
    auto minQuo = r.rs("ItmMinQuo");
    const std::string store = idWhere("nom_stores", "Code", "1");
    addRow(*minQuo, {{"CgStore_ID", Variant(store)},
                     {"MinQuantity", Variant(D("1"))},
                     {"MaxQuantity", Variant(D("2"))}});
    addRow(*minQuo, {{"CgStore_ID", Variant(store)},
                     {"MinQuantity", Variant(D("3"))},
                     {"MaxQuantity", Variant(D("4"))}});
    refused = save(r, id);
    EXPECT_EQ(refused.bllError(), 20);
    EXPECT_EQ(refused.get("BllTable"), Variant("nom_itemsminquo"));
    EXPECT_EQ(dump(path_), before);

    auto op = pelta::bll::Connection::open(path_, "operator", logger_);
    pelta::PropertyBag request;
    request.writeProperty("ID", Variant(id));
    EXPECT_EQ(call(*op, "GetNomItemsDetails", &request).bllError(), 24);
    EXPECT_EQ(call(*op, "UpdNomItemsDetails", saveOf(r, id).get()).bllError(), 24);
}

// A row sent as changed or deleted under the key of another item's row is
// not that row: the save is refused as a change by someone else.
TEST_F(ItemDetailsBllTest, AKeyOfAnotherItemsRowChangesNothing) {
    const std::string mine = itemId("0000010"), theirs = itemId("0000011");
    const std::string theirPrice =
        scalar("SELECT ID FROM nom_prices WHERE Itm_ID = ?1 LIMIT 1", {Variant(theirs)}).toString();
    ASSERT_FALSE(theirPrice.empty());
    auto r = read(mine);
    // A forged set: the other item's price row, read as if it were ours.
    auto forged = pelta::bll::readRecordset(
        admin_->database(),
        "SELECT ID, Itm_ID, PlType_ID AS PriceList_ID, Cg_ID, Measure_ID, BasePrice, "
        "BasePriceWithVat, Currency_ID, Rate, IsVat, Note, IsAutoGener, CU, CD, LU, LD "
        "FROM nom_prices WHERE ID = ?1",
        std::vector<Variant>{Variant(theirPrice)});
    forged->moveFirst();
    forged->setValue("BasePrice", Variant(D("0.01")));
    forged->update();
    auto request = saveOf(r, mine);
    request->writeProperty("PriceList", Variant(pelta::ObjectRef(forged)));
    const std::string before = dump(path_);
    auto refused = call(*admin_, "UpdNomItemsDetails", request.get());
    EXPECT_EQ(refused.bllError(), 18);
    EXPECT_EQ(refused.get("BllRowID"), Variant(theirPrice));
    EXPECT_EQ(dump(path_), before);

    forged->cancelBatch();
    forged->moveFirst();
    forged->deleteRecord();
    request->writeProperty("PriceList", Variant(pelta::ObjectRef(forged)));
    EXPECT_EQ(call(*admin_, "UpdNomItemsDetails", request.get()).bllError(), 18);
    EXPECT_EQ(dump(path_), before);
}

}  // namespace
}  // namespace bll_test
