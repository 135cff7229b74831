// The attribute grid: values typed into the head's current row, lists,
// fixed lists and selectors, its events, edit state and help texts.
#include <gtest/gtest.h>

#include <cctype>
#include <future>

#include "framework/attrib_grid.h"
#include "framework/extenders.h"
#include "test_screens.h"

namespace {

using namespace fwtest;
using pelta::Decimal;
using pelta::Variant;
using pelta::fw::AttribGridExtender;
using pelta::fw::formatNumber;
using pelta::fw::parseTypedNumber;

constexpr const char* kUsd = "{33333333-0000-0000-0000-00000000000A}";
constexpr const char* kEur = "{33333333-0000-0000-0000-00000000000B}";
constexpr const char* kItem = "{44444444-0000-0000-0000-000000000001}";
constexpr const char* kRoot = "{55555555-0000-0000-0000-000000000001}";
constexpr const char* kLeaf = "{55555555-0000-0000-0000-000000000002}";

RecordsetRef itemHead() {
    auto rs = pelta::makeRef<pelta::Recordset>();
    rs->appendField("ID", pelta::FieldType::Guid);
    rs->appendField("Name2", pelta::FieldType::Text, 10);
    rs->appendDecimalField("WeightNeto", 18, 8);
    rs->appendField("BasicMeasureScale", pelta::FieldType::Long);
    rs->appendField("Vat", pelta::FieldType::Double);
    rs->appendField("DefRatePrice", pelta::FieldType::Currency);
    rs->appendField("Currency_ID", pelta::FieldType::Guid);
    rs->appendField("PriceMake", pelta::FieldType::Long, 0, false);
    rs->appendField("IsRatePrice", pelta::FieldType::Boolean, 0, false);
    rs->appendField("SecItm_ID", pelta::FieldType::Guid);
    rs->appendField("SecItmName", pelta::FieldType::Text, 100);
    rs->appendField("FinStruct_ID", pelta::FieldType::Guid);
    rs->open();
    rs->addNew();
    rs->setValue("ID", Variant("{44444444-0000-0000-0000-0000000000FF}"));
    rs->setValue("Name2", Variant("Widget"));
    rs->setValue("WeightNeto", Variant(Decimal(2)));
    rs->setValue("PriceMake", Variant(0));
    rs->setValue("IsRatePrice", Variant(false));
    rs->update();
    rs->updateBatch();
    return rs;
}

RecordsetRef currencies() {
    auto rs = pelta::makeRef<pelta::Recordset>();
    rs->appendField("ID", pelta::FieldType::Guid);
    rs->appendField("Code", pelta::FieldType::Text, 3);
    rs->open();
    for (auto [id, code] : {std::pair{kUsd, "USD"}, std::pair{kEur, "EUR"}}) {
        rs->addNew();
        rs->setValue("ID", Variant(id));
        rs->setValue("Code", Variant(code));
        rs->update();
    }
    return rs;
}

RecordsetRef directions() {
    auto rs = pelta::makeRef<pelta::Recordset>();
    rs->appendField("ID", pelta::FieldType::Guid);
    rs->appendField("P_ID", pelta::FieldType::Guid);
    rs->appendField("Name", pelta::FieldType::Text, 50);
    rs->open();
    rs->addNew();
    rs->setValue("ID", Variant(kRoot));
    rs->setValue("Name", Variant("Продажби"));
    rs->update();
    rs->addNew();
    rs->setValue("ID", Variant(kLeaf));
    rs->setValue("P_ID", Variant(kRoot));
    rs->setValue("Name", Variant("Едро"));
    rs->update();
    return rs;
}

AttribDecl attrib(int32_t group, std::string caption, std::string field,
                  AttribEditor editor = AttribEditor::Entry, std::string format = {}) {
    AttribDecl a;
    a.Group = group;
    a.Caption = std::move(caption);
    a.Field = std::move(field);
    a.Editor = editor;
    a.Format = std::move(format);
    return a;
}

class AttribGrid : public ::testing::Test {
protected:
    void SetUp() override {
        pelta::fw::registerFramework();
        grid = create<IAttribGridExtender>(kProgIdAttribGridExtender);
        g = pelta::query<AttribGridExtender>(grid.get());
        grid->Init(&owner, "agAttribs", "1|Основни|2|Мерки|99|Други");
        grid->AddAttribute(attrib(1, "Допълнително име", "Name2"));
        grid->AddAttribute(attrib(1, "Валута по подразбиране", "Currency_ID", AttribEditor::List));
        AttribDecl make = attrib(1, "Ценообразуване", "PriceMake", AttribEditor::FixedList);
        make.Values = "0|(Няма)|1|На база обем|2|На база тегло";
        make.Help = "Как се образуват [b]цените[/b].";
        grid->AddAttribute(make);
        AttribDecl weight =
            attrib(2, "Нето тегло", "WeightNeto", AttribEditor::Entry, "#,##0.000#####");
        weight.Help = "Нетото тегло.";
        grid->AddAttribute(weight);
        grid->AddAttribute(
            attrib(2, "Прецизност", "BasicMeasureScale", AttribEditor::Entry, "#,##0"));
        grid->AddAttribute(attrib(99, "ДДС", "Vat", AttribEditor::Entry, "General Number"));
        grid->AddAttribute(attrib(99, "Цена", "DefRatePrice", AttribEditor::Entry, "#,##0.00"));
        grid->AddAttribute(attrib(99, "Стандартна цена", "IsRatePrice", AttribEditor::CheckBox));
        AttribDecl sec = attrib(99, "Продукт", "SecItm_ID", AttribEditor::Selector);
        sec.ShownField = "SecItmName";
        grid->AddAttribute(sec);
        grid->AddAttribute(attrib(99, "Направление", "FinStruct_ID", AttribEditor::TreeList));
        grid->SetList("Currency_ID", currencies(), "ID", "Code");
        grid->SetList("FinStruct_ID", directions(), "ID", "Name", "P_ID");
        grid->Bind(head);
    }

    Variant value(const char* field) { return head->value(field); }

    struct Owner : pelta::Object {
    } owner;
    RecordsetRef head = itemHead();
    pelta::Ref<IAttribGridExtender> grid;
    AttribGridExtender* g = nullptr;
};

TEST_F(AttribGrid, DeclarationsAreChecked) {
    auto other = create<IAttribGridExtender>(kProgIdAttribGridExtender);
    EXPECT_THROW(other->Init(&owner, "x", "1|Основни|2"), pelta::Error);
    EXPECT_THROW(other->Init(&owner, "x", "1|Основни|1|Пак"), pelta::Error);
    EXPECT_THROW(other->Init(&owner, "x", "едно|Основни"), pelta::Error);

    EXPECT_THROW(grid->AddAttribute(attrib(1, "Пак", "name2")), pelta::Error);  // twice
    EXPECT_THROW(grid->AddAttribute(attrib(3, "Без група", "Other")), pelta::Error);
    EXPECT_THROW(grid->AddAttribute(attrib(1, "Без поле", "")), pelta::Error);
    AttribDecl odd = attrib(1, "Нечетни", "Odd", AttribEditor::FixedList);
    odd.Values = "0|(Няма)|1";
    EXPECT_THROW(grid->AddAttribute(odd), pelta::Error);

    EXPECT_THROW(grid->SetList("Name2", currencies(), "ID", "Code"), pelta::Error);
    EXPECT_THROW(grid->SetList("Currency_ID", currencies(), "ID", "Name"), pelta::Error);
    EXPECT_THROW(grid->SetList("Missing", currencies(), "ID", "Code"), pelta::Error);

    ASSERT_EQ(g->groups().size(), 3u);
    EXPECT_EQ(g->groups()[2].number, 99);
    EXPECT_EQ(g->groups()[2].caption, "Други");
    auto declared = grid->Attributes();
    ASSERT_EQ(declared.size(), 10u);
    EXPECT_EQ(declared[0].Field, "Name2");
    EXPECT_EQ(declared[9].Field, "FinStruct_ID");
}

TEST_F(AttribGrid, NumbersTypedAsTextTakeTheFieldsType) {
    ASSERT_TRUE(grid->UserSetValue("WeightNeto", Variant("1,5")));
    EXPECT_EQ(value("WeightNeto").toDecimal(), *Decimal::parse("1.5"));
    ASSERT_TRUE(grid->UserSetValue("WeightNeto", Variant(" 1 234,125 ")));
    EXPECT_EQ(value("WeightNeto").toDecimal(), *Decimal::parse("1234.125"));
    ASSERT_TRUE(grid->UserSetValue("WeightNeto", Variant("1,234.12345678")));
    EXPECT_EQ(value("WeightNeto").toDecimal(), *Decimal::parse("1234.12345678"));
    EXPECT_EQ(grid->ShownText("WeightNeto"), "1,234.12345678");

    ASSERT_TRUE(grid->UserSetValue("BasicMeasureScale", Variant("3")));
    EXPECT_EQ(value("BasicMeasureScale"), Variant(3));
    ASSERT_TRUE(grid->UserSetValue("Vat", Variant("20,5")));
    EXPECT_EQ(value("Vat"), Variant(20.5));
    ASSERT_TRUE(grid->UserSetValue("DefRatePrice", Variant("12.34")));
    EXPECT_EQ(value("DefRatePrice").toCurrency().scaled, 123400);
    EXPECT_EQ(grid->ShownText("DefRatePrice"), "12.34");
    ASSERT_TRUE(grid->UserSetValue("Vat", Variant(9)));  // a number as it is
    EXPECT_EQ(value("Vat"), Variant(9.0));

    // Refused: the old value stays.
    for (const char* bad : {"abc", "1,2,3", "1.5.5", "1,5.3", "12a"}) {
        EXPECT_FALSE(grid->UserSetValue("WeightNeto", Variant(bad))) << bad;
        EXPECT_EQ(value("WeightNeto").toDecimal(), *Decimal::parse("1234.12345678")) << bad;
    }
    EXPECT_FALSE(grid->UserSetValue("BasicMeasureScale", Variant("2,5")));  // a fraction
    EXPECT_FALSE(grid->UserSetValue("BasicMeasureScale", Variant("99999999999")));
    EXPECT_FALSE(grid->UserSetValue("BasicMeasureScale", Variant(true)));
    EXPECT_EQ(value("BasicMeasureScale"), Variant(3));
    EXPECT_EQ(head->editMode(), pelta::EditMode::None);

    // Empty text clears.
    ASSERT_TRUE(grid->UserSetValue("WeightNeto", Variant("  ")));
    EXPECT_TRUE(value("WeightNeto").isNull());
    ASSERT_TRUE(grid->UserSetValue("Name2", Variant("")));
    EXPECT_TRUE(value("Name2").isNull());
}

TEST_F(AttribGrid, TypedNumbers) {
    EXPECT_EQ(parseTypedNumber("-1,5"), Decimal::parse("-1.5"));
    EXPECT_EQ(parseTypedNumber("1.234,5"), Decimal::parse("1234.5"));
    EXPECT_EQ(parseTypedNumber("1,234,567"), Decimal::parse("1234567"));
    EXPECT_EQ(parseTypedNumber("1\xC2\xA0"
                               "234"),
              Decimal::parse("1234"));
    EXPECT_EQ(parseTypedNumber("0,1234567890123456789012345678"),
              Decimal::parse("0.1234567890123456789012345678"));  // exact, no binary double
    EXPECT_FALSE(parseTypedNumber(""));
    EXPECT_FALSE(parseTypedNumber(",5,"));
    EXPECT_FALSE(parseTypedNumber("12,34,567"));
    EXPECT_FALSE(parseTypedNumber("1 2x"));
}

TEST_F(AttribGrid, NumberFormats) {
    const Variant w(*Decimal::parse("1234.5"));
    EXPECT_EQ(formatNumber(w, "#,##0.000#####"), "1,234.500");
    EXPECT_EQ(formatNumber(Variant(*Decimal::parse("1.123456789")), "#,##0.000#####"),
              "1.12345679");  // rounded half away from zero
    EXPECT_EQ(formatNumber(Variant(*Decimal::parse("-2.5")), "#,##0"), "-3");
    EXPECT_EQ(formatNumber(Variant(1234567), "#,##0"), "1,234,567");
    EXPECT_EQ(formatNumber(Variant(*Decimal::parse("-0.0004")), "#,##0.000"), "0.000");
    EXPECT_EQ(formatNumber(Variant(0.1 + 0.2), "0.000"), "0.300");
    EXPECT_EQ(formatNumber(Variant(0.125), "0.00%"), "12.50%");
    EXPECT_EQ(formatNumber(Variant(0.5), "#.##"), ".5");
    EXPECT_EQ(formatNumber(Variant(*Decimal::parse("20.50")), "General Number"), "20.5");
    EXPECT_EQ(formatNumber(Variant(1234.5), "Standard"), "1,234.50");
    EXPECT_EQ(formatNumber(Variant::null(), "#,##0"), "");
    EXPECT_EQ(formatNumber(Variant("текст"), "#,##0"), "текст");
}

TEST_F(AttribGrid, CheckBoxesTakeBooleans) {
    ASSERT_TRUE(grid->UserSetValue("IsRatePrice", Variant(true)));
    EXPECT_EQ(value("IsRatePrice"), Variant(true));
    EXPECT_EQ(grid->ShownText("IsRatePrice"), "");  // the host draws the box from the value
    ASSERT_TRUE(grid->UserSetValue("IsRatePrice", Variant::null()));
    EXPECT_EQ(value("IsRatePrice"), Variant(false));
    ASSERT_TRUE(grid->UserSetValue("IsRatePrice", Variant("True")));
    EXPECT_EQ(value("IsRatePrice"), Variant(true));
    EXPECT_FALSE(grid->UserSetValue("IsRatePrice", Variant("може би")));
    EXPECT_EQ(value("IsRatePrice"), Variant(true));
}

TEST_F(AttribGrid, ListsTakeOnlyTheirKeys) {
    ASSERT_TRUE(grid->UserSetValue("Currency_ID", Variant(kEur)));
    EXPECT_EQ(value("Currency_ID"), Variant(kEur));
    EXPECT_EQ(grid->ShownText("Currency_ID"), "EUR");
    // Keys compare without case; the list's own spelling is written.
    std::string lower = kUsd;
    for (char& c : lower)
        c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    ASSERT_TRUE(grid->UserSetValue("Currency_ID", Variant(lower)));
    EXPECT_EQ(value("Currency_ID"), Variant(kUsd));

    EXPECT_FALSE(grid->UserSetValue("Currency_ID", Variant(kItem)));  // not offered
    EXPECT_FALSE(grid->UserSetValue("Currency_ID", Variant("USD")));  // a text, not a key
    EXPECT_EQ(value("Currency_ID"), Variant(kUsd));
    ASSERT_TRUE(grid->UserSetValue("Currency_ID", Variant("")));
    EXPECT_TRUE(value("Currency_ID").isNull());
    EXPECT_EQ(grid->ShownText("Currency_ID"), "");

    // A tree list offers every node with its parent.
    auto nodes = g->choices("FinStruct_ID");
    ASSERT_EQ(nodes.size(), 2u);
    EXPECT_EQ(nodes[1].key, kLeaf);
    EXPECT_EQ(nodes[1].text, "Едро");
    EXPECT_EQ(nodes[1].parentKey, kRoot);
    EXPECT_EQ(nodes[0].parentKey, "");
    ASSERT_TRUE(grid->UserSetValue("FinStruct_ID", Variant(kLeaf)));
    EXPECT_EQ(grid->ShownText("FinStruct_ID"), "Едро");

    // Without its rows a list offers nothing.
    grid->SetList("Currency_ID", nullptr, "", "");
    EXPECT_TRUE(g->choices("Currency_ID").empty());
    EXPECT_FALSE(grid->UserSetValue("Currency_ID", Variant(kUsd)));
}

TEST_F(AttribGrid, FixedListsTakeTheirValues) {
    ASSERT_TRUE(grid->UserSetValue("PriceMake", Variant("2")));
    EXPECT_EQ(value("PriceMake"), Variant(2));
    EXPECT_EQ(grid->ShownText("PriceMake"), "На база тегло");
    ASSERT_TRUE(grid->UserSetValue("PriceMake", Variant(1)));
    EXPECT_EQ(grid->ShownText("PriceMake"), "На база обем");
    EXPECT_FALSE(grid->UserSetValue("PriceMake", Variant("3")));
    EXPECT_FALSE(grid->UserSetValue("PriceMake", Variant("На база обем")));
    // Null is not allowed by the field: refused by the head, the value stays.
    EXPECT_FALSE(grid->UserSetValue("PriceMake", Variant("")));
    EXPECT_EQ(value("PriceMake"), Variant(1));
    EXPECT_EQ(head->editMode(), pelta::EditMode::None);

    auto offered = g->choices("PriceMake");
    ASSERT_EQ(offered.size(), 3u);
    EXPECT_EQ(offered[0].key, "0");
    EXPECT_EQ(offered[0].text, "(Няма)");
    grid->SetValue("PriceMake", Variant(7));  // the screen's own value, not offered
    EXPECT_EQ(grid->ShownText("PriceMake"), "7");
}

TEST_F(AttribGrid, SelectorsShowTheirNameAndAskTheScreenToPick) {
    std::vector<std::string> clicked;
    grid->Events().ButtonClick = [&](const std::string& field) {
        clicked.push_back(field);
        ASSERT_TRUE(grid->UserSetValue(field, Variant(kItem)));
        grid->SetShownText(field, "Комплект");
    };
    g->buttonClick("secitm_id");
    EXPECT_EQ(clicked, std::vector<std::string>{"SecItm_ID"});
    EXPECT_EQ(value("SecItm_ID"), Variant(kItem));
    EXPECT_EQ(value("SecItmName"), Variant("Комплект"));
    EXPECT_EQ(grid->ShownText("SecItm_ID"), "Комплект");
    EXPECT_TRUE(grid->EditState());

    EXPECT_FALSE(grid->UserSetValue("SecItm_ID", Variant("не е ключ")));
    EXPECT_THROW(grid->SetShownText("Name2", "x"), pelta::Error);
    EXPECT_THROW(g->buttonClick("Name2"), pelta::Error);
}

TEST_F(AttribGrid, EventsSeeTheConvertedValueAndMayChangeOrCancelIt) {
    std::vector<std::string> log;
    grid->Events().BeforeUpdate = [&](const std::string& field, Variant& v, bool& cancel) {
        log.push_back("before " + field + " " + v.toString() + " head " +
                      head->value(field).toString());
        if (v.toString() == "13") cancel = true;
        if (v.toString() == "5") v = Variant(4);
    };
    grid->Events().AfterUpdate = [&](const std::string& field) {
        log.push_back("after " + field + " " + head->value(field).toString() +
                      (grid->EditState() ? " edited" : ""));
    };

    head->moveFirst();
    grid->SetValue("BasicMeasureScale", Variant(1));
    ASSERT_TRUE(grid->UserSetValue("BasicMeasureScale", Variant("2")));
    EXPECT_FALSE(grid->UserSetValue("BasicMeasureScale", Variant("13")));
    EXPECT_EQ(value("BasicMeasureScale"), Variant(2));
    ASSERT_TRUE(grid->UserSetValue("BasicMeasureScale", Variant("5")));
    EXPECT_EQ(value("BasicMeasureScale"), Variant(4));
    EXPECT_FALSE(grid->UserSetValue("BasicMeasureScale", Variant("x")));  // no event at all

    EXPECT_EQ(log, (std::vector<std::string>{
                       "before BasicMeasureScale 2 head 1",
                       "after BasicMeasureScale 2 edited",
                       "before BasicMeasureScale 13 head 2",
                       "before BasicMeasureScale 5 head 2",
                       "after BasicMeasureScale 4 edited",
                   }));
    EXPECT_THROW(grid->UserSetValue("Unknown", Variant(1)), pelta::Error);
}

TEST_F(AttribGrid, EditStateFollowsThePersonsChanges) {
    EXPECT_FALSE(grid->EditState());
    grid->SetValue("Name2", Variant("Уред"));  // the screen's own change
    EXPECT_FALSE(grid->EditState());
    ASSERT_TRUE(grid->UserSetValue("Name2", Variant("Уред")));  // nothing changed
    EXPECT_FALSE(grid->EditState());
    EXPECT_FALSE(grid->UserSetValue("Name2", Variant("твърде дълго име")));  // longer than 10
    EXPECT_FALSE(grid->EditState());
    EXPECT_EQ(value("Name2"), Variant("Уред"));
    ASSERT_TRUE(grid->UserSetValue("Name2", Variant("Друг")));
    EXPECT_TRUE(grid->EditState());
    grid->ResetEditState();
    EXPECT_FALSE(grid->EditState());
    ASSERT_TRUE(grid->UserSetValue("Name2", Variant("Трети")));
    grid->Bind(head);
    EXPECT_FALSE(grid->EditState());

    // The values are the head's: a pending edit of the screen is kept.
    head->setValue("Vat", Variant(20.0));
    ASSERT_TRUE(grid->UserSetValue("Name2", Variant("Четвърти")));
    EXPECT_NE(head->editMode(), pelta::EditMode::None);
    head->update();
    EXPECT_EQ(value("Vat"), Variant(20.0));

    // A field the head lacks has no value and takes none.
    grid->AddAttribute(attrib(99, "Липсващо", "Missing"));
    EXPECT_TRUE(grid->Value("Missing").isEmpty());
    EXPECT_EQ(grid->ShownText("Missing"), "");
    EXPECT_THROW(grid->UserSetValue("Missing", Variant("x")), pelta::Error);

    grid->Bind(nullptr);
    EXPECT_TRUE(grid->Value("Name2").isEmpty());
    EXPECT_THROW(grid->UserSetValue("Name2", Variant("x")), pelta::Error);
}

TEST_F(AttribGrid, TheChosenRowGivesTheHelpText) {
    std::vector<std::string> changes;
    grid->Events().SelChange = [&](const std::string& field) { changes.push_back(field); };
    EXPECT_EQ(grid->SelectedField(), "");
    EXPECT_EQ(grid->HelpText(), "");
    grid->Select("pricemake");
    EXPECT_EQ(grid->SelectedField(), "PriceMake");
    EXPECT_EQ(grid->HelpText(), "Как се образуват [b]цените[/b].");
    grid->Select("PriceMake");  // no change
    grid->Select("WeightNeto");
    EXPECT_EQ(grid->HelpText(), "Нетото тегло.");
    grid->Select("Name2");
    EXPECT_EQ(grid->HelpText(), "");
    EXPECT_EQ(changes, (std::vector<std::string>{"PriceMake", "WeightNeto", "Name2"}));
    EXPECT_THROW(grid->Select("Unknown"), pelta::Error);
    EXPECT_EQ(grid->SelectedField(), "Name2");
}

TEST_F(AttribGrid, RowFormatMayChangeTextAndStyle) {
    grid->Events().RowFormat = [](const std::string& field, std::string& text, std::string& style) {
        if (field == "WeightNeto") {
            text += " кг";
            style = "Required";
        }
    };
    auto row = g->shownRow("WeightNeto");
    EXPECT_EQ(row.text, "2.000 кг");
    EXPECT_EQ(row.style, "Required");
    EXPECT_EQ(g->shownRow("Name2").style, "");
    EXPECT_EQ(grid->ShownText("Vat"), "");  // Null
}

TEST_F(AttribGrid, HostsFindTheGridsAndTreesOfAScreenOnItsThread) {
    auto tree = create<ITreeExtender>(kProgIdTreeExtender);
    tree->Init(&owner, "tvLists", 0);
    auto services = pelta::fw::services();
    auto grids = services->attribGridsOfOwner(&owner);
    ASSERT_EQ(grids.size(), 1u);
    EXPECT_EQ(grids[0], g);
    auto trees = services->treesOfOwner(&owner);
    ASSERT_EQ(trees.size(), 1u);
    EXPECT_EQ(trees[0]->treeName(), "tvLists");
    auto elsewhere = std::async(std::launch::async, [&] {
        return services->attribGridsOfOwner(&owner).size() + services->treesOfOwner(&owner).size();
    });
    EXPECT_EQ(elsewhere.get(), 0u);
    tree.reset();
    EXPECT_TRUE(services->treesOfOwner(&owner).empty());
}

}  // namespace
