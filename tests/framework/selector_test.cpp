// A list shown to the person as a selector through the framework services:
// read when first shown, what the person chose answered by the selector's
// ShowSelect, cancelled, unscripted, and the selectors the framework refuses.
#include <gtest/gtest.h>

#include "framework/form_extender.h"
#include "framework/grid_extender.h"
#include "framework/services.h"
#include "framework/user_agent.h"
#include "library/contracts/Public.h"
#include "test_screens.h"

namespace {

using namespace fwtest;
using pelta::fw::GridExtender;
using pelta::fw::PromptKind;
using pelta::fw::ScriptedUserAgent;
using pelta::fw::UnscriptedPrompt;

// The rates list as a selector: the marked rows (else the current one) are
// chosen, answered as their keys joined by U+0001.
class RatesSelector final : public RatiosList, public IZonSelector {
public:
    bool ShowSelect(pelta::Variant& CurrentValue, pelta::Variant& SearchText,
                    pelta::Variant& Result) override {
        ++shows;
        given = {CurrentValue, SearchText};
        chosen = m_oGridExt->SelectedBookmarks();
        if (chosen.empty() && m_oGridExt->HasCurrentRow())
            chosen.push_back(m_oGridExt->CurrentBookmark());
        next = 0;
        std::string keys;
        auto row = m_rsList->clone();
        for (const auto& b : chosen) {
            row->setBookmark(b);
            keys += (keys.empty() ? "" : "\x01") + row->value("ID").toString();
        }
        Result = pelta::Variant(keys);
        return !chosen.empty();
    }
    bool GetNextItem(pelta::Variant& ID, pelta::Variant& Name, pelta::Variant& Item) override {
        if (next >= chosen.size()) return false;
        auto row = m_rsList->clone();
        row->setBookmark(chosen[next]);
        Item = chosen[next++];
        ID = row->value("ID");
        Name = row->value("PrName");
        return true;
    }
    bool QuickFind(const std::string&, pelta::Variant&) override { return false; }
    bool Reset() override {
        next = 0;
        return true;
    }

    int shows = 0;
    std::vector<pelta::Variant> given;
    std::vector<pelta::Variant> chosen;
    size_t next = 0;
};

class Selector : public ::testing::Test {
protected:
    void SetUp() override {
        pelta::fw::registerFramework();
        pelta::fw::services()->reset();
        serveRates(*connection);
        ASSERT_TRUE(selector->InitClientSite(site.get()));
    }

    bool show(pelta::Object* object, pelta::Variant& result, const std::string& caption = {}) {
        return pelta::fw::services()->ShowSelector(object, caption, result);
    }
    size_t reads() const { return connection->callsOf("GetNomCurrRatios").size(); }
    GridExtender& grid() { return *pelta::query<GridExtender>(selector->m_oGridExt.get()); }

    pelta::Ref<PreparedConnection> connection = pelta::makeRef<PreparedConnection>();
    pelta::Ref<pelta::fw::ClientSite> site =
        pelta::makeRef<pelta::fw::ClientSite>(connection, true);
    pelta::Ref<RatesSelector> selector = pelta::makeRef<RatesSelector>();
    pelta::Ref<ScriptedUserAgent> agent = pelta::makeRef<ScriptedUserAgent>();
    pelta::fw::UserAgentScope scope{agent};
};

TEST_F(Selector, TheListIsReadWhenFirstShownAndTheRowChosenIsAnswered) {
    EXPECT_EQ(reads(), 0u);
    agent->answerSelector("PrName = 'УниКредит'", "Курс");
    pelta::Variant result;
    ASSERT_TRUE(show(selector.get(), result, "Курс за документа"));
    EXPECT_EQ(result.toString(), kRateUcb);
    EXPECT_EQ(reads(), 1u);
    ASSERT_EQ(selector->given.size(), 2u);
    EXPECT_TRUE(selector->given[0].isEmpty()) << "the person positioned the list, not the caller";
    EXPECT_TRUE(selector->given[1].isEmpty());
    pelta::fw::Prompt p = agent->last();
    EXPECT_EQ(p.kind, PromptKind::Selector);
    EXPECT_EQ(p.caption, "Курс за документа");

    // Shown again, the list is not read again; the walk follows the answer.
    agent->answerSelector(std::string("ID = '") + kRateBnb2 + "'");
    ASSERT_TRUE(show(selector.get(), result));
    EXPECT_EQ(result.toString(), kRateBnb2);
    EXPECT_EQ(reads(), 1u);
    EXPECT_EQ(agent->last().caption, "Валутни курсове") << "no caption: the list's";
    pelta::Variant id, name, item;
    ASSERT_TRUE(selector->GetNextItem(id, name, item));
    EXPECT_EQ(id.toString(), kRateBnb2);
    EXPECT_FALSE(selector->GetNextItem(id, name, item));
    EXPECT_EQ(agent->pending(), 0u);
}

TEST_F(Selector, MarkedRowsAreChosenInTheOrderMarked) {
    agent->answerSelectorRows(
        {std::string("ID = '") + kRateUcb + "'", std::string("ID = '") + kRateBnb1 + "'"});
    pelta::Variant result;
    ASSERT_TRUE(show(selector.get(), result));
    EXPECT_EQ(result.toString(), std::string(kRateUcb) + "\x01" + kRateBnb1);
    EXPECT_EQ(selector->m_oGridExt->CurrentValue("ID").toString(), kRateUcb);

    // One row chosen later leaves no marks of the earlier choice behind.
    agent->answerSelector("PrName = 'БНБ'");
    ASSERT_TRUE(show(selector.get(), result));
    EXPECT_EQ(result.toString(), kRateBnb1);
}

TEST_F(Selector, ACancelledSelectorAnswersNothingAndAsksTheSelectorNothing) {
    agent->cancelSelector();
    pelta::Variant result("stale");
    EXPECT_FALSE(show(selector.get(), result));
    EXPECT_TRUE(result.isEmpty());
    EXPECT_EQ(selector->shows, 0);
    EXPECT_EQ(agent->last().kind, PromptKind::Selector);
}

TEST_F(Selector, AnUnscriptedSelectorOrARowNotShownThrows) {
    pelta::Variant result;
    EXPECT_THROW(show(selector.get(), result), UnscriptedPrompt);
    ASSERT_EQ(agent->unscripted().size(), 1u);
    EXPECT_EQ(agent->unscripted()[0].kind, PromptKind::Selector);

    // The person's group filter hides UniCredit: that row cannot be chosen.
    agent->clear();
    grid().setGroupValue(pelta::Variant("БНБ"));
    agent->answerSelector("PrName = 'УниКредит'");
    EXPECT_THROW(show(selector.get(), result), UnscriptedPrompt);
    EXPECT_EQ(selector->shows, 0);
    agent->answerSelector("IsActive = False");
    ASSERT_TRUE(show(selector.get(), result));
    EXPECT_EQ(result.toString(), kRateBnb2) << "the group filter stays as the person left it";

    agent->answerSelector("PrName = 'БНБ'", "Друго заглавие");
    EXPECT_THROW(show(selector.get(), result, "Курс"), UnscriptedPrompt);
}

TEST_F(Selector, AListThatCannotBeReadIsNotShown) {
    connection->fail("GetNomCurrRatios");
    agent->answerSelector("PrName = 'БНБ'");
    pelta::Variant result;
    EXPECT_FALSE(show(selector.get(), result));
    EXPECT_TRUE(agent->prompts().empty());
    EXPECT_EQ(agent->pending(), 1u);
}

TEST_F(Selector, TheFrameworkRefusesWhatItCannotShow) {
    pelta::Variant result;
    // Not a selector.
    auto list = pelta::makeRef<RatiosList>();
    ASSERT_TRUE(list->InitClientSite(site.get()));
    try {
        show(list.get(), result);
        FAIL() << "a plain list was shown as a selector";
    } catch (const pelta::Error& e) {
        EXPECT_EQ(e.number(), pelta::errc::InvalidProcedureCall);
    }
    EXPECT_THROW(show(nullptr, result), pelta::Error);
    // A selector never given its client site has no list.
    auto bare = pelta::makeRef<RatesSelector>();
    try {
        show(bare.get(), result);
        FAIL() << "a selector without a list was shown";
    } catch (const pelta::Error& e) {
        EXPECT_EQ(e.number(), pelta::errc::ObjectRequired);
    }
    EXPECT_TRUE(agent->prompts().empty());
}

// An agent of a host that shows no lists: the default cancels.
class PlainAgent final : public pelta::fw::UserAgent {
public:
    int32_t messageBox(const pelta::fw::Prompt&) override { return vbOK; }
    void anchoredMessage(const pelta::fw::Prompt&) override {}
    std::optional<pelta::Variant> inputBox(const pelta::fw::Prompt&) override {
        return std::nullopt;
    }
};

TEST_F(Selector, AnAgentThatShowsNoListsCancels) {
    pelta::fw::UserAgentScope plain(pelta::makeRef<PlainAgent>());
    pelta::Variant result;
    EXPECT_FALSE(show(selector.get(), result));
    EXPECT_EQ(selector->shows, 0);
}

}  // namespace
