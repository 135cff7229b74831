// Prices the service forms for items: the rounding of formed prices, the
// proposals of generated price lists, bills of materials (their rows, names
// and recalculated prices) and the lots of items in the stores.
#include "bll/operations.h"
#include "bll/pricing.h"
#include "items_support.h"

namespace bll_test {
namespace {

using pelta::Decimal;
using pelta::bll::roundFormedPrice;
using pelta::bll::RoundType;

Decimal D(const char* text) {
    return Decimal::parse(text).value();
}

TEST(FormedPriceRounding, StepsEndingsDirectionsAndTheVatRoundTrip) {
    const RoundType fives{5, 0, 1, false};
    EXPECT_EQ(roundFormedPrice(D("10.01"), fives, D("20"), 2), D("10.05"));
    EXPECT_EQ(roundFormedPrice(D("10.01"), {5, 0, 2, false}, D("20"), 2), D("10.00"));
    EXPECT_EQ(roundFormedPrice(D("10.02"), {5, 0, 3, false}, D("20"), 2), D("10.00"));
    EXPECT_EQ(roundFormedPrice(D("10.03"), {5, 0, 3, false}, D("20"), 2), D("10.05"));
    EXPECT_EQ(roundFormedPrice(D("10.05"), fives, D("20"), 2), D("10.05")) << "on a step stays";
    // Prices ending in .99.
    EXPECT_EQ(roundFormedPrice(D("12.30"), {100, 99, 1, false}, D("0"), 2), D("12.99"));
    EXPECT_EQ(roundFormedPrice(D("12.30"), {100, 99, 2, false}, D("0"), 2), D("11.99"));
    // Steps of 0.50 on the price with VAT.
    const RoundType halves{50, 0, 1, true};
    EXPECT_EQ(roundFormedPrice(D("10.00"), halves, D("20"), 2), D("10.00"));
    EXPECT_EQ(roundFormedPrice(D("10.10"), halves, D("20"), 2), D("10.41666667"));
    // A negative modulo divides the last decimal.
    EXPECT_EQ(roundFormedPrice(D("10.001"), {-2, 0, 1, false}, D("20"), 2), D("10.005"));
    // Without steps only the eight decimals, and the VAT round trip.
    EXPECT_EQ(roundFormedPrice(D("1.234567891"), {}, D("20"), 2), D("1.23456789"));
    EXPECT_EQ(roundFormedPrice(D("1.234"), {0, 0, 1, true}, D("20"), 2), D("1.23333333"));
    // Negative prices go down and up as numbers do.
    EXPECT_EQ(roundFormedPrice(D("-10.01"), fives, D("20"), 2), D("-10.00"));
    EXPECT_EQ(roundFormedPrice(D("-10.01"), {5, 0, 2, false}, D("20"), 2), D("-10.05"));
}

class PricingBllTest : public ItemDetailsBllTest {
protected:
    std::string addType(const char* code, const char* name, bool generated, int kind,
                        const std::string& parent, const std::string& round, bool active = true) {
        const std::string id = pelta::newGuidString();
        auto st = admin_->database().prepare(
            "INSERT INTO nom_pricelisttypes (ID, Code, Name, IsActive, IsAutoGener, "
            "PriceFormType, ParentPlType_ID, RoundType_ID) VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?7, "
            "?8)");
        st->bindText(1, id);
        st->bindText(2, code);
        st->bindText(3, name);
        st->bindInt64(4, active);
        st->bindInt64(5, generated);
        st->bindInt64(6, kind);
        st->bind(7, parent.empty() ? Variant::null() : Variant(parent));
        st->bind(8, round.empty() ? Variant::null() : Variant(round));
        st->step();
        return id;
    }
    void markup(const std::string& type, const std::string& value, const char* a,
                const char* b = "0") {
        auto st = admin_->database().prepare(
            "INSERT INTO nom_pricelistdimvalues (ID, PriceListType_ID, ListValue_ID, "
            "CoefficientA, CoefficientB) VALUES (?1, ?2, ?3, ?4, ?5)");
        const pelta::bll::ColumnType price = pelta::bll::ColumnType::parse("DECIMAL(18,8)").value();
        st->bindText(1, pelta::newGuidString());
        st->bindText(2, type);
        st->bind(3, value.empty() ? Variant::null() : Variant(value));
        st->bind(4, Variant(D(a)), price);
        st->bind(5, Variant(D(b)), price);
        st->step();
    }
    Reply propose(const std::string& type, const char* price, const std::string& item,
                  const std::string& measure, const Variant& vat, Ref<pelta::Recordset> dims = {}) {
        pelta::PropertyBag request;
        request.writeProperty("PriceListType", Variant(type));
        request.writeProperty("Price", Variant(D(price)));
        request.writeProperty("Itm_ID", Variant(item));
        request.writeProperty("Measure", Variant(measure));
        request.writeProperty("VAT", vat);
        if (dims) request.writeProperty("ItemsDimensions", Variant(pelta::ObjectRef(dims)));
        return call(*admin_, "GetNomItemPlProposal", &request);
    }
    // The proposed row of a type, or null.
    static Ref<pelta::Recordset> rowOf(const Reply& r, const std::string& type) {
        auto rs = r.rs("List")->clone();
        if (rs->recordCount() == 0 || !rs->find("PriceList_ID = '" + type + "'")) return {};
        return rs;
    }
};

// Generated price lists formed on the one whose price was entered propose
// their prices: the mark-up in force (the item's own, its group's or the
// nearest group above, or the one for everything), rounded by their round
// type; lists generated from those follow; others are not proposed.
TEST_F(PricingBllTest, GeneratedPriceListsProposeTheirPrices) {
    const std::string retail =
        scalar("SELECT Value FROM sys_settings WHERE Name = 'DefPriceList_ID'").toString();
    const std::string tenths = idWhere("nom_roundtypes", "Name", "Нагоре до 0.10");
    const std::string nines = idWhere("nom_roundtypes", "Name", "Цени .99 с ДДС");
    const std::string online = addType("O", "Онлайн", true, 3, retail, tenths);
    const std::string market = addType("M", "Маркетплейс", true, 3, online, nines);
    const std::string manual = addType("R", "Ръчна", false, 3, retail, "");
    const std::string idle = addType("I", "Спряна", true, 3, retail, "", false);
    const std::string supplier = addType("S", "Доставни", false, 1, "", "");
    const std::string fromDelivery = addType("D", "От доставка", true, 1, "", "");
    {
        auto st = admin_->database().prepare(
            "UPDATE sys_settings SET Value = ?1 WHERE Name = 'SupplPriceList_ID'");
        st->bindText(1, supplier);
        st->step();
    }
    const std::string drinks = idWhere("nom_dimvalues", "Name", "Напитки");
    const std::string juices = pelta::newGuidString();
    {
        auto st = admin_->database().prepare(
            "INSERT INTO nom_dimvalues (ID, Dimension_ID, Name, FullName, IsActive) SELECT ?1, "
            "Dimension_ID, 'Сокове', FullName || '\\Сокове', 1 FROM nom_dimvalues WHERE ID = ?2");
        st->bindText(1, juices);
        st->bindText(2, drinks);
        st->step();
    }
    for (const auto& t : {online, manual, idle})
        markup(t, "", "10");
    markup(online, drinks, "15");
    markup(fromDelivery, "", "25");
    // Nothing for everything in the market place: only its own mark-up of
    // one item applies.
    const std::string food = idWhere("nom_dimvalues", "Name", "Храни");
    const std::string item =
        scalar("SELECT ID FROM nom_items WHERE DimValue_ID = ?1 AND Vat = 200000 ORDER BY Code",
               {Variant(food)})
            .toString();
    ASSERT_FALSE(item.empty());
    const std::string piece =
        scalar("SELECT Measure_ID FROM nom_items WHERE ID = ?1", {Variant(item)}).toString();
    {
        auto st = admin_->database().prepare(
            "INSERT INTO nom_pricelistitems (ID, PriceListType_ID, Itm_ID, Measure_ID, "
            "CoefficientA, CoefficientB) VALUES (?1, ?2, ?3, ?4, 0, 100000000)");
        st->bindText(1, pelta::newGuidString());
        st->bindText(2, market);
        st->bindText(3, item);
        st->bindText(4, piece);
        st->step();
    }
    const Variant currency =
        scalar("SELECT DefCurrency_ID FROM nom_items WHERE ID = ?1", {Variant(item)});

    auto r = propose(retail, "12.34", item, piece, Variant(D("20")));
    ASSERT_TRUE(r.success);
    ASSERT_EQ(r.bllError(), 0);
    EXPECT_EQ(r.rs("List")->recordCount(), 2) << "the manual, idle and delivery lists not";
    auto row = rowOf(r, online);
    ASSERT_TRUE(row);
    // 12.34 x 1.10 = 13.574, up to the next ten stotinki.
    EXPECT_EQ(row->value("BasePrice").toDecimal(), D("13.60"));
    EXPECT_EQ(row->value("BasePriceWithVat").toDecimal(), D("16.32"));
    EXPECT_TRUE(same(row->value("ParentPlType_ID"), Variant(retail)));
    EXPECT_TRUE(row->value("IsAutoGener").toBool());
    EXPECT_FALSE(row->value("IsVat").toBool());
    EXPECT_TRUE(same(row->value("Measure_ID"), Variant(piece)));
    EXPECT_TRUE(same(row->value("Itm_ID"), Variant(item)));
    EXPECT_TRUE(same(row->value("Currency_ID"), currency));
    EXPECT_EQ(row->value("CoefficientA").toDecimal(), D("10"));
    // From the online price: 13.60 + 1 = 14.60, 17.52 with VAT, up to .99:
    // 17.99 with VAT.
    row = rowOf(r, market);
    ASSERT_TRUE(row);
    EXPECT_EQ(row->value("BasePrice").toDecimal(), D("14.99166667"));
    EXPECT_EQ(row->value("BasePriceWithVat").toDecimal(), D("17.99"));
    EXPECT_TRUE(same(row->value("ParentPlType_ID"), Variant(online)));

    // The form's dimension values stand for the stored ones; a value without
    // a mark-up of its own takes the one of the value above it.
    auto dims = pelta::bll::readRecordset(
        admin_->database(),
        "SELECT ID, ID AS Itm_ID, Dimension_ID, ID AS ListValue_ID FROM nom_dimvalues WHERE ID = "
        "?1",
        std::vector<Variant>{Variant(juices)});
    r = propose(retail, "12.34", item, piece, Variant(D("20")), dims);
    row = rowOf(r, online);
    ASSERT_TRUE(row);
    // 12.34 x 1.15 = 14.191.
    EXPECT_EQ(row->value("BasePrice").toDecimal(), D("14.20"));
    EXPECT_EQ(row->value("CoefficientA").toDecimal(), D("15"));

    // A price that includes VAT: no VAT is added or taken away.
    r = propose(retail, "12.34", item, piece, Variant(true));
    row = rowOf(r, online);
    ASSERT_TRUE(row);
    EXPECT_EQ(row->value("BasePrice").toDecimal(), D("13.60"));
    EXPECT_EQ(row->value("BasePriceWithVat").toDecimal(), D("13.60"));
    EXPECT_TRUE(row->value("IsVat").toBool());
    row = rowOf(r, market);
    ASSERT_TRUE(row);
    EXPECT_EQ(row->value("BasePrice").toDecimal(), D("14.99"));

    // The supplier's price proposes the lists generated on delivery prices.
    r = propose(supplier, "8", item, piece, Variant(D("20")));
    EXPECT_EQ(r.rs("List")->recordCount(), 1);
    row = rowOf(r, fromDelivery);
    ASSERT_TRUE(row);
    EXPECT_EQ(row->value("BasePrice").toDecimal(), D("10"));
    EXPECT_EQ(row->value("BasePriceWithVat").toDecimal(), D("12"));

    // Nothing to propose without a price or a type; the operator may not ask.
    EXPECT_EQ(propose(manual, "5", item, piece, Variant(D("20"))).rs("List")->recordCount(), 0);
    pelta::PropertyBag empty;
    auto none = call(*admin_, "GetNomItemPlProposal", &empty);
    ASSERT_TRUE(none.success);
    EXPECT_EQ(none.rs("List")->recordCount(), 0);
    auto op = pelta::bll::Connection::open(path_, "operator", logger_);
    EXPECT_EQ(call(*op, "GetNomItemPlProposal", &empty).bllError(), 24);
}

TEST_F(PricingBllTest, LotsAreReadWithTheirStoresQuantities) {
    // The demo keeps two lots of each of the last six items.
    const std::string id = itemId("0000040"), next = itemId("0000039");
    pelta::PropertyBag request;
    request.writeProperty("Itm_ID", Variant(id));
    auto r = call(*admin_, "GetNomItemsLotsSaldo", &request);
    ASSERT_EQ(r.bllError(), 0);
    auto lots = r.rs("ItemLotsSaldo");
    ASSERT_EQ(lots->recordCount(), 2);
    for (const char* f :
         {"Lot", "ExpiryDate", "DeliveryDate", "OriginCountryName", "VendorLot", "CgStoreName",
          "LotStoreSaldo", "MeasureCode", "StoreSaldo", "StoreReserved", "StoreAvailable",
          "PriceAvg", "PriceAvgB_DifferentFromZero", "CurrencyCode"})
        EXPECT_GE(lots->fieldIndex(f), 0) << f;
    const Decimal quantity =
        scalar("SELECT Quantity FROM nom_storesaldo WHERE Itm_ID = ?1", {Variant(id)}).toDecimal() /
        Decimal(1000000);
    const Decimal reserved =
        scalar("SELECT QuantityReserved FROM nom_storesaldo WHERE Itm_ID = ?1", {Variant(id)})
            .toDecimal() /
        Decimal(1000000);
    for (lots->moveFirst(); !lots->eof(); lots->moveNext()) {
        EXPECT_EQ(lots->value("CgStoreName"), Variant("Централен склад"));
        EXPECT_EQ(lots->value("CurrencyCode"), Variant("BGN"));
        EXPECT_EQ(lots->value("StoreSaldo").toDecimal(), quantity);
        EXPECT_EQ(lots->value("StoreReserved").toDecimal(), reserved);
        EXPECT_EQ(lots->value("StoreAvailable").toDecimal(), quantity - reserved);
        EXPECT_EQ(lots->value("ExpiryDate").type(), pelta::VarType::Date);
        const Variant stored =
            scalar("SELECT Quantity FROM nom_itemlots WHERE Itm_ID = ?1 AND Lot = ?2",
                   {Variant(id), lots->value("Lot")});
        EXPECT_EQ(lots->value("LotStoreSaldo").toDecimal(), stored.toDecimal() / Decimal(1000000));
    }
    lots->moveFirst();
    EXPECT_EQ(lots->value("Lot"), Variant("L001-1"));
    EXPECT_TRUE(lots->value("PriceAvgB_DifferentFromZero").isNull()) << "no price before it";
    EXPECT_FALSE(lots->value("PriceAvg").isNull());

    // Several items; one store; the item's details carry them too.
    request.writeProperty("Itm_ID", Variant(id + "\x01" + next));
    EXPECT_EQ(call(*admin_, "GetNomItemsLotsSaldo", &request).rs("ItemLotsSaldo")->recordCount(),
              4);
    request.writeProperty("CgStore", Variant(idWhere("nom_stores", "Name", "Магазин")));
    EXPECT_EQ(call(*admin_, "GetNomItemsLotsSaldo", &request).rs("ItemLotsSaldo")->recordCount(),
              0);
    EXPECT_EQ(read(id).rs("ItemLotsSaldo")->recordCount(), 2);
    EXPECT_EQ(read(itemId("0000001")).rs("ItemLotsSaldo")->recordCount(), 0);
    auto op = pelta::bll::Connection::open(path_, "operator", logger_);
    EXPECT_EQ(call(*op, "GetNomItemsLotsSaldo", &request).bllError(), 24);
}

class BomsBllTest : public PricingBllTest {
protected:
    void SetUp() override {
        PricingBllTest::SetUp();
        product = itemId("0000012");
        for (const char* code : {"0000013", "0000014", "0000015"}) {
            parts.push_back(itemId(code));
            base.push_back(
                scalar("SELECT Measure_ID FROM nom_items WHERE Code = ?1", {Variant(code)})
                    .toString());
        }
    }
    // A new bill with rows of {part, measure, quantity, price or ""}.
    struct Line {
        size_t part;
        std::string measure;
        const char* quantity;
        const char* price;
    };
    std::string addBill(const Reply& r, const char* name, const char* quantity,
                        const std::vector<Line>& lines) {
        const std::string bill = addRow(*r.rs("Boms"), {{"Name", Variant(name)},
                                                        {"Quantity", Variant(D(quantity))},
                                                        {"IsActive", Variant(true)},
                                                        {"IsDefault", Variant(true)}});
        int no = 0;
        for (const Line& l : lines) {
            std::vector<std::pair<std::string, Variant>> values = {
                {"Bom_ID", Variant(bill)},
                {"Itm_ID", Variant(parts[l.part])},
                {"RowNo", Variant(++no)},
                {"Measure_ID", Variant(l.measure)},
                {"Quantity", Variant(D(l.quantity))}};
            if (*l.price) values.emplace_back("Price", Variant(D(l.price)));
            addRow(*r.rs("BomsDetails"), values);
        }
        return bill;
    }

    std::string product;
    std::vector<std::string> parts, base;
};

// A bill's row is priced from its component: the standard price, else the
// stores' weighted average, in the row's measure; a component without either
// keeps the row's price. Totals are the exact products and sums.
TEST_F(BomsBllTest, BillPricesAreRecalculatedExactly) {
    auto& db = admin_->database();
    const pelta::bll::ColumnType price = pelta::bll::ColumnType::parse("DECIMAL(18,8)").value();
    {
        auto st = db.prepare("UPDATE nom_items SET RatePrice = ?2 WHERE ID = ?1");
        st->bindText(1, parts[0]);
        st->bind(2, Variant(D("1.23456789")), price);
        st->step();
        auto saldo =
            db.prepare("UPDATE nom_storesaldo SET Quantity = ?2, TotalSum = ?3 WHERE Itm_ID = ?1");
        saldo->bindText(1, parts[1]);
        saldo->bind(2, Variant(D("3")), pelta::bll::ColumnType::parse("DECIMAL(18,6)").value());
        saldo->bind(3, Variant(D("10")), pelta::bll::ColumnType::parse("DECIMAL(18,4)").value());
        saldo->step();
        auto none = db.prepare("UPDATE nom_storesaldo SET Quantity = 0 WHERE Itm_ID = ?1");
        none->bindText(1, parts[2]);
        none->step();
    }
    const std::string box = measureId("каш");
    const Decimal boxOf = scalar(
                              "SELECT Ratio FROM nom_itemsmeasures WHERE Itm_ID = ?1 AND "
                              "Measure_ID = ?2",
                              {Variant(parts[0]), Variant(box)})
                              .toDecimal() /
                          Decimal(1000000);
    auto r = read(product);
    const std::string bill = addBill(r, "Рецепта 1", "2",
                                     {{0, base[0], "0.333333", ""},
                                      {1, base[1], "1.5", ""},
                                      {2, base[2], "2", "5"},
                                      {0, box, "0.5", ""}});
    auto saved = save(r, product);
    ASSERT_EQ(saved.bllError(), 0);
    auto boms = saved.rs("Boms");
    ASSERT_EQ(boms->recordCount(), 1);
    EXPECT_EQ(boms->value("NumRows").toLong(), 4) << "kept on save";
    EXPECT_EQ(saved.rs("BomsDetails")->recordCount(), 4);
    EXPECT_EQ(scalar("SELECT BomCount FROM nom_items WHERE ID = ?1", {Variant(product)}).toLong(),
              1);
    EXPECT_EQ(saved.rs("ListResult")->value("BomCount").toLong(), 1);

    pelta::PropertyBag request;
    request.writeProperty("Itm_ID", Variant(product + "\x01" + itemId("0000001")));
    ASSERT_EQ(call(*admin_, "UpdNomItemsBomPrices", &request).bllError(), 0);

    const Decimal vat = D("1.2");  // the product's VAT, two decimals
    const std::vector<std::pair<const char*, Decimal>> expected = {
        {"0.333333", D("1.23456789")},
        {"1.5", D("3.33333333")},  // 10 / 3
        {"2", D("5")},             // kept
        {"0.5", (D("1.23456789") * boxOf).round(8)},
    };
    auto rows = read(product).rs("BomsDetails");
    ASSERT_EQ(rows->recordCount(), 4);
    rows->setSort("RowNo");
    Decimal total, totalWithVat;
    size_t i = 0;
    for (rows->moveFirst(); !rows->eof(); rows->moveNext(), ++i) {
        const Decimal q = D(expected[i].first), p = expected[i].second;
        EXPECT_EQ(rows->value("Price").toDecimal(), p) << i;
        const Decimal withVat = (p * vat).round(2);
        EXPECT_EQ(rows->value("PriceWithVat").toDecimal(), withVat) << i;
        EXPECT_EQ(rows->value("TotalSum").toDecimal(), (q * p).round(8)) << i;
        EXPECT_EQ(rows->value("TotalWithVat").toDecimal(), (q * withVat).round(8)) << i;
        EXPECT_EQ(rows->value("UnitQuantity").toDecimal(), (q / Decimal(2)).round(6)) << i;
        EXPECT_EQ(rows->value("UnitSum").toDecimal(), ((q * p).round(8) / Decimal(2)).round(8))
            << i;
        total += (q * p).round(8);
        totalWithVat += (q * withVat).round(8);
    }
    boms = read(product).rs("Boms");
    EXPECT_TRUE(same(boms->value("ID"), Variant(bill)));
    EXPECT_EQ(boms->value("TotalSum").toDecimal(), total);
    EXPECT_EQ(boms->value("TotalWithVat").toDecimal(), totalWithVat);
    EXPECT_EQ(boms->value("NumRows").toLong(), 4);

    auto op = pelta::bll::Connection::open(path_, "operator", logger_);
    EXPECT_EQ(call(*op, "UpdNomItemsBomPrices", &request).bllError(), 24);
}

TEST_F(BomsBllTest, BillNamesAreUniquePerItemAndRowsBelongToTheItemsBills) {
    auto r = read(product);
    addBill(r, "Рецепта 1", "1", {{0, base[0], "1", "2"}});
    ASSERT_EQ(save(r, product).bllError(), 0);

    // The same name again, spaces around it or not.
    for (const char* name : {"Рецепта 1", "  Рецепта 1 "}) {
        auto again = read(product);
        addBill(again, name, "1", {{1, base[1], "1", "3"}});
        const std::string before = dump(path_);
        auto refused = save(again, product);
        EXPECT_EQ(refused.bllError(), 11) << name;
        EXPECT_EQ(refused.get("BllItem"), Variant("Рецепта 1"));
        EXPECT_EQ(refused.get("BllTable"), Variant("nom_boms"));
        EXPECT_EQ(dump(path_), before);
    }
    // Another item may name its bill so.
    const std::string other = itemId("0000016");
    auto theirs = read(other);
    const std::string theirBill = addBill(theirs, "Рецепта 1", "1", {{2, base[2], "1", "4"}});
    ASSERT_EQ(save(theirs, other).bllError(), 0);

    // A row may not go into another item's bill.
    auto forged = read(product);
    addRow(*forged.rs("BomsDetails"), {{"Bom_ID", Variant(theirBill)},
                                       {"Itm_ID", Variant(parts[1])},
                                       {"Quantity", Variant(D("1"))}});
    const std::string before = dump(path_);
    auto refused = save(forged, product);
    EXPECT_EQ(refused.bllError(), 19);
    EXPECT_EQ(refused.get("BllTable"), Variant("nom_boms"));
    EXPECT_EQ(dump(path_), before);
    // Nor can another item's bill be changed from here.
    auto sneaky = read(product);
    auto bills = read(other).rs("Boms");
    bills->moveFirst();
    bills->setValue("Name", Variant("Чужда"));
    bills->update();
    auto request = saveOf(sneaky, product);
    request->writeProperty("Boms", Variant(pelta::ObjectRef(bills)));
    EXPECT_EQ(call(*admin_, "UpdNomItemsDetails", request.get()).bllError(), 18);
    EXPECT_EQ(dump(path_), before);
}

// The rows of other items' bills in which an item is a component are edited
// from the component; a bill goes with its rows in one save.
TEST_F(BomsBllTest, MaterialRowsAreEditedFromTheComponentAndABillGoesWithItsRows) {
    auto r = read(product);
    const std::string bill =
        addBill(r, "Рецепта 1", "1", {{0, base[0], "1", "2"}, {1, base[1], "3", "4"}});
    ASSERT_EQ(save(r, product).bllError(), 0);

    auto part = read(parts[1]);
    auto material = part.rs("ItemMaterialBoms");
    ASSERT_EQ(material->recordCount(), 1);
    material->moveFirst();
    EXPECT_EQ(material->value("BomName"), Variant("Рецепта 1"));
    EXPECT_TRUE(same(material->value("BomItm_ID"), Variant(product)));
    EXPECT_EQ(material->value("BomItmName"),
              scalar("SELECT Name FROM nom_items WHERE ID = ?1", {Variant(product)}));
    material->setValue("Quantity", Variant(D("5")));
    material->setValue("TotalSum", Variant(D("20")));
    material->update();
    ASSERT_EQ(save(part, parts[1]).bllError(), 0);
    auto rows = read(product).rs("BomsDetails");
    ASSERT_TRUE(rows->find("Itm_ID = '" + parts[1] + "'"));
    EXPECT_EQ(rows->value("Quantity").toDecimal(), D("5"));
    auto boms = read(product).rs("Boms");
    EXPECT_EQ(boms->value("NumRows").toLong(), 2);
    EXPECT_EQ(boms->value("TotalSum").toDecimal(), D("20")) << "the only row with a total";

    // The bill and its rows deleted together.
    auto all = read(product);
    for (auto* rs : {all.rs("BomsDetails").get(), all.rs("Boms").get()})
        for (rs->moveFirst(); !rs->eof();) {
            rs->deleteRecord();
            rs->moveNext();
        }
    ASSERT_EQ(save(all, product).bllError(), 0);
    EXPECT_EQ(
        scalar("SELECT COUNT(*) FROM nom_bomsdetails WHERE Bom_ID = ?1", {Variant(bill)}).toLong(),
        0);
    EXPECT_EQ(scalar("SELECT BomCount FROM nom_items WHERE ID = ?1", {Variant(product)}).toLong(),
              0);
}

}  // namespace
}  // namespace bll_test
