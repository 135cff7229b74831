// The currency-rate list and its detail form, created through the registry
// and driven as the framework drives them, over the real service.
#include <cmath>

#include "library/contracts/Constants.h"
#include "library/frame/cListFrame.h"
#include "library/other/frmRatiosDetails.h"
#include "screen_support.h"

namespace screentest {
namespace {

class RatiosTest : public ScreenTest {
protected:
    void SetUp() override {
        ScreenTest::SetUp();
        openRatios();
    }

    void openRatios() {
        listObject = openList("PeltaNom15.ctxRatios");
        list = pelta::Ref<cListFrame>(pelta::query<cListFrame>(listObject.get()));
        ASSERT_TRUE(list);
        ASSERT_TRUE(list->FormExtender()->Refresh());
    }

    void TearDown() override {
        if (list) {
            bool cancel = false;
            list->QueryTerminate(cancel);
            list->Terminate();
        }
        details.reset();
        list.reset();
        listObject.reset();
        ScreenTest::TearDown();
    }

    // The detail form the list opened.
    frmRatiosDetails* openedDetails() {
        auto found = pelta::fw::services()->RecordDeletion()->FindDetailForm(list->FormExtender());
        details = pelta::Ref<frmRatiosDetails>(pelta::query<frmRatiosDetails>(found.get()));
        return details.get();
    }

    std::string bankId(const std::string& name) {
        return scalar("SELECT ID FROM nom_banks WHERE Name = ?1", pelta::Variant(name)).toString();
    }
    std::string anyBank(int n = 0) {
        return scalar("SELECT ID FROM nom_banks ORDER BY Name LIMIT 1 OFFSET " + std::to_string(n))
            .toString();
    }
    std::string currencyId(const std::string& code) {
        return scalar("SELECT ID FROM nom_currencies WHERE Code = ?1", pelta::Variant(code))
            .toString();
    }

    // A new record through command 101, filled as a user fills it.
    frmRatiosDetails* newRate(const std::string& bank, pelta::Date date,
                              const std::string& currency, const char* rate) {
        list->FormExtender()->Execute(kCmdNew);
        auto* d = openedDetails();
        EXPECT_NE(d, nullptr);
        if (!d) return nullptr;
        auto* f = form(d->FormExtender());
        f->userSetValue("cboBank", pelta::Variant(bank));
        f->userSetValue("dtpDate", pelta::Variant(date));
        auto* g = grid(d->RowsGrid());
        g->addRow();
        EXPECT_TRUE(g->editCell("Currency_ID", pelta::Variant(currency)));
        EXPECT_TRUE(g->editCell("Units", pelta::Variant(1)));
        EXPECT_TRUE(g->editCell("Rate", pelta::Variant(*pelta::Decimal::parse(rate))));
        EXPECT_TRUE(g->commitRow());
        return d;
    }

    int64_t ratesOn(const std::string& bank, pelta::Date date) {
        return count("SELECT COUNT(*) FROM nom_currratios WHERE Pr_ID = ?1 AND Date = " +
                         std::to_string(static_cast<int64_t>(date.oa)),
                     pelta::Variant(bank));
    }

    pelta::ObjectRef listObject;
    pelta::Ref<cListFrame> list;
    pelta::Ref<frmRatiosDetails> details;
    const pelta::Date day{pelta::makeDate(2031, 5, 4)};
};

TEST_F(RatiosTest, TheListShowsEveryRateGroupedByBank) {
    auto* g = grid(list->GridExtender());
    EXPECT_EQ(g->groupColumn(), "PrName");
    EXPECT_EQ(g->groupValue(), pelta::Variant("(Всички)"));
    EXPECT_EQ(g->rowCount(), count("SELECT COUNT(*) FROM nom_currratios"));
    // The group list offers every bank that publishes rates.
    EXPECT_EQ(static_cast<int64_t>(g->groupValues().size()),
              1 + count("SELECT COUNT(DISTINCT Pr_ID) FROM nom_currratios"));
    // The frame's menu texts.
    auto* f = form(list->FormExtender());
    bool seen = false;
    for (const auto& c : f->menu()) {
        if (c.id == kCmdNew) {
            EXPECT_EQ(c.caption, "Нов валутен курс...\tCtrl+N");
            EXPECT_EQ(c.tooltip, "Нов валутен курс (Ctrl+N)");
            seen = true;
        }
        EXPECT_NE(c.id, 201) << "the list removes the save command";
    }
    EXPECT_TRUE(seen);
}

TEST_F(RatiosTest, NewRateIsSavedAndItsListRowRefreshed) {
    const std::string bank = anyBank();
    auto* d = newRate(bank, day, currencyId("USD"), "1.812345");
    ASSERT_NE(d, nullptr);
    ASSERT_TRUE(d->FormExtender()->SaveDocument());

    ASSERT_EQ(ratesOn(bank, day), 1);
    const std::string id = d->Key();
    // Rates are kept exactly, as integers of millionths.
    EXPECT_EQ(count("SELECT Rate FROM nom_currratiosdetails WHERE CurrRatio_ID = ?1",
                    pelta::Variant(id)),
              1812345);
    EXPECT_EQ(scalar("SELECT CU FROM nom_currratios WHERE ID = ?1", pelta::Variant(id)).toString(),
              connection->CurrentUserID());
    // The list row came back with the answer: no second read of the list.
    EXPECT_EQ(connection->calls["GetNomCurrRatios"], 1);
    auto rows = list->ListRecordset()->clone();
    ASSERT_TRUE(rows->find("ID='" + id + "'"));
    EXPECT_EQ(rows->value("Pr_ID").toString(), bank);
    EXPECT_EQ(list->GridExtender()->CurrentValue("ID").toString(), id);
}

TEST_F(RatiosTest, ReopeningReusesTheDetailFormAndSavesChanges) {
    const std::string bank = anyBank();
    auto* first = newRate(bank, day, currencyId("USD"), "1.80");
    ASSERT_TRUE(first->FormExtender()->SaveDocument());
    const std::string id = first->Key();

    ASSERT_TRUE(list->GridExtender()->MoveToRow("ID='" + id + "'"));
    list->FormExtender()->Execute(kCmdOpen);
    auto* again = openedDetails();
    EXPECT_EQ(again, first) << "one detail form per list";
    EXPECT_EQ(again->Key(), id);

    auto* g = grid(again->RowsGrid());
    ASSERT_TRUE(g->MoveToRow("Currency_ID='" + currencyId("USD") + "'"));
    EXPECT_TRUE(g->editCell("Rate", pelta::Variant(*pelta::Decimal::parse("1.95"))));
    EXPECT_TRUE(g->commitRow());
    ASSERT_TRUE(again->FormExtender()->SaveDocument());
    EXPECT_EQ(count("SELECT Rate FROM nom_currratiosdetails WHERE CurrRatio_ID = ?1",
                    pelta::Variant(id)),
              1950000);
}

TEST_F(RatiosTest, SaveWithoutBankIsRefusedWithoutCallingTheService) {
    auto* d = newRate("", day, currencyId("USD"), "1.80");
    ASSERT_NE(d, nullptr);
    EXPECT_FALSE(d->FormExtender()->SaveDocument());
    auto shown = agent->last();
    EXPECT_EQ(shown.text, "Моля изберете банка");
    EXPECT_EQ(shown.control, "cboBank");
    EXPECT_EQ(connection->calls["UpdNomCurrRatiosDetails"], 0);
}

TEST_F(RatiosTest, RowsWithoutUnitOrRateAreRefused) {
    list->FormExtender()->Execute(kCmdNew);
    auto* d = openedDetails();
    auto* g = grid(d->RowsGrid());
    g->addRow();
    g->editCell("Currency_ID", pelta::Variant(currencyId("USD")));
    EXPECT_FALSE(g->commitRow());
    EXPECT_EQ(agent->last().text, "Моля въведете единица валута");
    g->editCell("Units", pelta::Variant(1));
    EXPECT_FALSE(g->commitRow());
    EXPECT_EQ(agent->last().text, "Моля въведете курс");
}

TEST_F(RatiosTest, DuplicateRateIsRefusedOnItsRowAndTheEditsStay) {
    const std::string bank = anyBank();
    auto* first = newRate(bank, day, currencyId("USD"), "1.80");
    ASSERT_TRUE(first->FormExtender()->SaveDocument());

    // A second record of the same bank and day with EUR and USD again.
    list->FormExtender()->Execute(kCmdNew);
    auto* d = openedDetails();
    auto* f = form(d->FormExtender());
    f->userSetValue("cboBank", pelta::Variant(bank));
    f->userSetValue("dtpDate", pelta::Variant(day));
    auto* g = grid(d->RowsGrid());
    for (auto [code, rate] : {std::pair{"EUR", "1.95583"}, std::pair{"USD", "1.81"}}) {
        g->addRow();
        g->editCell("Currency_ID", pelta::Variant(currencyId(code)));
        g->editCell("Units", pelta::Variant(1));
        g->editCell("Rate", pelta::Variant(*pelta::Decimal::parse(rate)));
        ASSERT_TRUE(g->commitRow());
    }
    agent->clear();
    EXPECT_FALSE(d->FormExtender()->SaveDocument());

    EXPECT_EQ(ratesOn(bank, day), 1) << "nothing written";
    EXPECT_EQ(g->CurrentValue("Currency_ID").toString(), currencyId("USD"))
        << "the grid stands on the offending row";
    auto shown = agent->last();
    EXPECT_EQ(shown.text,
              "Дублиране на валута.\r\n\r\nЗа дата 04.05.2031 вече има дефиниран курс за валута "
              "USD.");
    // The refused save left the user's record as it was: still new, both rows.
    EXPECT_TRUE(d->Key().empty());
    EXPECT_EQ(f->ControlValue("cboBank").toString(), bank);
    EXPECT_EQ(g->rowCount(), 2);
    // Changing the day makes it valid.
    f->userSetValue("dtpDate", pelta::Variant(pelta::Date{day.oa + 1}));
    EXPECT_TRUE(d->FormExtender()->SaveDocument());
    EXPECT_EQ(ratesOn(bank, pelta::Date{day.oa + 1}), 1);
}

TEST_F(RatiosTest, CommandDeleteInactiveAsksAndDeletesOnlyInactiveRates) {
    const std::string bank = anyBank();
    auto* d = newRate(bank, day, currencyId("USD"), "1.80");
    form(d->FormExtender())->userSetValue("chkIsActive", pelta::Variant(false));
    ASSERT_TRUE(d->FormExtender()->SaveDocument());
    const std::string inactive = d->Key();
    const auto before = count("SELECT COUNT(*) FROM nom_currratios");

    // Mark the inactive rate and an active one.
    auto* g = grid(list->GridExtender());
    std::vector<pelta::Variant> marks;
    ASSERT_TRUE(g->MoveToRow("ID='" + inactive + "'"));
    marks.push_back(g->CurrentBookmark());
    ASSERT_TRUE(g->MoveToRow("IsActive=True"));
    marks.push_back(g->CurrentBookmark());
    g->SetMultiSelect(true);
    g->SetSelectedBookmarks(marks);

    agent->answer(vbNo, "Желаете ли да изтриете избраните неактивни номенклатури?");
    list->FormExtender()->Execute(kCmdDeleteInactive);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios"), before);

    g->SetSelectedBookmarks(marks);
    agent->answer(vbYes, "Желаете ли да изтриете избраните неактивни номенклатури?");
    list->FormExtender()->Execute(kCmdDeleteInactive);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios"), before - 1);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios WHERE ID = ?1", pelta::Variant(inactive)),
              0);
    EXPECT_EQ(agent->pending(), 0u);
}

TEST_F(RatiosTest, TheGridsOwnDeleteIsRefused) {
    const auto before = count("SELECT COUNT(*) FROM nom_currratios");
    EXPECT_FALSE(list->GridExtender()->DeleteRows());
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios"), before);
    EXPECT_EQ(list->GridExtender()->Rows()->recordCount(), before);
}

TEST_F(RatiosTest, DeleteFromTheFormAsksRemovesAndRefreshesTheList) {
    auto* d = newRate(anyBank(), day, currencyId("USD"), "1.80");
    ASSERT_TRUE(d->FormExtender()->SaveDocument());
    const std::string id = d->Key();
    const int reads = connection->calls["GetNomCurrRatios"];

    agent->answer(vbNo, "Желаете ли да изтриете номенклатурата?");
    d->FormExtender()->Execute(kCmdDelete);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios WHERE ID = ?1", pelta::Variant(id)), 1);

    agent->answer(vbYes, "Желаете ли да изтриете номенклатурата?");
    d->FormExtender()->Execute(kCmdDelete);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios WHERE ID = ?1", pelta::Variant(id)), 0);
    EXPECT_GT(connection->calls["GetNomCurrRatios"], reads) << "the list was read again";
    EXPECT_FALSE(list->ListRecordset()->clone()->find("ID='" + id + "'"));
    EXPECT_TRUE(form(d->FormExtender())->closed());
}

TEST_F(RatiosTest, OpeningARateThatWasDeletedMeanwhileSaysSo) {
    auto* d = newRate(anyBank(), day, currencyId("USD"), "1.80");
    ASSERT_TRUE(d->FormExtender()->SaveDocument());
    const std::string id = d->Key();
    {
        auto db = pelta::bll::openDatabase(dbFile_);
        auto st = db->prepare("DELETE FROM nom_currratios WHERE ID = ?1");
        st->bind(1, pelta::Variant(id));
        st->step();
    }
    ASSERT_TRUE(list->GridExtender()->MoveToRow("ID='" + id + "'"));
    list->FormExtender()->Execute(kCmdOpen);
    EXPECT_EQ(agent->last().text,
              "Номенклатурата не е намерена или недостатъчни права върху данни");
}

TEST_F(RatiosTest, TerminationIsRefusedWhileEditsAreUnsaved) {
    auto* d = newRate(anyBank(), day, currencyId("USD"), "1.80");
    ASSERT_TRUE(d->FormExtender()->SaveDocument());
    form(d->FormExtender())->userSetValue("dtpDate", pelta::Variant(pelta::Date{day.oa + 3}));

    bool cancel = false;
    list->QueryTerminate(cancel);
    EXPECT_TRUE(cancel);

    ASSERT_TRUE(d->FormExtender()->SaveDocument());
    cancel = false;
    list->QueryTerminate(cancel);
    EXPECT_FALSE(cancel);
    list->Terminate();
    details.reset();
    list.reset();
    listObject.reset();
    EXPECT_EQ(LibObject::liveObjects(), 0) << "every screen released";
}

class RatiosOperatorTest : public RatiosTest {
protected:
    void SetUp() override {
        ScreenTest::SetUp();
        connect("operator");
        openRatios();
    }
};

TEST_F(RatiosOperatorTest, AUserWhoMayNotCreateIsToldSo) {
    list->FormExtender()->Execute(kCmdNew);
    EXPECT_EQ(agent->last().text, "Недостатъчни права за създаване на Валутни курсове");
    EXPECT_EQ(connection->calls["UpdNomCurrRatiosDetails"], 0);
}

}  // namespace
}  // namespace screentest
