// The grid extender over a recordset: groups, the current row, marks, edits.
#include <gtest/gtest.h>

#include "framework/extenders.h"
#include "framework/grid_extender.h"
#include "test_screens.h"

namespace {

using namespace fwtest;
using pelta::fw::GridExtender;

std::string idOfCurrent(GridExtender& g) {
    return g.CurrentValue("ID").toString();
}

class Grid : public ::testing::Test {
protected:
    void SetUp() override {
        pelta::fw::registerFramework();
        grid = create<IGridExtender>(kProgIdGridExtender);
        g = pelta::query<GridExtender>(grid.get());
        g->Init(nullptr, "geCtl", 2123, "{E604AA9E-3601-4FDE-93D8-86CFC5920C47}");
    }
    pelta::Ref<IGridExtender> grid;
    GridExtender* g = nullptr;
    RecordsetRef rows = ratesList();
};

TEST_F(Grid, GroupValueFiltersAClonedViewAndLeavesTheScreensRecordset) {
    rows->moveLast();
    auto screenBookmark = rows->bookmark();
    g->Bind(rows, "PrName", pelta::Variant("УниКредит"));
    EXPECT_EQ(g->rowCount(), 1);
    EXPECT_EQ(idOfCurrent(*g), kRateUcb);
    // The screen's recordset keeps its rows, its filter and its cursor.
    EXPECT_EQ(rows->recordCount(), 3);
    EXPECT_TRUE(rows->filter().isEmpty() || rows->filter().toLong() == 0);
    EXPECT_EQ(rows->bookmark(), screenBookmark);
    EXPECT_EQ(grid->Rows(), rows);

    g->setGroupValue(pelta::Variant("(Всички)"));
    EXPECT_EQ(g->rowCount(), 3);
    g->setGroupValue(pelta::Variant("бнб"));  // text compares without case
    EXPECT_EQ(g->rowCount(), 2);

    auto groups = g->groupValues();
    ASSERT_EQ(groups.size(), 3u);
    EXPECT_EQ(groups[0].toString(), "(Всички)");
    EXPECT_EQ(groups[1].toString(), "БНБ");
    EXPECT_EQ(groups[2].toString(), "УниКредит");

    // A quote in the group value is data, not grammar.
    g->setGroupValue(pelta::Variant("O'Neil"));
    EXPECT_EQ(g->rowCount(), 0);
    EXPECT_FALSE(g->HasCurrentRow());
    EXPECT_TRUE(g->CurrentValue("ID").isEmpty());
}

TEST_F(Grid, UnknownGroupColumnIsRefused) {
    EXPECT_THROW(g->Bind(rows, "Bank", pelta::Variant("БНБ")), pelta::Error);
}

TEST_F(Grid, MoveToRowSearchesFromTheTopAndStaysWhenNothingMatches) {
    g->Bind(rows);
    ASSERT_TRUE(g->MoveToRow(std::string("ID = '") + kRateUcb + "'"));
    EXPECT_EQ(idOfCurrent(*g), kRateUcb);
    ASSERT_TRUE(g->MoveToRow("PrName = 'БНБ'"));  // the first match, not the next one
    EXPECT_EQ(idOfCurrent(*g), kRateBnb1);
    EXPECT_FALSE(g->MoveToRow("PrName = 'ДСК'"));
    EXPECT_EQ(idOfCurrent(*g), kRateBnb1);
    EXPECT_THROW(g->MoveToRow("PrName = = 'x'"), pelta::Error);
    EXPECT_EQ(idOfCurrent(*g), kRateBnb1);

    int changes = 0;
    grid->Events().RowColChange = [&](const pelta::Variant&, const std::string&) { ++changes; };
    g->MoveToRow(std::string("ID = '") + kRateBnb2 + "'");
    g->MoveToRow(std::string("ID = '") + kRateBnb2 + "'");
    EXPECT_EQ(changes, 1);
}

TEST_F(Grid, BookmarksOfHiddenRowsAreNotStoodOn) {
    g->Bind(rows, "PrName", pelta::Variant("(Всички)"));
    ASSERT_TRUE(g->MoveToRow(std::string("ID = '") + kRateUcb + "'"));
    auto ucb = g->CurrentBookmark();
    g->setGroupValue(pelta::Variant("БНБ"));
    EXPECT_FALSE(g->SetCurrentBookmark(ucb));
    EXPECT_EQ(idOfCurrent(*g), kRateBnb1);
}

TEST_F(Grid, MarkedRows) {
    g->Bind(rows);
    std::vector<pelta::Variant> marks;
    for (auto* id : {kRateBnb1, kRateUcb}) {
        ASSERT_TRUE(g->MoveToRow(std::string("ID = '") + id + "'"));
        marks.push_back(g->CurrentBookmark());
    }
    int changes = 0;
    grid->Events().SelectionChange = [&] { ++changes; };

    // A single-select grid keeps one mark.
    g->SetSelectedBookmarks(marks);
    ASSERT_EQ(g->SelectedBookmarks().size(), 1u);
    EXPECT_EQ(g->SelectedBookmarks()[0], marks[1]);

    g->SetMultiSelect(true);
    g->SetSelectedBookmarks(marks);
    EXPECT_EQ(g->SelectedBookmarks(), marks);
    g->SetSelectedBookmarks(marks);  // the same marks: no event
    EXPECT_EQ(changes, 2);

    // Marks name rows of the shared table: the screen's recordset finds them.
    rows->setBookmark(g->SelectedBookmarks()[1]);
    EXPECT_EQ(rows->value("ID").toString(), kRateUcb);

    // Binding again clears them.
    g->Bind(rows);
    EXPECT_TRUE(g->SelectedBookmarks().empty());
}

TEST_F(Grid, DeleteRowsAsksTheScreenAndMarksTheRowsDeleted) {
    g->Bind(rows);
    std::vector<pelta::Variant> offered;
    grid->Events().BeforeDeleteEX = [&](const std::vector<pelta::Variant>& b, bool&) {
        offered = b;
    };
    bool refuse = true;
    grid->Events().BeforeDelete = [&](bool& cancel) { cancel = refuse; };
    ASSERT_TRUE(g->MoveToRow(std::string("ID = '") + kRateBnb2 + "'"));
    EXPECT_FALSE(g->DeleteRows());
    EXPECT_EQ(offered.size(), 1u);
    EXPECT_FALSE(g->EditState());

    refuse = false;
    EXPECT_TRUE(g->DeleteRows());
    EXPECT_EQ(g->rowCount(), 2);
    EXPECT_TRUE(g->EditState());
    EXPECT_FALSE(g->MoveToRow(std::string("ID = '") + kRateBnb2 + "'"));
}

TEST_F(Grid, EditStateCountsChangesSinceBinding) {
    // Rows already pending when bound (a new record's default rows) do not
    // make the grid modified.
    rows->moveFirst();
    rows->setValue("PrName", pelta::Variant("ДСК"));
    rows->update();
    g->Bind(rows);
    EXPECT_FALSE(g->EditState());

    ASSERT_TRUE(g->MoveToRow(std::string("ID = '") + kRateUcb + "'"));
    int before = 0, after = 0;
    grid->Events().BeforeColUpdate = [&](const std::string& column, const pelta::Variant& old,
                                         bool& cancel) {
        ++before;
        EXPECT_EQ(column, "PrName");
        EXPECT_EQ(old.toString(), "УниКредит");
        cancel = before == 1;  // the first edit is refused
    };
    grid->Events().AfterColUpdate = [&](const std::string&) { ++after; };
    EXPECT_FALSE(g->editCell("PrName", pelta::Variant("Пощенска")));
    EXPECT_FALSE(g->EditState());
    EXPECT_TRUE(g->editCell("PrName", pelta::Variant("Пощенска")));
    EXPECT_EQ(after, 1);
    EXPECT_TRUE(g->EditState());
    EXPECT_TRUE(g->commitRow());
    EXPECT_TRUE(g->EditState());
}

TEST_F(Grid, ValidateRowsVisitsChangedRowsEvenWhenHidden) {
    g->Bind(rows, "PrName", pelta::Variant("БНБ"));
    // The screen changes a row of another group.
    rows->find(std::string("ID = '") + kRateUcb + "'");
    rows->setValue("IsActive", pelta::Variant(true));
    rows->update();

    std::vector<std::string> visited;
    bool refuse = false;
    grid->Events().BeforeUpdate = [&](bool& cancel) {
        visited.push_back(idOfCurrent(*g));
        cancel = refuse;
    };
    EXPECT_TRUE(g->ValidateRows());
    EXPECT_EQ(visited, std::vector<std::string>{kRateUcb});
    EXPECT_EQ(idOfCurrent(*g), kRateBnb1);  // back where it stood

    refuse = true;
    EXPECT_FALSE(g->ValidateRows());
    EXPECT_EQ(idOfCurrent(*g), kRateUcb);  // on the refused row
}

TEST_F(Grid, ColumnsAndComputedValues) {
    g->DeclareColumns({column("Bank", "Банка", "PrName"), column("Age", "Дни", ""),
                       column("ID", "", "ID", false)});
    EXPECT_THROW(g->DeclareColumns({column("A", "", "ID"), column("a", "", "ID")}), pelta::Error);
    g->Bind(rows);
    EXPECT_EQ(g->CurrentValue("Bank").toString(), "БНБ");  // through the column's field
    EXPECT_EQ(g->CurrentValue("prname").toString(), "БНБ");
    EXPECT_TRUE(g->CurrentValue("Age").isEmpty());
    grid->Events().FetchData = [&](const pelta::Variant& bookmark, const std::string& column,
                                   pelta::Variant& value) {
        EXPECT_EQ(bookmark, g->CurrentBookmark());
        value = pelta::Variant(column + "!");
    };
    EXPECT_EQ(g->CurrentValue("Age").toString(), "Age!");
    EXPECT_THROW(g->CurrentValue("Nope"), pelta::Error);

    EXPECT_FALSE(g->columnVisible("ID"));
    grid->Events().CanShowColumn = [](const std::string& column, bool& show) {
        if (column == "Bank") show = false;
    };
    EXPECT_FALSE(g->columnVisible("Bank"));
    EXPECT_TRUE(g->columnVisible("Age"));
}

TEST_F(Grid, QuickFilterNarrowsTheGridWithinItsGroup) {
    auto filter = create<IQuickFilterExtender>(kProgIdQuickFilterExtender);
    filter->Init(nullptr, grid.get(), "(префикс '/' за код)");
    filter->AddField(1, "Банка", {"PrName"});
    filter->AddField(2, "Код", {"ID"});
    g->Bind(rows, "PrName", pelta::Variant("(Всички)"));

    filter->SetText(1, "кред");
    filter->Apply();
    EXPECT_EQ(g->rowCount(), 1);
    EXPECT_EQ(idOfCurrent(*g), kRateUcb);
    // Typed quotes and wildcards are the text itself.
    for (const char* typed : {"'", "*", "%", "к*д", "[x]"}) {
        filter->SetText(1, typed);
        EXPECT_NO_THROW(filter->Apply()) << typed;
        EXPECT_EQ(g->rowCount(), 0) << typed;
    }

    // The screen builds its own clause for a field.
    filter->Events().FilterClause = [](int32_t id, const std::string& text, std::string& clause,
                                       bool& handled) {
        if (id != 2) return;
        clause = "ID = '" + text + "'";
        handled = true;
    };
    filter->SetText(1, "");
    filter->SetText(2, kRateBnb2);
    filter->Apply();
    EXPECT_EQ(g->rowCount(), 1);
    EXPECT_EQ(idOfCurrent(*g), kRateBnb2);

    // With a group as well, both hold.
    g->setGroupValue(pelta::Variant("УниКредит"));
    EXPECT_EQ(g->rowCount(), 0);

    bool refuse = true;
    filter->Events().BeforeFilter = [&](bool& cancel) { cancel = refuse; };
    g->setGroupValue(pelta::Variant("(Всички)"));
    filter->SetText(2, "");
    filter->Apply();  // refused: the old clause stays
    EXPECT_EQ(g->rowCount(), 1);
}

}  // namespace
