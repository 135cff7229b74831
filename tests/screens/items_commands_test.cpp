// The commands of the items list over the real service: deleting inactive
// items, linking related items, bill-of-materials prices, cost centres, and
// the other libraries' forms and reports it opens.
#include "items_support.h"

namespace screentest {
namespace {

using pelta::Variant;

class ItemsCommandsTest : public ItemsTest {
protected:
    void mark(std::initializer_list<const char*> codes) {
        std::vector<Variant> marks;
        for (const char* c : codes)
            marks.push_back(row(c));
        g()->SetMultiSelect(true);
        g()->SetSelectedBookmarks(marks);
    }
    int64_t itemCount(const std::string& code) {
        return count("SELECT COUNT(*) FROM nom_items WHERE Code = ?1", Variant(code));
    }
    void run(int32_t command) { f()->Execute(command); }
};

TEST_F(ItemsCommandsTest, DeleteInactiveAsksOnceAndSendsOnlyTheInactiveRows) {
    exec("UPDATE nom_items SET IsActive = 0 WHERE Code IN ('0000002', '0000003')");
    refresh();
    mark({"0000002", "0000003", "0000004"});
    agent->answer(vbNo, "Желаете ли да изтриете избраните неактивни номенклатури?");
    run(kCmdDeleteInactive);
    EXPECT_EQ(connection->calls["DelNomItems"], 0);
    EXPECT_EQ(ItemsTest::count("SELECT COUNT(*) FROM nom_items"), 40);

    mark({"0000002", "0000003", "0000004"});
    agent->clear();
    agent->answer(vbYes);
    run(kCmdDeleteInactive);
    EXPECT_EQ(agent->prompts().size(), 1u) << "one question for every row";
    EXPECT_EQ(connection->calls["DelNomItems"], 1);
    EXPECT_EQ(itemCount("0000002"), 0);
    EXPECT_EQ(itemCount("0000003"), 0);
    EXPECT_EQ(itemCount("0000004"), 1) << "an active item is never sent";
    EXPECT_EQ(g()->rowCount(), 38) << "the list shows what is left";
}

TEST_F(ItemsCommandsTest, DeleteRefusedForAComponentShowsTheRefusal) {
    exec("INSERT INTO nom_itemsboms (ID, Itm_ID, Component_ID, Quantity) VALUES ('" +
             pelta::newGuidString() + "', ?1, ?2, 1000000)",
         Variant(itemId("0000001")), Variant(itemId("0000002")));
    exec("UPDATE nom_items SET IsActive = 0 WHERE Code = '0000002'");
    refresh();
    row("0000002");
    agent->answer(vbYes);
    run(kCmdDeleteInactive);
    EXPECT_EQ(itemCount("0000002"), 1);
    EXPECT_EQ(agent->prompts().size(), 2u) << "the question, then the refusal";
}

TEST_F(ItemsCommandsTest, LinkingRelatedItemsRemembersTheKindChosen) {
    mark({"0000005", "0000006", "0000007"});
    agent->answerInput(Variant(2), "Тип");
    run(319);
    const auto prompt = agent->last();
    EXPECT_EQ(prompt.title, "Свързване на избрани");
    EXPECT_EQ(prompt.hint, "Подобен продукт|Продавани заедно");
    EXPECT_EQ(prompt.value, Variant(1)) << "the first kind at first";
    EXPECT_EQ(ItemsTest::count("SELECT COUNT(*) FROM nom_itemssimilar WHERE Type = 2"), 6);
    // The kind chosen is offered next time; linking again adds nothing.
    agent->answerInput(Variant("Продавани заедно"));
    run(319);
    EXPECT_EQ(agent->last().value, Variant(2));
    EXPECT_EQ(ItemsTest::count("SELECT COUNT(*) FROM nom_itemssimilar"), 6);
    // Cancelled: nothing is sent.
    agent->cancelInput();
    run(319);
    EXPECT_EQ(connection->calls["UpdNomItemsSimilar"], 2);
}

TEST_F(ItemsCommandsTest, BomPricesOnlyForItemsWithABillOfMaterials) {
    auto* menu = f();
    row("0000001");
    EXPECT_FALSE(menu->command(352)->enabled);
    const std::string product = itemId("0000001"), bill = pelta::newGuidString();
    exec("INSERT INTO nom_boms (ID, Itm_ID, Name, Quantity) VALUES (?1, ?2, 'Основна', 1000000)",
         Variant(bill), Variant(product));
    // Two parts of 2.5 each at a standard price of 1.50 (stored scaled).
    for (const char* part : {"0000002", "0000003"}) {
        exec("INSERT INTO nom_bomsdetails (ID, Bom_ID, Itm_ID, Quantity, Price) VALUES ('" +
                 pelta::newGuidString() + "', ?1, ?2, 2500000, 0)",
             Variant(bill), Variant(itemId(part)));
        exec("UPDATE nom_items SET RatePrice = 150000000 WHERE ID = ?1", Variant(itemId(part)));
    }
    exec("UPDATE nom_items SET BomCount = 1 WHERE ID = ?1", Variant(product));
    refresh();
    row("0000002");
    EXPECT_FALSE(menu->command(352)->enabled);
    row("0000001");
    EXPECT_TRUE(menu->command(352)->enabled);
    run(352);
    EXPECT_EQ(connection->calls["UpdNomItemsBomPrices"], 1);
    EXPECT_EQ(ItemsTest::count("SELECT COUNT(*) FROM nom_bomsdetails WHERE Price = 150000000"), 2);
    EXPECT_EQ(ItemsTest::count("SELECT TotalSum FROM nom_boms WHERE ID = ?1", Variant(bill)),
              750000000)
        << "the bill costs 2 x 2.5 x 1.50";
}

TEST_F(ItemsCommandsTest, CostCentresAreGeneratedForTheSelectedItems) {
    mark({"0000008", "0000009"});
    run(363);
    EXPECT_EQ(ItemsTest::count("SELECT COUNT(*) FROM nom_costcenters WHERE Type = 1"), 2);
    EXPECT_EQ(cell("0000008", "ProjectName"),
              scalar("SELECT Name FROM nom_items WHERE Code = '0000008'"));
    run(363);
    EXPECT_EQ(ItemsTest::count("SELECT COUNT(*) FROM nom_costcenters"), 2);
}

TEST_F(ItemsCommandsTest, OtherLibrariesFormsAndReportsAreOpenedByName) {
    pelta::fw::clearSiblingCalls();
    row("0000011");
    run(119);
    run(125);
    auto calls = pelta::fw::siblingCalls();
    ASSERT_EQ(calls.size(), 4u);
    EXPECT_EQ(calls[0].progId, "PeltaDma15.frmDmaDetails");
    EXPECT_EQ(calls[1].member, "ShowDocument");
    EXPECT_EQ(calls[1].args.at(0), Variant(""));
    EXPECT_EQ(calls[3].args.at(0), Variant("ID='" + itemId("0000011") + "'"));

    // The item card: its filter preset, then shown with the site.
    pelta::fw::clearSiblingCalls();
    run(323);
    calls = pelta::fw::siblingCalls();
    ASSERT_FALSE(calls.empty());
    EXPECT_EQ(calls.front().member, "InitClientSite");
    EXPECT_EQ(calls.back().member, "ShowReport");
    bool itemPreset = false, typePreset = false;
    for (const auto& c : calls) {
        if (c.member == "PresetFilter" && c.args.at(1) == Variant("Items"))
            itemPreset = c.args.at(2) == Variant(itemId("0000011"));
        if (c.member == "PresetChoices") typePreset = c.args.at(0) == Variant("Type");
    }
    EXPECT_TRUE(itemPreset);
    EXPECT_TRUE(typePreset);

    // A library that is not installed: the user is told.
    pelta::fw::services()->refuseObject("PeltaDma15.frmDmaDetails");
    run(119);
    EXPECT_EQ(agent->last().text, "Невъзможно създаване на форма PeltaDma15.frmDmaDetails");
}

TEST_F(ItemsCommandsTest, RefreshingStockFetchesOnlyTheStock) {
    exec("UPDATE nom_storesaldo SET Quantity = 7000000 WHERE Itm_ID = ?1",
         Variant(itemId("0000001")));
    auto* cache = dynamic_cast<pelta::fw::CacheDefExtender*>(items->CacheDef());
    const Variant list = cache->set("List")->value;
    run(895);
    EXPECT_EQ(cell("0000001", "StoreSaldo"), norm(pelta::Decimal(7)));
    EXPECT_EQ(cache->set("List")->value, list);
    // The grid's own delete key deletes nothing.
    row("0000001");
    EXPECT_FALSE(g()->DeleteRows());
}

}  // namespace
}  // namespace screentest
