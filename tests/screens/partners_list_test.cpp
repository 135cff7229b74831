// The partners' list as a host and a document screen use it: its grid, the
// filter tree, the quick filter with typed text of any kind, the selector
// contract, and the commands that open other editors.
#include "partners_support.h"

namespace screentest {
namespace {

class PartnersListTest : public PartnersScreenTest {};

TEST_F(PartnersListTest, OpensWithEveryPartnerItsColumnsMenuAndTree) {
    auto* g = listGrid();
    EXPECT_EQ(g->rowCount(), count("SELECT COUNT(*) FROM nom_contragents"));
    auto columns = g->Columns();
    ASSERT_EQ(columns.size(), 51u + 2u) << "a column per partner dimension";
    EXPECT_EQ(columns[0].Caption, "Икона");
    EXPECT_EQ(columns[38].Key, "PosCards");
    EXPECT_EQ(columns[14].Format, "#,##0.00######");
    EXPECT_EQ(columns[51].Caption, "Групи");
    EXPECT_FALSE(g->columnVisible("ID"));

    auto* f = form(list->FormExtender());
    ASSERT_NE(f->command(kCmdNew), nullptr);
    EXPECT_EQ(f->command(kCmdNew)->caption, "Нов контрагент...\tCtrl+N");
    EXPECT_EQ(f->command(kCmdOpen)->tooltip, "Редакция на контрагент (Ctrl+O)");
    EXPECT_EQ(f->command(kCmdDeleteInactive)->tooltip, "Изтриване на неактивен контрагент (Del)");
    EXPECT_EQ(quickFilter()->hint(),
              "(префикс '/' за търсене по код, '//' за търсене по адрес и др.)");

    auto* tree = dynamic_cast<pelta::fw::TreeExtender*>(list->FilterTree());
    ASSERT_NE(tree, nullptr);
    std::vector<std::string> roots;
    for (const auto& n : tree->nodes())
        if (n.parentKey.empty()) roots.push_back(n.text);
    EXPECT_EQ(roots, (std::vector<std::string>{"(Всички)", "Тип", "Дименсии"}));
    EXPECT_EQ(tree->SelectedKey(), "all");
    EXPECT_EQ(list->GetColumnName(0), "Дименсии на контрагенти");
    EXPECT_EQ(list->GetColumnName(1), "Групи");
    EXPECT_EQ(list->GetColumnName(2), "Регион");
    EXPECT_EQ(list->GetColumnName(3), "");
}

TEST_F(PartnersListTest, TheTreeFiltersByTypeAndByDimensionValue) {
    auto* tree = list->FilterTree();
    const auto all = listGrid()->rowCount();
    ASSERT_TRUE(tree->SelectNode("type:" + typeId("EM")));
    EXPECT_EQ(listGrid()->rowCount(),
              count("SELECT COUNT(*) FROM nom_contragents WHERE CgType_ID = ?1",
                    pelta::Variant(typeId("EM"))));

    const std::string plovdiv = text("SELECT ID FROM nom_cgdimvalues WHERE Name = 'Пловдив'");
    ASSERT_TRUE(tree->SelectNode("val:" + plovdiv));
    EXPECT_EQ(listGrid()->rowCount(),
              count("SELECT COUNT(*) FROM nom_cgdimlinks WHERE DimValue_ID = ?1",
                    pelta::Variant(plovdiv)));
    EXPECT_EQ(list->GroupCaption(), "Пловдив (REG)");

    // A value of several: partners holding it among others match too.
    const std::string key = text("SELECT ID FROM nom_cgdimvalues WHERE Name = 'Ключови клиенти'");
    ASSERT_TRUE(tree->SelectNode("val:" + key));
    EXPECT_EQ(
        listGrid()->rowCount(),
        count("SELECT COUNT(*) FROM nom_cgdimlinks WHERE DimValue_ID = ?1", pelta::Variant(key)));
    // Several values, one given as a path.
    const std::string both = list->GroupClause("Регион\\Пловдив\x01Варна");
    EXPECT_NE(both.find(" OR "), std::string::npos);
    EXPECT_EQ(list->GroupCaption(), "Пловдив (REG), Варна (REG)");

    ASSERT_TRUE(tree->SelectNode("all"));
    EXPECT_EQ(listGrid()->rowCount(), all);
}

TEST_F(PartnersListTest, QuickFilterSearchesNamesCodesAndAddressesAsTyped) {
    exec(
        "UPDATE nom_contragents SET Name = 'Кафе ''Луна'' 50% *отстъпка*', "
        "Address = 'гр. Видин, ул. Дунав [2]' WHERE Code = '2'");
    list->FormExtender()->Execute(kCmdRefresh);

    // Quotes, wildcards and brackets are the text itself.
    EXPECT_EQ(filtered("'Луна' 50%"), 1);
    EXPECT_EQ(filtered("*отстъпка*"), 1);
    EXPECT_EQ(filtered("50%*"), 0);
    EXPECT_EQ(filtered("'"), 1);
    EXPECT_EQ(filtered("//Дунав [2]"), 1);
    EXPECT_EQ(filtered("//[2]"), 1);
    EXPECT_EQ(filtered("//[*]"), 0);
    // "/" searches codes.
    EXPECT_EQ(filtered("/1"), count("SELECT COUNT(*) FROM nom_contragents WHERE Code LIKE '%1%'"));
    // "//" searches addresses and numbers; numbers from their start only.
    EXPECT_EQ(filtered("//Пловдив"),
              count("SELECT COUNT(*) FROM nom_contragents c LEFT JOIN nom_cgaddresses a ON "
                    "a.ID = c.DeliveryAddress_ID WHERE c.Address LIKE '%Пловдив%' OR "
                    "a.Name LIKE '%Пловдив%'"));
    const std::string bulstat = text("SELECT Bulstat FROM nom_contragents WHERE Code = '1'");
    EXPECT_EQ(filtered("//" + bulstat.substr(0, 6)), 1);
    EXPECT_EQ(filtered("//" + bulstat.substr(3)), 0);
    // "//*number" finds a whole loyalty card, never a part of one.
    const std::string cards = text("SELECT PosCards FROM nom_contragents WHERE Code = '4'");
    ASSERT_GE(cards.size(), 10u);
    const std::string card = cards.substr(1, 8);
    EXPECT_EQ(filtered("//*" + card), 1);
    EXPECT_EQ(filtered("//*" + card.substr(0, 7)), 0);
    EXPECT_EQ(filtered("//" + card.substr(0, 7)), 1);
    // Nothing after the prefix filters nothing.
    EXPECT_EQ(list->FindClause("/"), "");
    EXPECT_EQ(list->FindClause("//"), "");
    EXPECT_EQ(filtered(""), count("SELECT COUNT(*) FROM nom_contragents"));
}

TEST_F(PartnersListTest, LoyaltyCardsAndContactPhonesAreShownAsText) {
    EXPECT_EQ(ctxContragents::PosCardsText("\x7F"
                                           "1234\x7F"
                                           "5678\x7F"),
              "1234; 5678");
    EXPECT_EQ(ctxContragents::PosCardsText("\x7F"
                                           "1234\x7F"),
              "1234");
    EXPECT_EQ(ctxContragents::PosCardsText("\x7F\x7F"), "");
    EXPECT_EQ(ctxContragents::PosCardsText("\x7F"), "");
    EXPECT_EQ(ctxContragents::PosCardsText("я"), "") << "one character, two bytes";
    EXPECT_EQ(ctxContragents::PosCardsText(""), "");
    EXPECT_EQ(ctxContragents::PosCardsText("\x7Fкарта\x7F"), "карта");

    exec("UPDATE nom_contragents SET PosCards = 'x' WHERE Code = '5'");
    list->FormExtender()->Execute(kCmdRefresh);
    auto* g = list->GridExtender();
    ASSERT_TRUE(g->MoveToRow("Code = '4'"));
    const std::string cards = text("SELECT PosCards FROM nom_contragents WHERE Code = '4'");
    EXPECT_EQ(C2Str(g->CurrentValue("PosCards")), cards.substr(1, 8) + "; " + cards.substr(10, 8));
    ASSERT_TRUE(g->MoveToRow("Code = '5'"));
    EXPECT_EQ(C2Str(g->CurrentValue("PosCards")), "");

    exec("UPDATE nom_cgpersons SET PhoneWork = '02 123' WHERE Cg_ID = '" + partnerId("1") + "'");
    list->FormExtender()->Execute(kCmdRefresh);
    ASSERT_TRUE(g->MoveToRow("Code = '1'"));
    const std::string mobile = text("SELECT PhoneMobile FROM nom_cgpersons WHERE Cg_ID = ?1",
                                    pelta::Variant(partnerId("1")));
    EXPECT_EQ(C2Str(g->CurrentValue("ContactPhones")), "02 123; " + mobile);
    // The preview shows the current row.
    EXPECT_NE(C2Str(list->FormExtender()->ControlValue("fraPreview")).find("\r\n"),
              std::string::npos);
}

TEST_F(PartnersListTest, QuickFindResolvesTextToExactlyOnePartner) {
    exec(
        "UPDATE nom_contragents SET Name = 'Д''Артанян' WHERE Code = '3';"
        "UPDATE nom_contragents SET Name = 'Мол' WHERE Code = '5';"
        "UPDATE nom_contragents SET Name = 'Мол Център' WHERE Code = '6';");
    list->FormExtender()->Execute(kCmdRefresh);
    pelta::Variant row, id, name, item;
    auto chosenName = [&](const std::string& typed) -> std::string {
        list->Reset();
        if (!list->QuickFind(typed, row)) return "<none>";
        EXPECT_TRUE(list->GetNextItem(id, name, item));
        EXPECT_EQ(item, row);
        EXPECT_FALSE(list->GetNextItem(id, name, item)) << "one row chosen";
        return C2Str(name);
    };
    EXPECT_EQ(chosenName(partnerId("7")), text("SELECT Name FROM nom_contragents WHERE Code='7'"));
    EXPECT_EQ(chosenName("Д'Артанян"), "Д'Артанян");
    EXPECT_EQ(chosenName("д'арт"), "Д'Артанян") << "part of the name, without regard to case";
    EXPECT_EQ(chosenName("Мол"), "Мол") << "the exact name wins over two partial ones";
    EXPECT_EQ(chosenName("/6"), "Мол Център");
    EXPECT_EQ(chosenName("/"), "<none>");
    EXPECT_EQ(chosenName("//"), "<none>");
    EXPECT_EQ(chosenName("Трейд"), "<none>") << "several partners";
    EXPECT_EQ(chosenName("*"), "<none>");
    const std::string bulstat = text("SELECT Bulstat FROM nom_contragents WHERE Code = '8'");
    EXPECT_EQ(chosenName("//" + bulstat), text("SELECT Name FROM nom_contragents WHERE Code='8'"));
    // Reset hands the chosen rows out again.
    ASSERT_TRUE(list->QuickFind("/6", row));
    EXPECT_TRUE(list->GetNextItem(id, name, item));
    EXPECT_EQ(id.toString(), partnerId("6"));
    EXPECT_TRUE(list->Reset());
    EXPECT_TRUE(list->GetNextItem(id, name, item));
}

TEST_F(PartnersListTest, RestrictionsRefetchOnlyWhenTheyChange) {
    const int reads = connection->calls["GetNomContragents"];
    pelta::Variant current, search, result;
    const std::string people = typeId("NP") + "\x01" + typeId("EM");

    EXPECT_TRUE(list->InitCgType("", ""));
    EXPECT_FALSE(list->NeedsRefetch());
    ASSERT_TRUE(list->ShowSelect(current, search, result));
    EXPECT_EQ(connection->calls["GetNomContragents"], reads);

    EXPECT_TRUE(list->InitCgType(people, ""));
    EXPECT_TRUE(list->NeedsRefetch());
    ASSERT_TRUE(list->ShowSelect(current, search, result));
    EXPECT_EQ(connection->calls["GetNomContragents"], reads + 1);
    EXPECT_FALSE(list->NeedsRefetch());
    EXPECT_EQ(listGrid()->rowCount(),
              count("SELECT COUNT(*) FROM nom_contragents c JOIN nom_cgtypes t ON "
                    "t.ID = c.CgType_ID WHERE t.Code IN ('NP', 'EM')"));
    EXPECT_TRUE(list->InitCgType(people, ""));
    EXPECT_FALSE(list->NeedsRefetch());

    const std::string varna = text("SELECT ID FROM nom_cgdimvalues WHERE Name = 'Варна'");
    EXPECT_TRUE(list->InitCgType("", ""));
    EXPECT_TRUE(list->InitDimValue({}, varna));
    EXPECT_TRUE(list->NeedsRefetch());
    ASSERT_TRUE(list->ShowSelect(current, search, result));
    auto rows = list->ListRecordset()->clone();
    ASSERT_GT(rows->recordCount(), 0);
    for (rows->moveFirst(); !rows->eof(); rows->moveNext())
        EXPECT_EQ(rows->value("REG").toString(), "Варна");
    EXPECT_TRUE(list->InitMedia("{00000000-0000-0000-0000-000000000001}", "x"));
    EXPECT_TRUE(list->NeedsRefetch());
}

TEST_F(PartnersListTest, ShowSelectAnswersTheFoundOrTheChosenRows) {
    pelta::Variant current, search("/7"), result;
    ASSERT_TRUE(list->ShowSelect(current, search, result));
    EXPECT_EQ(result.toString(), partnerId("7"));

    // Not found: the list stands filtered on the current value.
    current = pelta::Variant(partnerId("9"));
    search = pelta::Variant();
    ASSERT_TRUE(list->ShowSelect(current, search, result));
    EXPECT_EQ(result.toString(), partnerId("9"));

    // Rows the person marked are chosen, in order.
    auto* g = list->GridExtender();
    std::vector<pelta::Variant> marks;
    for (const char* code : {"2", "3"}) {
        ASSERT_TRUE(g->MoveToRow("Code = '" + std::string(code) + "'"));
        marks.push_back(g->CurrentBookmark());
    }
    g->SetSelectedBookmarks(marks);
    ASSERT_TRUE(list->ShowSelect(current, search, result));
    EXPECT_EQ(result.toString(), partnerId("2") + "\x01" + partnerId("3"));
    pelta::Variant id, name, item;
    EXPECT_TRUE(list->GetNextItem(id, name, item));
    EXPECT_TRUE(list->GetNextItem(id, name, item));
    EXPECT_EQ(id.toString(), partnerId("3"));
    EXPECT_FALSE(list->GetNextItem(id, name, item));
}

TEST_F(PartnersListTest, OtherEditorsThatCannotBeCreatedAreNamed) {
    auto* g = list->GridExtender();
    std::vector<pelta::Variant> marks;
    for (const char* code : {"2", "3"}) {
        ASSERT_TRUE(g->MoveToRow("Code = '" + std::string(code) + "'"));
        marks.push_back(g->CurrentBookmark());
    }
    g->SetSelectedBookmarks(marks);
    list->FormExtender()->Execute(kCmdOpen);
    EXPECT_EQ(agent->last().text, "Невъзможно създаване на форма frmContragentsMultiDetails");

    // An employee's row opens the salaries' editor.
    g->SetSelectedBookmarks({});
    ASSERT_TRUE(g->MoveToRow("CgType_ID = '" + typeId("EM") + "'"));
    list->FormExtender()->Execute(kCmdOpen);
    EXPECT_EQ(agent->last().text,
              "Невъзможно създаване на форма PeltaSalaries15.frmEmployeesDetails");
    agent->clear();
    list->FormExtender()->Execute(ctxContragents::kCmdNewEmployee);
    EXPECT_EQ(agent->last().text,
              "Невъзможно създаване на форма PeltaSalaries15.frmEmployeesDetails");

    // One partner opens the partner editor.
    ASSERT_NE(openPartner("1"), nullptr);
    EXPECT_EQ(details->Key(), partnerId("1"));
}

TEST_F(PartnersListTest, PreviewPaneIsToggledAndKeptPerUser) {
    EXPECT_TRUE(list->PreviewPane());
    list->FormExtender()->Execute(ctxContragents::kCmdPreview);
    EXPECT_FALSE(list->PreviewPane());
    EXPECT_EQ(list->FormExtender()->GetSetting("PreviewPane", pelta::Variant(1)).toLong(), 0);
}

TEST_F(PartnersListTest, DeleteInactiveRemovesOnlyInactivePartners) {
    const std::string inactive = text("SELECT Code FROM nom_contragents WHERE IsActive = 0");
    ASSERT_FALSE(inactive.empty());
    auto* g = list->GridExtender();
    std::vector<pelta::Variant> marks;
    ASSERT_TRUE(g->MoveToRow("Code = '" + inactive + "'"));
    marks.push_back(g->CurrentBookmark());
    ASSERT_TRUE(g->MoveToRow("Code = '1'"));
    marks.push_back(g->CurrentBookmark());
    g->SetSelectedBookmarks(marks);
    const auto before = count("SELECT COUNT(*) FROM nom_contragents");
    agent->answer(vbYes, "Желаете ли да изтриете избраните неактивни номенклатури?");
    list->FormExtender()->Execute(kCmdDeleteInactive);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_contragents"), before - 1);
    EXPECT_EQ(listGrid()->rowCount(), before - 1) << "the list was read again";
}

class PartnersWithoutRightsTest : public PartnersScreenTest {
protected:
    void SetUp() override {
        ScreenTest::SetUp();
        exec(
            "INSERT INTO sec_users (ID, Name, IsActive) VALUES "
            "('{11111111-2222-3333-4444-555555555555}', 'guest', 1)");
        connect("guest");
        openPartners();
    }
};

TEST_F(PartnersWithoutRightsTest, TheNoteStandsInPlaceOfTheGrid) {
    EXPECT_EQ(C2Str(list->FormExtender()->ControlValue("ctxInfoNote1")),
              "Недостатъчни права за извършване на операция");
    EXPECT_FALSE(list->ListRecordset());
}

}  // namespace
}  // namespace screentest
