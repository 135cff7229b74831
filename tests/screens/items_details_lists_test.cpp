// The item editor's tree of lists as a person uses it: the grid of a node is
// filled when the node is shown, bills of materials are added, renamed,
// copied and deleted as nodes of their own, the lots are read when shown,
// and the document nodes open the other libraries' lists filtered by the item.
#include "framework/siblings.h"
#include "items_details_support.h"
#include "library/frame/Forms.h"

namespace screentest {
namespace {

class ItemListsTest : public ItemDetailsTest {
protected:
    pelta::fw::TreeExtender* tree(frmItemsDetails* d) {
        return dynamic_cast<pelta::fw::TreeExtender*>(d->Tree());
    }
    // The texts of the children of `parent`, in their order.
    std::vector<std::string> children(frmItemsDetails* d, const std::string& parent) {
        std::vector<std::string> out;
        for (const auto& n : tree(d)->nodes())
            if (n.parentKey == parent) out.push_back(n.text);
        return out;
    }
    // A saved item of our own, opened.
    frmItemsDetails* savedItem(const std::string& name) {
        auto* d = newItem();
        EXPECT_NE(d, nullptr);
        f(d)->userSetValue("txtName", pelta::Variant(name));
        EXPECT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
        return d;
    }
    std::string bomNode(frmItemsDetails* d, const std::string& name) {
        auto boms = d->Rows("Boms")->clone();
        if (!boms->find("Name = '" + name + "'")) return {};
        return "Bom:" + C2Str(boms->value("ID"));
    }
    int64_t liveRows(const RecordsetRef& rows) {
        int64_t n = 0;
        auto r = rows->clone();
        for (r->moveFirst(); !r->eof(); r->moveNext())
            n += r->status() != pelta::RowStatus::Deleted;
        return n;
    }
};

TEST_F(ItemListsTest, EveryListHasItsNodeAndItsGridIsFilledWhenTheNodeIsShown) {
    auto* d = openItem(firstCode());
    ASSERT_NE(d, nullptr);
    auto* t = tree(d);
    ASSERT_NE(t, nullptr);
    EXPECT_EQ(children(d, ""),
              (std::vector<std::string>{"Списъци", "Производство и придобиване", "Контрол",
                                        "Търговска система", "Счетоводна система", "Организация"}));
    const auto lists = children(d, "Списъци");
    ASSERT_EQ(lists.size(), 16u);
    EXPECT_EQ(lists[1], "Фасети на мерки");
    EXPECT_EQ(lists.back(), "Материал в рецепти");
    EXPECT_EQ(children(d, "Търговска система").size(), 6u);
    EXPECT_EQ(children(d, "Производство и придобиване").back(), "(Нова рецепта)");

    // The price lists are shown first; the other grids wait for their node.
    EXPECT_EQ(t->SelectedKey(), "PriceList");
    EXPECT_EQ(d->Grid("gePriceList")->Rows(), d->Rows("PriceList"));
    EXPECT_FALSE(d->Grid("geBarCodes")->Rows());
    ASSERT_TRUE(t->SelectNode("Баркодове"));
    EXPECT_EQ(d->Grid("geBarCodes")->Rows(), d->Rows("BarCodes"));
    EXPECT_EQ(C2Str(f(d)->GetSetting("TreeLists", {})), "Баркодове")
        << "the chosen node is kept with the form's settings";
    EXPECT_FALSE(f(d)->isModified()) << "showing a list changes nothing";
}

TEST_F(ItemListsTest, BillsOfMaterialsAreNodesOfTheirOwnAndAreSavedWithTheItem) {
    auto* d = savedItem("Торта с рецепта");
    ASSERT_NE(d, nullptr);
    const std::string component = itemId(firstCode());

    agent->answerInput(pelta::Variant("Основна"), "Име на рецепта:");
    d->FormExtender()->Execute(117);
    const std::string main = bomNode(d, "Основна");
    ASSERT_FALSE(main.empty());
    EXPECT_EQ(tree(d)->SelectedKey(), main);
    EXPECT_TRUE(C2Bool(d->Rows("Boms")->clone()->value("IsDefault")))
        << "the first bill is the default one";
    auto* rows = grid(d->Grid("geBomsDetails"));
    rows->addRow();
    rows->editCell("Itm_ID", pelta::Variant(component));
    rows->editCell("Measure_ID", pelta::Variant(measure("бр")));
    rows->editCell("Quantity", pelta::Variant(pelta::Decimal(3)));
    rows->editCell("Price", pelta::Variant(pelta::Decimal::parse("1.25").value()));
    ASSERT_TRUE(rows->commitRow());
    EXPECT_EQ("Bom:" + C2Str(rows->CurrentValue("Bom_ID")), main)
        << "a row added under a bill belongs to it";

    // A name is taken once per item: the person is told and asked again.
    agent->answerInput(pelta::Variant("Основна"));
    agent->answerInput(pelta::Variant("Резервна"));
    d->FormExtender()->Execute(117);
    EXPECT_EQ(agent->last().text, "Име на рецепта:");
    bool told = false;
    for (const auto& p : agent->prompts())
        told = told || p.text == "Вече съществува рецепта с име 'Основна'.";
    EXPECT_TRUE(told);
    EXPECT_EQ(children(d, "Производство и придобиване"),
              (std::vector<std::string>{"(Нова рецепта)", "Рецепта Основна", "Рецепта Резервна"}));
    EXPECT_TRUE(rows->Rows()) << "the new bill shows its (empty) rows";

    // The placeholder given up on leaves no bill and is not asked again.
    agent->cancelInput("Име на рецепта:");
    ASSERT_TRUE(tree(d)->SelectNode(frmItemsDetails::kNewBomNode));
    agent->clear();
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    EXPECT_EQ(agent->pending(), 0u);
    EXPECT_EQ(tree(d)->SelectedKey(), "Производство и придобиване");
    EXPECT_EQ(liveRows(d->Rows("Boms")), 2);
    ASSERT_EQ(liveRows(d->Rows("BomsDetails")), 1);
    EXPECT_EQ(bomNode(d, "Основна"), main) << "the saved bills keep their keys";

    // Renamed, copied with its rows, deleted after asking.
    ASSERT_TRUE(tree(d)->SelectNode(main));
    agent->answerInput(pelta::Variant("Главна"));
    d->FormExtender()->Execute(243);
    ASSERT_TRUE(tree(d)->SelectNode(main));
    agent->answerInput(pelta::Variant("Копие"));
    d->FormExtender()->Execute(310);
    EXPECT_EQ(liveRows(d->Rows("BomsDetails")), 2) << "the copy has the rows of the bill";
    EXPECT_EQ(tree(d)->SelectedKey(), bomNode(d, "Копие"));
    ASSERT_TRUE(tree(d)->SelectNode(bomNode(d, "Резервна")));
    agent->answer(vbNo, "Желаете ли да изтриете 'Резервна'?");
    EXPECT_TRUE(tree(d)->execute(kCmdDelete));
    EXPECT_EQ(liveRows(d->Rows("Boms")), 3);
    agent->answer(vbYes, "Желаете ли да изтриете 'Резервна'?");
    EXPECT_TRUE(tree(d)->execute(kCmdDelete));
    agent->clear();
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;

    EXPECT_EQ(children(d, "Производство и придобиване"),
              (std::vector<std::string>{"(Нова рецепта)", "Рецепта Главна", "Рецепта Копие"}));
    EXPECT_EQ(liveRows(d->Rows("BomsDetails")), 2);
    auto details = d->Rows("BomsDetails")->clone();
    for (details->moveFirst(); !details->eof(); details->moveNext()) {
        EXPECT_EQ(C2Str(details->value("Itm_ID")), component);
        EXPECT_EQ(details->value("Quantity").toDecimal(), pelta::Decimal(3));
    }
    EXPECT_FALSE(f(d)->isModified());
}

TEST_F(ItemListsTest, TheBillsArePricedByTheServiceAfterUnsavedEditsAreSaved) {
    auto* d = savedItem("Продукт за цени на рецепти");
    ASSERT_NE(d, nullptr);
    agent->answerInput(pelta::Variant("Основна"));
    d->FormExtender()->Execute(117);
    const int reads = connection->calls["GetNomItemsDetails"];
    d->FormExtender()->Execute(340);
    EXPECT_EQ(connection->calls["UpdNomItemsDetails"], 2) << "the new bill was saved first";
    EXPECT_EQ(connection->calls["UpdNomItemsBomPrices"], 1);
    EXPECT_EQ(connection->calls["GetNomItemsDetails"], reads + 1) << "and the item read again";
    EXPECT_EQ(liveRows(d->Rows("Boms")), 1);
}

TEST_F(ItemListsTest, APriceOfABaseTypeBringsTheRowsOfTheListsGeneratedFromIt) {
    const std::string base = text("SELECT ID FROM nom_pricelisttypes ORDER BY Code LIMIT 1");
    const std::string online = pelta::newGuidString();
    exec(
        "INSERT INTO nom_pricelisttypes (ID, Code, Name, IsActive, IsAutoGener, PriceFormType, "
        "ParentPlType_ID) VALUES (?1, 'ONL', 'Онлайн', 1, 1, 3, ?2)",
        pelta::Variant(online), pelta::Variant(base));
    // 10 % on everything (stored with eight decimals).
    exec(
        "INSERT INTO nom_pricelistdimvalues (ID, PriceListType_ID, CoefficientA, CoefficientB) "
        "VALUES ('" +
            pelta::newGuidString() + "', ?1, 1000000000, 0)",
        pelta::Variant(online));
    auto* d = savedItem("Продукт с генерирани цени");
    ASSERT_NE(d, nullptr);
    ASSERT_TRUE(tree(d)->SelectNode("PriceList"));
    auto* prices = grid(d->Grid("gePriceList"));
    prices->addRow();
    prices->editCell("PriceList_ID", pelta::Variant(base));
    prices->editCell("Measure_ID", pelta::Variant(measure("бр")));
    prices->editCell("Currency_ID", pelta::Variant(currency("BGN")));
    prices->editCell("BasePrice", pelta::Variant(pelta::Decimal(10)));
    EXPECT_EQ(prices->CurrentValue("BasePriceWithVat").toDecimal(), pelta::Decimal(12))
        << "the price with VAT follows the price at the item's 20 %";
    ASSERT_TRUE(prices->commitRow());
    auto generated = [&] {
        auto r = d->Rows("PriceList")->clone();
        r->setFilter("PriceList_ID = '" + online + "'");
        return r;
    };
    ASSERT_EQ(generated()->recordCount(), 1);
    EXPECT_TRUE(C2Bool(generated()->value("IsAutoGener")));
    EXPECT_EQ(generated()->value("BasePrice").toDecimal(), pelta::Decimal(11));
    EXPECT_EQ(C2Str(generated()->value("Measure_ID")), measure("бр"));

    // A new base price changes the generated row instead of adding one.
    ASSERT_TRUE(prices->MoveToRow("PriceList_ID = '" + base + "'"));
    prices->editCell("BasePrice", pelta::Variant(pelta::Decimal(20)));
    ASSERT_TRUE(prices->commitRow());
    ASSERT_EQ(generated()->recordCount(), 1);
    EXPECT_EQ(generated()->value("BasePrice").toDecimal(), pelta::Decimal(22));
    EXPECT_EQ(connection->calls["GetNomItemPlProposal"], 2);

    agent->clear();
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    ASSERT_EQ(generated()->recordCount(), 1) << "saved and read back";
    EXPECT_EQ(generated()->value("BasePrice").toDecimal(), pelta::Decimal(22));
}

TEST_F(ItemListsTest, TheLotsAreReadWhenTheirNodeIsShown) {
    auto* d = openItem(firstCode());
    ASSERT_NE(d, nullptr);
    ASSERT_TRUE(tree(d)->SelectNode("Наличност по партиди и складове"));
    EXPECT_EQ(connection->calls["GetNomItemsLotsSaldo"], 1);
    EXPECT_EQ(d->Grid("geLotsSaldo")->Rows(), d->Rows("ItemLotsSaldo"));
    ASSERT_TRUE(tree(d)->SelectNode("Баркодове"));
    ASSERT_TRUE(tree(d)->SelectNode("Наличност по партиди и складове"));
    EXPECT_EQ(connection->calls["GetNomItemsLotsSaldo"], 2) << "read anew each time";

    auto* fresh = newItem();
    ASSERT_TRUE(tree(fresh)->SelectNode("Наличност по партиди и складове"));
    EXPECT_EQ(connection->calls["GetNomItemsLotsSaldo"], 2) << "a new item has no lots";
}

TEST_F(ItemListsTest, DocumentNodesOpenTheOtherLibrariesListsFilteredByTheItem) {
    auto* d = openItem(firstCode());
    ASSERT_NE(d, nullptr);
    pelta::fw::clearSiblingCalls();
    ASSERT_TRUE(tree(d)->SelectNode("Документи за продажба"));
    auto list = d->DocumentList("Документи за продажба");
    ASSERT_TRUE(list);
    ASSERT_TRUE(tree(d)->SelectNode("Баркодове"));
    ASSERT_TRUE(tree(d)->SelectNode("Документи за продажба"));
    EXPECT_EQ(d->DocumentList("Документи за продажба"), list) << "made once";
    const auto calls = pelta::fw::siblingCalls();
    ASSERT_EQ(calls.size(), 2u);
    for (const auto& c : calls) {
        EXPECT_EQ(c.progId, "PeltaTrade15.ctxInvDocuments");
        EXPECT_EQ(c.member, "InitFilter");
        ASSERT_EQ(c.args.size(), 1u);
        EXPECT_EQ(C2Str(c.args[0]), "Itm_ID='" + d->Key() + "'");
    }
    pelta::fw::clearSiblingCalls();
    ASSERT_TRUE(tree(d)->SelectNode("Планиране на производството"));
    ASSERT_EQ(pelta::fw::siblingCalls().size(), 1u);
    EXPECT_EQ(pelta::fw::siblingCalls()[0].progId, "PeltaCrm15.ctxMrpDocuments");
    EXPECT_EQ(C2Str(pelta::fw::siblingCalls()[0].args[0]).rfind("Bom_ID=", 0), 0u);
}

TEST_F(ItemListsTest, ACostCentreIsChosenByItsCodeAndClearedByNothing) {
    exec(
        "INSERT INTO nom_costcenters (ID, Type, Code, Name, IsActive) VALUES "
        "('{6F1C2D3E-0000-4000-8000-000000000001}', 1, 'П-7', 'Обект Изток', 1), "
        "('{6F1C2D3E-0000-4000-8000-000000000002}', 0, 'П-7', 'Отдел Изток', 1)");
    items->FormExtender()->Execute(kCmdRefresh);
    auto* d = openItem(firstCode());
    ASSERT_NE(d, nullptr);
    auto* attributes = d->Attributes();
    agent->answerInput(pelta::Variant("П-7"), "Код или име:");
    attributes->Events().ButtonClick("CcProject_ID");
    EXPECT_EQ(C2Str(attributes->Value("CcProject_ID")), "{6F1C2D3E-0000-4000-8000-000000000001}")
        << "the project of that code, not the department";
    EXPECT_EQ(attributes->ShownText("CcProject_ID"), "Обект Изток");
    EXPECT_TRUE(f(d)->isModified());

    agent->answerInput(pelta::Variant("Няма такъв"));
    attributes->Events().ButtonClick("CcProject_ID");
    EXPECT_EQ(agent->last().text, "Не е намерен център на себестойност 'Няма такъв'.");
    EXPECT_EQ(attributes->ShownText("CcProject_ID"), "Обект Изток");

    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    EXPECT_EQ(text("SELECT ProjectCC_ID FROM nom_items WHERE ID = ?1", pelta::Variant(d->Key())),
              "{6F1C2D3E-0000-4000-8000-000000000001}");
    agent->answerInput(pelta::Variant(""));
    attributes->Events().ButtonClick("CcProject_ID");
    EXPECT_TRUE(attributes->Value("CcProject_ID").isNull());
}

TEST_F(ItemListsTest, AnotherScreenOpensAnItemThroughTheDetailFormInterface) {
    auto object = CreateRegisteredClass("frmItemsDetails");
    auto* form = pelta::query<IZonNomDetailForm>(object.get());
    ASSERT_NE(form, nullptr);
    ASSERT_TRUE(form->Init(site.get()));
    auto rows = pelta::makeRef<pelta::Recordset>();
    rows->appendField("ID", pelta::FieldType::Guid);
    rows->open();
    for (const char* code : {"0000003", "0000004"}) {
        rows->addNew();
        rows->setValue("ID", pelta::Variant(itemId(code)));
        rows->update();
    }
    rows->moveLast();
    ASSERT_TRUE(form->ShowFromRecordset(rows));
    auto* shown = pelta::query<frmItemsDetails>(object.get());
    EXPECT_EQ(shown->Key(), itemId("0000004"));
    ASSERT_TRUE(form->ShowDetail(itemId("0000003")));
    auto* extender = pelta::query<IFormExtender>(form->Form().get());
    ASSERT_NE(extender, nullptr);
    EXPECT_EQ(C2Str(extender->ControlValue("txtCode")), "0000003");
    EXPECT_FALSE(form->ShowDetail("{00000000-0000-4000-8000-0000000000AA}"));
    EXPECT_EQ(agent->last().text,
              "Номенклатурата не е намерена или недостатъчни права върху данни");
    shown->Terminate();
}

}  // namespace
}  // namespace screentest
