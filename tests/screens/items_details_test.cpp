// The item editor opened from the items list as the framework opens it: a
// new product with its defaults, the checks in their order, saving into the
// list, the duplicates the service refuses, the copy and the delete.
#include <tuple>

#include "items_details_support.h"

namespace screentest {
namespace {

TEST_F(ItemDetailsTest, ANewProductStartsWithItsDefaultsAndTheServiceNumbersIt) {
    auto* d = newItem();
    ASSERT_NE(d, nullptr);
    EXPECT_TRUE(d->Key().empty());
    auto head = d->Head();
    EXPECT_TRUE(IsGuid(C2Str(head->value("ID"))));
    for (const char* c : {"chkIsActive", "chkIsAccQuo", "chkIsAccPr"})
        EXPECT_TRUE(C2Bool(f(d)->ControlValue(c))) << c;
    EXPECT_TRUE(C2Bool(d->Attributes()->Value("IsVatAllowed")));
    EXPECT_EQ(C2Str(f(d)->ControlValue("cboItmType")), idOf("nom_itemtypes", "Name", "Стока"));
    EXPECT_FALSE(C2Bool(head->value("IsService")));
    EXPECT_EQ(C2Str(f(d)->ControlValue("cboMeasure")), measure("бр"));
    EXPECT_EQ(C2Str(f(d)->ControlValue("cboStore")), idOf("nom_stores", "Code", "1"));
    EXPECT_EQ(C2Str(d->Attributes()->Value("Currency_ID")),
              text("SELECT Value FROM sys_settings WHERE Name = 'DefCurrency_ID'"));
    EXPECT_EQ(C2Lng(d->Attributes()->Value("TaxGroup")), 2);
    EXPECT_EQ(d->Attributes()->ShownText("TaxGroup"), "Б");
    EXPECT_EQ(C2Str(d->Attributes()->Value("Vat")), "20");
    EXPECT_EQ(C2Lng(d->Attributes()->Value("PriceScale")), 2);
    EXPECT_EQ(C2Str(head->value("CU")), connection->CurrentUserID());
    EXPECT_EQ(C2Str(f(d)->ControlValue("txtCode")), "");
    EXPECT_FALSE(f(d)->isModified()) << "an untouched new item closes without asking";
    EXPECT_NE(f(d)->controlList("cboItmType"), nullptr);

    f(d)->userSetValue("txtName", pelta::Variant("Нов продукт за тест"));
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    const std::string id = d->Key();
    ASSERT_TRUE(IsGuid(id));
    EXPECT_EQ(id, C2Str(head->value("ID"))) << "the key made for it is kept";
    const std::string code = text("SELECT Code FROM nom_items WHERE ID = ?1", pelta::Variant(id));
    EXPECT_FALSE(code.empty()) << "an empty code is numbered";
    EXPECT_EQ(C2Str(f(d)->ControlValue("txtCode")), code) << "the saved state is shown";
    EXPECT_EQ(count("SELECT TaxGroup FROM nom_items WHERE ID = ?1", pelta::Variant(id)), 2);
    EXPECT_EQ(C2Str(g()->CurrentValue("ID")), id) << "the list shows the new row";
    EXPECT_EQ(C2Str(g()->CurrentValue("Name")), "Нов продукт за тест");
}

TEST_F(ItemDetailsTest, ChecksComeInTheirOrderAndNothingIsSentUntilAllPass) {
    // The group is required.
    exec("UPDATE nom_dimensions SET IsRequired = 1");
    auto* d = newItem();
    ASSERT_NE(d, nullptr);
    auto expect = [&](const char* control, const std::string& message) {
        auto shown = refused(d);
        EXPECT_EQ(shown.control, control);
        EXPECT_EQ(shown.text, message);
        return shown;
    };
    auto expectAttribute = [&](const char* field, const std::string& message) {
        expect("geAttribs", message);
        EXPECT_EQ(d->Attributes()->SelectedField(), field);
    };
    f(d)->userSetValue("txtCode", pelta::Variant("T-1"));
    expect("txtName", "Невалидно име");
    f(d)->userSetValue("txtName", pelta::Variant("  "));
    expect("txtName", "Невалидно име");
    f(d)->userSetValue("txtName", pelta::Variant("Проверки"));
    f(d)->userSetValue("cboItmType", pelta::Variant());
    expect("cboItmType", "Невалиден тип на продукт");
    f(d)->userSetValue("cboItmType", pelta::Variant(idOf("nom_itemtypes", "Name", "Услуга")));
    f(d)->userSetValue("cboMeasure", pelta::Variant());
    expect("cboMeasure", "Невалидна мярка");
    f(d)->userSetValue("cboMeasure", pelta::Variant(measure("бр")));
    expect("cboGroup", "Невалидна дименсия");
    f(d)->userSetValue("cboGroup", pelta::Variant(idOf("nom_dimvalues", "Name", "Храни")));

    // A second measure needs its facet.
    d->Attributes()->UserSetValue("SecMeasure_ID", pelta::Variant(measure("кг")));
    expectAttribute("SecMeasure_ID", "Моля въведете валидно отношение м/у мерките");
    ASSERT_TRUE(d->Tree()->SelectNode("Фасети на мерки"));
    auto* mg = grid(d->Grid("geMeasures"));
    mg->addRow();
    mg->editCell("Measure_ID", pelta::Variant(measure("кг")));
    mg->editCell("RatioPerUnits", pelta::Variant(pelta::Decimal(1)));
    mg->editCell("RatioCoeff", pelta::Variant(pelta::Decimal(5)));
    ASSERT_TRUE(mg->commitRow());

    d->Attributes()->UserSetValue("BasicMeasureScale", pelta::Variant(5));
    expectAttribute("BasicMeasureScale",
                    "Стойността на полето 'Прецизност в осн. мярка' трябва да е между 0 и 4.");
    d->Attributes()->UserSetValue("BasicMeasureScale", pelta::Variant(-1));
    expectAttribute("BasicMeasureScale",
                    "Стойността на полето 'Прецизност в осн. мярка' трябва да е между 0 и 4.");
    d->Attributes()->UserSetValue("BasicMeasureScale", pelta::Variant(4));
    d->Attributes()->UserSetValue("VatPriceScale", pelta::Variant(9));
    expectAttribute("VatPriceScale",
                    "Стойността на полето 'Прецизност крайна цена с ДДС' трябва да е между 0 и 8.");
    d->Attributes()->UserSetValue("VatPriceScale", pelta::Variant(2));
    d->Attributes()->UserSetValue("PriceScale", pelta::Variant("12"));
    expectAttribute("PriceScale",
                    "Стойността на полето 'Прецизност крайна цена с TO%' трябва да е между 0 и 8.");
    d->Attributes()->UserSetValue("PriceScale", pelta::Variant(0));

    // A facet on the base measure itself.
    f(d)->userSetValue("cboMeasure", pelta::Variant(measure("кг")));
    auto facet = expect("geMeasures", "За основната мярка 'кг' не може да бъде дефиниран фасет.");
    EXPECT_EQ(facet.title, "Невалиден фасет.");
    EXPECT_EQ(connection->calls["UpdNomItemsDetails"], 0);

    f(d)->userSetValue("cboMeasure", pelta::Variant(measure("бр")));
    agent->clear();
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    const pelta::Variant id(d->Key());
    EXPECT_EQ(count("SELECT BasicMeasureScale FROM nom_items WHERE ID = ?1", id), 4);
    EXPECT_EQ(count("SELECT IsService FROM nom_items WHERE ID = ?1", id), 1)
        << "the service flag follows the type";
    EXPECT_EQ(text("SELECT Measure_ID FROM nom_itemsmeasures WHERE Itm_ID = ?1", id),
              measure("кг"));
    EXPECT_EQ(text("SELECT v.Name FROM nom_items i JOIN nom_dimvalues v ON v.ID = i.DimValue_ID "
                   "WHERE i.ID = ?1",
                   id),
              "Храни");
}

TEST_F(ItemDetailsTest, AnEditIsSavedAndTheListRowRefreshedWithoutReadingTheList) {
    const std::string code = firstCode();
    auto* d = openItem(code);
    ASSERT_NE(d, nullptr);
    EXPECT_EQ(d->Key(), itemId(code));
    EXPECT_EQ(C2Str(f(d)->ControlValue("txtCode")), code);
    EXPECT_FALSE(f(d)->isModified());
    const int reads = connection->calls["GetNomItems"];

    f(d)->userSetValue("txtName", pelta::Variant("Преименуван продукт"));
    f(d)->userSetValue("txtNote", pelta::Variant("бележка"));
    EXPECT_TRUE(f(d)->isModified());
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    EXPECT_EQ(text("SELECT Name FROM nom_items WHERE Code = ?1", pelta::Variant(code)),
              "Преименуван продукт");
    EXPECT_EQ(text("SELECT LU FROM nom_items WHERE Code = ?1", pelta::Variant(code)),
              connection->CurrentUserID());
    EXPECT_FALSE(f(d)->isModified());
    EXPECT_EQ(connection->calls["GetNomItems"], reads);
    EXPECT_EQ(C2Str(g()->CurrentValue("Name")), "Преименуван продукт");
    EXPECT_EQ(C2Str(g()->CurrentValue("Note")), "бележка");

    // A barcode added in its grid reaches the item's code list.
    const int64_t had = d->Rows("BarCodes")->recordCount();
    ASSERT_TRUE(d->Tree()->SelectNode("Баркодове"));
    auto* bg = grid(d->Grid("geBarCodes"));
    bg->addRow();
    bg->editCell("Code", pelta::Variant("3800000000017"));
    ASSERT_TRUE(bg->commitRow());
    EXPECT_TRUE(f(d)->isModified());
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    EXPECT_NE(text("SELECT BarCodes FROM nom_items WHERE Code = ?1", pelta::Variant(code))
                  .find("3800000000017"),
              std::string::npos);
    EXPECT_EQ(d->Rows("BarCodes")->recordCount(), had + 1) << "the saved rows are shown";
}

TEST_F(ItemDetailsTest, DuplicatesAreToldByTheirKindAndTheEditsStay) {
    const std::string code = firstCode();
    const std::string owner =
        text("SELECT Name FROM nom_items WHERE Code = ?1", pelta::Variant(code));
    auto* d = newItem();
    ASSERT_NE(d, nullptr);
    f(d)->userSetValue("txtName", pelta::Variant("Двойник"));
    f(d)->userSetValue("txtCode", pelta::Variant(code));
    auto shown = refused(d);
    EXPECT_EQ(shown.control, "txtCode");
    EXPECT_EQ(shown.text, "Вече съществува продукт '" + owner + "' с този код");
    EXPECT_EQ(shown.title, "Дублиране на код");
    EXPECT_EQ(shown.hint,
              "Използвайте текстовото поле, за да модифицирате кода или го оставете празно за "
              "автоматична генерация на пореден уникален номер.");
    EXPECT_TRUE(d->Key().empty());
    EXPECT_EQ(C2Str(f(d)->ControlValue("txtName")), "Двойник");
    EXPECT_TRUE(f(d)->isModified());

    f(d)->userSetValue("txtCode", pelta::Variant());
    f(d)->userSetValue("txtName", pelta::Variant(owner));
    shown = refused(d);
    EXPECT_EQ(shown.control, "txtName");
    EXPECT_EQ(shown.text, "Вече съществува продукт с това име.");
    EXPECT_EQ(shown.title, "Дублиране на име");
    EXPECT_EQ(shown.hint, "Използвайте текстовото поле, за да модифицирате името.");

    // A barcode another item holds names that item.
    addBarcode(code, "3800000000024");
    f(d)->userSetValue("txtName", pelta::Variant("Двойник"));
    ASSERT_TRUE(d->Tree()->SelectNode("Баркодове"));
    auto* bg = grid(d->Grid("geBarCodes"));
    bg->addRow();
    bg->editCell("Code", pelta::Variant("3800000000024"));
    ASSERT_TRUE(bg->commitRow());
    shown = refused(d);
    EXPECT_EQ(shown.text, "Вече съществува баркод на продукт '" + owner + "' с този код.");
    EXPECT_EQ(shown.hint, "Използвайте текстовото поле, за да модифицирате кода");
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_items WHERE Name = 'Двойник'"), 0)
        << "nothing of a refused save is written";

    bg->editCell("Code", pelta::Variant("3800000000031"));
    ASSERT_TRUE(bg->commitRow());
    agent->clear();
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_itemsbarcodes WHERE BarCode = '3800000000031'"), 1);
}

TEST_F(ItemDetailsTest, ACopyTakesTheItemButNotItsCodeAndADeleteAsksFirst) {
    auto* d = newItem();
    ASSERT_NE(d, nullptr);
    f(d)->userSetValue("txtName", pelta::Variant("Образец"));
    f(d)->userSetValue("cboMeasure", pelta::Variant(measure("кг")));
    f(d)->userSetValue("txtCode", pelta::Variant("ОБР-1"));
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    const std::string source = d->Key();

    d->FormExtender()->Execute(kCmdCopy);
    EXPECT_TRUE(d->Key().empty()) << "a new record";
    EXPECT_NE(C2Str(d->Head()->value("ID")), source);
    EXPECT_EQ(C2Str(f(d)->ControlValue("txtCode")), "");
    EXPECT_EQ(C2Str(f(d)->ControlValue("cboMeasure")), measure("кг"));
    EXPECT_TRUE(f(d)->isModified());
    EXPECT_EQ(refused(d).text, "Вече съществува продукт с това име.");
    f(d)->userSetValue("txtName", pelta::Variant("Копие на образец"));
    agent->clear();
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    const std::string copy = d->Key();
    EXPECT_NE(copy, source);
    EXPECT_EQ(text("SELECT Measure_ID FROM nom_items WHERE ID = ?1", pelta::Variant(copy)),
              measure("кг"));

    agent->answer(vbNo, "Желаете ли да изтриете номенклатурата?");
    d->FormExtender()->Execute(kCmdDelete);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_items WHERE ID = ?1", pelta::Variant(copy)), 1);
    agent->answer(vbYes, "Желаете ли да изтриете номенклатурата?");
    d->FormExtender()->Execute(kCmdDelete);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_items WHERE ID = ?1", pelta::Variant(copy)), 0);
    EXPECT_TRUE(f(d)->closed());
    EXPECT_FALSE(g()->MoveToRow("ID = '" + copy + "'"));
    EXPECT_EQ(agent->pending(), 0u);
}

TEST_F(ItemDetailsTest, ARepeatedPriceOfATypeIsRefusedBeforeTheServiceIsCalled) {
    auto* d = openItem(firstCode());
    ASSERT_NE(d, nullptr);
    auto prices = d->Rows("PriceList");
    ASSERT_GT(prices->recordCount(), 0);
    prices->moveFirst();
    std::vector<std::pair<std::string, pelta::Variant>> row;
    for (const char* field :
         {"PriceList_ID", "Cg_ID", "Currency_ID", "Measure_ID", "BasePrice", "BasePriceWithVat"})
        row.emplace_back(field, prices->value(field));
    prices->addNew();
    prices->setValue("ID", pelta::Variant(pelta::newGuidString()));
    for (const auto& [field, value] : row)
        prices->setValue(field, value);
    prices->update();
    f(d)->userSetValue("txtNote", pelta::Variant("с цена"));
    auto shown = refused(d);
    EXPECT_EQ(shown.text, "Този тип ценова листа, доставчик и мярка вече са въведени в списъка.");
    EXPECT_EQ(shown.title, "Дублиране на запис в ценови листи");
    EXPECT_EQ(connection->calls["UpdNomItemsDetails"], 0);

    // Another currency of the same type is a price of its own.
    const std::string other =
        text("SELECT ID FROM nom_currencies WHERE ID <> ?1 ORDER BY Code LIMIT 1", row[2].second);
    prices->setValue("Currency_ID", pelta::Variant(other));
    prices->update();
    agent->clear();
    EXPECT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
}

TEST_F(ItemDetailsTest, OnlyALeafDirectionMayBeChosen) {
    auto* d = openItem(firstCode());
    ASSERT_NE(d, nullptr);
    auto directions = d->Reference("FinStruct");
    ASSERT_TRUE(directions);
    const std::string parent = pelta::newGuidString(), leaf = pelta::newGuidString();
    for (const auto& [id, up, name] :
         {std::tuple{parent, std::string(), "Продажби"}, std::tuple{leaf, parent, "Търговия"}}) {
        directions->addNew();
        directions->setValue("ID", pelta::Variant(id));
        if (!up.empty()) directions->setValue("P_ID", pelta::Variant(up));
        directions->setValue("Name", pelta::Variant(name));
        directions->update();
    }
    d->Attributes()->UserSetValue("FinStruct_ID", pelta::Variant(parent));
    auto shown = refused(d);
    EXPECT_EQ(shown.control, "geAttribs");
    EXPECT_EQ(d->Attributes()->SelectedField(), "FinStruct_ID");
    EXPECT_EQ(shown.title, "Невалидно направление");
    EXPECT_EQ(shown.text,
              "Могат да се избират само крайни разклонения от списъка. Междинните възли в "
              "структурата не са позволени за избор.");
    EXPECT_EQ(shown.hint,
              "Използвайте падащия списък, за да изберете елемент без наследници в йерархията с "
              "направления.");
    d->Attributes()->UserSetValue("FinStruct_ID", pelta::Variant(leaf));
    agent->clear();
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    EXPECT_EQ(text("SELECT FinStruct_ID FROM nom_items WHERE ID = ?1", pelta::Variant(d->Key())),
              leaf);
}

TEST_F(ItemDetailsTest, AnItemThatIsGoneIsToldAndNotShown) {
    auto* d = openItem(firstCode());
    ASSERT_NE(d, nullptr);
    agent->clear();
    EXPECT_FALSE(d->ShowDetails(pelta::newGuidString()));
    EXPECT_EQ(agent->last().text,
              "Номенклатурата не е намерена или недостатъчни права върху данни");
}

TEST_F(ItemDetailsTest, FeatureRefusalsHaveTheirOwnMessagesAndOthersTheCommonOne) {
    auto refusing = pelta::makeRef<RefusingConnection>(connection);
    site = pelta::makeRef<pelta::fw::ClientSite>(refusing);
    close();
    open();
    auto* d = newItem();
    ASSERT_NE(d, nullptr);
    f(d)->userSetValue("txtName", pelta::Variant("Признаци"));

    refusing->code = 8103;
    auto shown = refused(d);
    EXPECT_EQ(shown.text, "Дублиране на код на признак от категория 'Цвят'");
    EXPECT_EQ(shown.hint,
              "Използвайте текстовото поле, за да модифицирате кода или го оставете празно за "
              "автоматична генерация на пореден уникален номер.");
    refusing->code = 8104;
    shown = refused(d);
    EXPECT_EQ(shown.text, "Дублиране на име на признак от категория 'Цвят'");
    EXPECT_EQ(shown.hint, "Използвайте текстовото поле, за да модифицирате името.");

    // Anything else is the common display of the service's errors.
    refusing->code = 18;
    shown = refused(d);
    EXPECT_FALSE(shown.text.empty());
    EXPECT_EQ(shown.text.find("Цвят"), std::string::npos);
    EXPECT_TRUE(d->Key().empty());
    EXPECT_EQ(C2Str(f(d)->ControlValue("txtName")), "Признаци") << "the edits stay";

    refusing->code = 0;
    agent->clear();
    EXPECT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
}

TEST(ItemBomNames, NamesWithQuotesAreFoundNotParsed) {
    auto boms = pelta::makeRef<pelta::Recordset>();
    boms->appendField("ID", pelta::FieldType::Long);
    boms->appendField("Name", pelta::FieldType::Text);
    boms->open();
    boms->addNew();
    boms->setValue("ID", pelta::Variant(1));
    boms->setValue("Name", pelta::Variant("Рецепта 'А'"));
    boms->update();
    EXPECT_TRUE(frmItemsDetails::BomNameTaken(boms, "Рецепта 'А'"));
    EXPECT_TRUE(frmItemsDetails::BomNameTaken(boms, "рецепта 'а'"));
    EXPECT_FALSE(frmItemsDetails::BomNameTaken(boms, "Рецепта 'Б'"));
    EXPECT_FALSE(frmItemsDetails::BomNameTaken(boms, "x' OR Name LIKE '*"));
    EXPECT_FALSE(frmItemsDetails::BomNameTaken({}, "Рецепта"));
}

}  // namespace
}  // namespace screentest
