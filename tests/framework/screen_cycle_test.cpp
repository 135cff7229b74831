// A list and its detail form driven through the framework as a host drives
// them: fetch, fill, commands, questions, save, delete.
#include <gtest/gtest.h>

#include "framework/form_extender.h"
#include "framework/grid_extender.h"
#include "framework/record_deletion.h"
#include "framework/services.h"
#include "framework/user_agent.h"
#include "test_screens.h"

namespace {

using namespace fwtest;
using pelta::fw::FormExtender;
using pelta::fw::GridExtender;
using pelta::fw::ScriptedUserAgent;

class ScreenCycle : public ::testing::Test {
protected:
    void SetUp() override {
        pelta::fw::registerFramework();
        pelta::fw::services()->reset();
        serveRates(*connection);
    }

    pelta::Ref<RatiosList> openList() {
        auto list = pelta::makeRef<RatiosList>();
        EXPECT_TRUE(list->InitClientSite(site.get()));
        EXPECT_TRUE(list->m_oForm->Refresh());
        return list;
    }

    static FormExtender& form(const pelta::Ref<IFormExtender>& f) {
        return *pelta::query<FormExtender>(f.get());
    }
    static GridExtender& grid(const pelta::Ref<IGridExtender>& g) {
        return *pelta::query<GridExtender>(g.get());
    }

    pelta::Ref<PreparedConnection> connection = pelta::makeRef<PreparedConnection>();
    pelta::Ref<pelta::fw::ClientSite> site = pelta::makeRef<pelta::fw::ClientSite>(connection);
    pelta::Ref<ScriptedUserAgent> agent = pelta::makeRef<ScriptedUserAgent>();
    pelta::fw::UserAgentScope scope{agent};
};

TEST_F(ScreenCycle, ListFetchesFillsAndRefreshesThroughTheFramework) {
    auto list = openList();
    auto fetches = connection->callsOf("GetNomCurrRatios");
    ASSERT_EQ(fetches.size(), 1u);
    EXPECT_EQ(fetches[0].kind, kBllCallKind);
    EXPECT_EQ(fetches[0].requestSize, 0u);  // no parameters: empty bytes
    EXPECT_EQ(grid(list->m_oGridExt).rowCount(), 3);
    EXPECT_EQ(list->m_oGridExt->CurrentValue("ID").toString(), kRateBnb1);

    // The menu as the screen left it.
    auto& f = form(list->m_oForm);
    for (int32_t removed : {502, 202, 204, 304, 506, 103, 201})
        EXPECT_EQ(f.command(removed), nullptr);
    ASSERT_NE(f.command(kCmdOpen), nullptr);
    EXPECT_EQ(f.command(kCmdOpen)->caption, "Редакция валутен курс...\tCtrl+O");
    EXPECT_EQ(f.command(kCmdOpen)->tooltip, "Редакция на валутен курс (Ctrl+O)");
    EXPECT_EQ(f.command(kCmdOpen)->shortcut, "Ctrl+O");

    // F5 reaches the screen's own refresh; a failed read keeps the rows shown.
    EXPECT_TRUE(f.executeShortcut("F5"));
    EXPECT_EQ(connection->callsOf("GetNomCurrRatios").size(), 2u);
    connection->fail("GetNomCurrRatios");
    EXPECT_FALSE(list->m_oForm->Refresh());
    EXPECT_EQ(grid(list->m_oGridExt).rowCount(), 3);
}

TEST_F(ScreenCycle, OpenAsksRightsAndReusesTheOpenDetailForm) {
    auto list = openList();
    list->m_oGridExt->MoveToRow(std::string("ID = '") + kRateUcb + "'");
    list->m_oForm->Execute(kCmdOpen);
    ASSERT_TRUE(list->m_oDetails);
    auto rights = connection->callsOf("GetUserRights");
    ASSERT_EQ(rights.size(), 1u);
    EXPECT_EQ(rights[0].request->readProperty("Screen").toString(), "ctxRatios");

    auto details = connection->callsOf("GetNomCurrRatiosDetails");
    ASSERT_EQ(details.size(), 1u);
    EXPECT_EQ(details[0].request->readProperty("ID").toString(), kRateUcb);
    EXPECT_TRUE(details[0].request->readProperty("Referentials").toBool());

    // A second opening finds the same form, and the reference lists are not
    // asked for again; the rights were asked once.
    list->m_oGridExt->MoveToRow(std::string("ID = '") + kRateBnb1 + "'");
    list->m_oForm->Execute(kCmdOpen);
    EXPECT_EQ(list->detailsCreated, 1);
    details = connection->callsOf("GetNomCurrRatiosDetails");
    ASSERT_EQ(details.size(), 2u);
    EXPECT_EQ(details[1].request->readProperty("ID").toString(), kRateBnb1);
    EXPECT_FALSE(details[1].request->readProperty("Referentials").toBool());
    EXPECT_EQ(connection->callsOf("GetUserRights").size(), 1u);

    // Once closed it is no longer found; another list's detail form never is.
    ASSERT_TRUE(list->m_oDetails->m_oForm->CloseDocument());
    auto services = pelta::fw::services();
    EXPECT_FALSE(services->RecordDeletion()->FindDetailForm(list->m_oForm.get()));
    auto other = pelta::makeRef<RatiosList>();
    auto otherSite = pelta::makeRef<pelta::fw::ClientSite>(connection);
    other->InitClientSite(otherSite.get());
    list->m_oForm->Execute(kCmdOpen);
    EXPECT_EQ(list->detailsCreated, 2);
    EXPECT_FALSE(services->RecordDeletion()->FindDetailForm(other->m_oForm.get()));
}

TEST_F(ScreenCycle, MissingRightOpensNothing) {
    serveRates(*connection, 8 | 16);
    auto list = openList();
    list->m_oForm->Execute(kCmdOpen);
    list->m_oForm->Execute(kCmdNew);
    EXPECT_FALSE(list->m_oDetails);
    EXPECT_TRUE(connection->callsOf("GetNomCurrRatiosDetails").empty());

    // A failed rights call grants nothing and is asked again.
    connection->fail("GetUserRights");
    auto opener = create<IDetailOpener>(kProgIdDetailOpener);
    opener->Init(site.get(), {}, "ctxRatios");
    EXPECT_FALSE(opener->HasRight(kRightOpenDetails));
    connection->serve("GetUserRights", rightsAnswer(kRightOpenDetails | kRightEdit));
    EXPECT_TRUE(opener->HasRight(kRightOpenDetails));
    EXPECT_TRUE(opener->HasRight(kRightEdit));
    EXPECT_FALSE(opener->HasRight(kRightCreate));
}

TEST_F(ScreenCycle, OpenWithoutCurrentRowOpensNothing) {
    connection->serve("GetNomCurrRatios", [](const pelta::PropertyBag&) {
        auto empty = ratesList();
        while (empty->recordCount() > 0) {
            empty->moveFirst();
            empty->deleteRecord();
        }
        empty->updateBatch();
        auto b = bag();
        b->writeProperty("List", pelta::Variant(pelta::ObjectRef(empty)));
        return b;
    });
    auto list = openList();
    EXPECT_FALSE(list->m_oGridExt->HasCurrentRow());
    list->m_oForm->Execute(kCmdOpen);
    EXPECT_FALSE(list->m_oDetails);
}

TEST_F(ScreenCycle, DeleteInactiveFollowsTheAnswer) {
    auto list = openList();
    auto& g = *list->m_oGridExt;
    g.SetMultiSelect(true);
    std::vector<pelta::Variant> all;
    for (auto* id : {kRateBnb1, kRateBnb2, kRateUcb}) {
        ASSERT_TRUE(g.MoveToRow(std::string("ID = '") + id + "'"));
        all.push_back(g.CurrentBookmark());
    }
    g.SetSelectedBookmarks(all);

    // No: nothing is sent.
    agent->answer(vbNo, "неактивни");
    list->m_oForm->Execute(kCmdDeleteInactive);
    EXPECT_TRUE(connection->callsOf("DelNomCurrRatios").empty());
    auto question = agent->last();
    EXPECT_EQ(question.style, vbYesNo | vbQuestion);
    EXPECT_EQ(question.caption, "Валутни курсове");

    // Yes: the inactive keys go in one call, joined by U+0001, and the list
    // is fetched again.
    agent->answer(vbYes);
    list->m_oForm->Execute(kCmdDeleteInactive);
    auto deletes = connection->callsOf("DelNomCurrRatios");
    ASSERT_EQ(deletes.size(), 1u);
    EXPECT_EQ(deletes[0].request->readProperty("ID").toString(),
              std::string(kRateBnb2) + "\x01" + kRateUcb);
    EXPECT_EQ(connection->callsOf("GetNomCurrRatios").size(), 2u);

    // A refusal of the service is a failure and is kept for the host.
    connection->serve("DelNomCurrRatios", refusal(19));
    g.SetSelectedBookmarks({});
    ASSERT_TRUE(g.MoveToRow(std::string("ID = '") + kRateUcb + "'"));
    auto deletion = pelta::fw::services()->recordDeletion();
    EXPECT_FALSE(deletion->DeleteRecords(connection.get(), &g, list->m_oForm.get(), kBllCallKind,
                                         "DelNomCurrRatios", "ID", true));
    ASSERT_TRUE(deletion->lastRefusal());
    EXPECT_EQ(deletion->lastRefusal()->code, 19);
    EXPECT_EQ(deletion->lastRefusal()->table, "CurrRatios");

    // Only an active row under the cursor: nothing to send.
    ASSERT_TRUE(g.MoveToRow(std::string("ID = '") + kRateBnb1 + "'"));
    EXPECT_FALSE(deletion->DeleteRecords(connection.get(), &g, list->m_oForm.get(), kBllCallKind,
                                         "DelNomCurrRatios", "ID", true));
    EXPECT_TRUE(deletion->lastKeys().empty());
    EXPECT_EQ(agent->pending(), 0u);
}

TEST_F(ScreenCycle, AnUnscriptedQuestionFailsLoudly) {
    auto list = openList();
    EXPECT_THROW(list->m_oForm->Execute(kCmdDeleteInactive), pelta::fw::UnscriptedPrompt);
    ASSERT_EQ(agent->unscripted().size(), 1u);
    EXPECT_EQ(agent->unscripted()[0].text,
              "Желаете ли да изтриете избраните неактивни номенклатури?");
    // A scripted button the question does not offer fails as loudly.
    agent->answer(vbOK);
    EXPECT_THROW(list->m_oForm->Execute(kCmdDeleteInactive), pelta::fw::UnscriptedPrompt);
    // So does an answer meant for another text.
    agent->clear();
    agent->answer(vbYes, "номенклатурата?");
    EXPECT_THROW(list->m_oForm->Execute(kCmdDeleteInactive), pelta::fw::UnscriptedPrompt);
    EXPECT_TRUE(connection->callsOf("DelNomCurrRatios").empty());
}

TEST_F(ScreenCycle, GridDeleteKeyIsRefusedByTheList) {
    auto list = openList();
    EXPECT_FALSE(list->m_oGridExt->DeleteRows());
    EXPECT_EQ(grid(list->m_oGridExt).rowCount(), 3);
    EXPECT_FALSE(list->m_oGridExt->EditState());
}

TEST_F(ScreenCycle, DetailSaveRunsTheChecksInOrder) {
    auto list = openList();
    list->m_oForm->Execute(kCmdOpen);
    auto d = list->m_oDetails;
    ASSERT_TRUE(d);
    auto& f = form(d->m_oForm);
    EXPECT_EQ(f.ControlValue("cboBank").toString(), kBankBnb);
    EXPECT_EQ(f.documentKey(), kRateBnb1);

    // Nothing changed: saving sends nothing.
    EXPECT_TRUE(d->m_oForm->SaveDocument());
    EXPECT_TRUE(connection->callsOf("UpdNomCurrRatiosDetails").empty());

    // No bank: the message stands at the bank field and nothing is sent.
    f.userSetValue("cboBank", pelta::Variant(""));
    EXPECT_FALSE(d->m_oForm->SaveDocument());
    auto message = agent->last();
    EXPECT_EQ(message.kind, pelta::fw::PromptKind::Anchored);
    EXPECT_EQ(message.text, "Моля изберете банка");
    EXPECT_EQ(message.control, "cboBank");
    EXPECT_EQ(f.focus(), "cboBank");
    EXPECT_TRUE(connection->callsOf("UpdNomCurrRatiosDetails").empty());

    // A row without rate is refused and the grid stands on it.
    f.userSetValue("cboBank", pelta::Variant(kBankBnb));
    auto& g = grid(d->m_oGridExt);
    ASSERT_TRUE(g.MoveToRow(std::string("Currency_ID = '") + kCurrEur + "'"));
    ASSERT_TRUE(g.editCell("Ratio", pelta::Variant::null()));
    ASSERT_TRUE(g.MoveToRow(std::string("Currency_ID = '") + kCurrUsd + "'"));
    EXPECT_TRUE(g.EditState());
    EXPECT_FALSE(d->m_oForm->SaveDocument());
    EXPECT_EQ(agent->last().text, "Моля въведете курс");
    EXPECT_EQ(g.CurrentValue("Currency_ID").toString(), kCurrEur);
    EXPECT_TRUE(connection->callsOf("UpdNomCurrRatiosDetails").empty());

    // Corrected: uploaded and saved; the request carried the edits as bytes.
    ASSERT_TRUE(g.editCell("Ratio", pelta::Variant(1.96)));
    f.userSetValue("txtNote", pelta::Variant("поправен"));
    EXPECT_TRUE(d->m_oForm->SaveDocument());
    auto saves = connection->callsOf("UpdNomCurrRatiosDetails");
    ASSERT_EQ(saves.size(), 1u);
    auto sentHead = recordsetOf(saves[0].request->readProperty("Head"));
    ASSERT_TRUE(sentHead);
    sentHead->moveFirst();
    EXPECT_EQ(sentHead->value("Note").toString(), "поправен");
    EXPECT_EQ(sentHead->value("LU").toString(), "Тест");
    auto sentRows = recordsetOf(saves[0].request->readProperty("Rows"));
    ASSERT_TRUE(sentRows->find(std::string("Currency_ID = '") + kCurrEur + "'"));
    EXPECT_DOUBLE_EQ(sentRows->value("Ratio").toDouble(), 1.96);
    EXPECT_EQ(saves[0].request->readProperty("NeedList").toString(), "ctxRatios");
    // The answer was filled back: the form is no longer modified.
    EXPECT_FALSE(f.isModified());
}

TEST_F(ScreenCycle, RefusedSaveKeepsTheEdits) {
    auto list = openList();
    list->m_oForm->Execute(kCmdOpen);
    auto d = list->m_oDetails;
    auto& f = form(d->m_oForm);
    connection->serve("UpdNomCurrRatiosDetails", refusal(18));
    f.userSetValue("txtNote", pelta::Variant("друг"));
    EXPECT_FALSE(d->m_oForm->SaveDocument());
    EXPECT_EQ(agent->last().text, "Грешка 18");
    // Nothing was filled back over the edits.
    EXPECT_EQ(f.ControlValue("txtNote").toString(), "друг");
    EXPECT_EQ(connection->callsOf("UpdNomCurrRatiosDetails").size(), 1u);
    connection->fail("UpdNomCurrRatiosDetails");
    f.userSetValue("txtNote", pelta::Variant("трети"));
    EXPECT_FALSE(d->m_oForm->SaveDocument());
    EXPECT_EQ(f.ControlValue("txtNote").toString(), "трети");
}

TEST_F(ScreenCycle, DetailDeleteAsksThenDeletesAndCloses) {
    auto list = openList();
    list->m_oForm->Execute(kCmdOpen);
    auto d = list->m_oDetails;
    agent->answer(vbNo);
    d->m_oForm->Execute(kCmdDelete);
    EXPECT_TRUE(connection->callsOf("DelNomCurrRatios").empty());
    EXPECT_FALSE(form(d->m_oForm).closed());

    agent->answer(vbYes, "номенклатурата");
    d->m_oForm->Execute(kCmdDelete);
    auto deletes = connection->callsOf("DelNomCurrRatios");
    ASSERT_EQ(deletes.size(), 1u);
    EXPECT_EQ(deletes[0].request->readProperty("ID").toString(), kRateBnb1);
    EXPECT_TRUE(form(d->m_oForm).closed());
}

TEST_F(ScreenCycle, NewRecordThroughTheFramework) {
    auto list = openList();
    list->m_oForm->Execute(kCmdNew);
    auto d = list->m_oDetails;
    ASSERT_TRUE(d);
    auto& f = form(d->m_oForm);
    EXPECT_TRUE(f.documentKey().empty());
    EXPECT_TRUE(f.ControlValue("chkIsActive").toBool());
    EXPECT_EQ(connection->callsOf("GetNomCurrRatiosDetails")
                  .back()
                  .request->readProperty("ID")
                  .toString(),
              "");

    // In a shown document command 101 is the framework's: NewDocument, then
    // fetch and fill.
    d->show(kRateBnb2);
    int before = f.fetchCount();
    d->m_oForm->Execute(kCmdNew);
    EXPECT_EQ(f.fetchCount(), before + 1);
    EXPECT_TRUE(d->key.empty());
    EXPECT_TRUE(f.documentKey().empty());
}

TEST_F(ScreenCycle, MovePositionFetchesTheKeyOfTheBookmark) {
    auto list = openList();
    list->m_oForm->Execute(kCmdOpen);
    auto d = list->m_oDetails;
    auto& f = form(d->m_oForm);
    EXPECT_TRUE(f.movePosition(pelta::Variant(std::vector<pelta::Variant>{kRateUcb})));
    EXPECT_EQ(d->key, kRateUcb);
    EXPECT_EQ(f.documentKey(), kRateUcb);
    auto fetches = connection->callsOf("GetNomCurrRatiosDetails");
    EXPECT_EQ(fetches.back().request->readProperty("ID").toString(), kRateUcb);
    EXPECT_FALSE(fetches.back().request->readProperty("Referentials").toBool());
    // After the cache is flushed the reference lists are asked for again.
    f.flushCache();
    d->m_oForm->Refresh();
    EXPECT_TRUE(connection->callsOf("GetNomCurrRatiosDetails")
                    .back()
                    .request->readProperty("Referentials")
                    .toBool());
}

TEST_F(ScreenCycle, MissingRecordIsReportedAndCancelsTheFetch) {
    connection->serve("GetNomCurrRatiosDetails", [](const pelta::PropertyBag&) {
        auto b = bag();
        b->writeProperty("Head", pelta::Variant(pelta::ObjectRef(rateHead({}))));
        b->writeProperty("Rows", pelta::Variant(pelta::ObjectRef(rateRows({}))));
        return b;
    });
    auto list = openList();
    list->m_oForm->Execute(kCmdOpen);
    ASSERT_TRUE(list->m_oDetails);
    EXPECT_EQ(agent->last().text,
              "Номенклатурата не е намерена или недостатъчни права върху данни");
    EXPECT_EQ(agent->last().style, vbExclamation);
    // The reference lists are asked for again on the next fetch.
    EXPECT_TRUE(list->m_oDetails->m_oForm->Referentials());
}

TEST_F(ScreenCycle, ErrorsOfHandlersReachTheCaller) {
    auto list = openList();
    list->m_oForm->Events().FillControls = [] {
        pelta::raise(pelta::errc::TypeMismatch, "from the screen");
    };
    try {
        list->m_oForm->Refresh();
        FAIL() << "the error was swallowed";
    } catch (const pelta::Error& e) {
        EXPECT_EQ(e.number(), pelta::errc::TypeMismatch);
    }
}

}  // namespace
