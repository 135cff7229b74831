// The item editor's attributes that name another item or a partner, chosen
// by the person in the items' or the partners' list shown as a selector, and
// saved with the item.
#include "items_details_support.h"
#include "library/frame/LibObject.h"

namespace screentest {
namespace {

class ItemSelectorsTest : public ItemDetailsTest {
protected:
    std::string partnerId(const std::string& code) {
        return text("SELECT ID FROM nom_contragents WHERE Code = ?1", pelta::Variant(code));
    }
    std::string partnerName(const std::string& code) {
        return text("SELECT Name FROM nom_contragents WHERE Code = ?1", pelta::Variant(code));
    }
    std::string itemName(const std::string& code) {
        return text("SELECT Name FROM nom_items WHERE Code = ?1", pelta::Variant(code));
    }
    std::string column(const std::string& column, const std::string& id) {
        return text("SELECT " + column + " FROM nom_items WHERE ID = ?1", pelta::Variant(id));
    }
    void pick(frmItemsDetails* d, const std::string& field) {
        d->Attributes()->Events().ButtonClick(field);
    }
};

TEST_F(ItemSelectorsTest, APartnerChosenInThePartnersListIsTheProducerAndIsSaved) {
    auto* d = openItem(firstCode());
    ASSERT_NE(d, nullptr);
    auto* a = d->Attributes();
    const int reads = connection->calls["GetNomContragents"];

    agent->answerSelector("Code = '3'", "Производител");
    pick(d, "ProducerCg_ID");
    EXPECT_EQ(agent->last().kind, pelta::fw::PromptKind::Selector);
    EXPECT_EQ(C2Str(a->Value("ProducerCg_ID")), partnerId("3"));
    EXPECT_EQ(a->ShownText("ProducerCg_ID"), partnerName("3"));
    EXPECT_TRUE(f(d)->isModified());
    EXPECT_EQ(connection->calls["GetNomContragents"], reads + 1) << "the list is read when shown";

    // The importer through the same selector, which is not read again; the
    // first of the rows marked is taken.
    agent->answerSelectorRows({"Code = '5'", "Code = '6'"}, "Вносител");
    pick(d, "ImporterCg_ID");
    EXPECT_EQ(C2Str(a->Value("ImporterCg_ID")), partnerId("5"));
    EXPECT_EQ(a->ShownText("ImporterCg_ID"), partnerName("5"));
    EXPECT_EQ(connection->calls["GetNomContragents"], reads + 1);

    // Cancelled: nothing changes.
    agent->cancelSelector("Производител");
    pick(d, "ProducerCg_ID");
    EXPECT_EQ(C2Str(a->Value("ProducerCg_ID")), partnerId("3"));
    EXPECT_EQ(agent->pending(), 0u);

    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    EXPECT_EQ(column("ProducerCg_ID", d->Key()), partnerId("3"));
    EXPECT_EQ(column("ImporterCg_ID", d->Key()), partnerId("5"));

    // Opened again, the form shows the partners' names.
    d = openItem(firstCode());
    EXPECT_EQ(d->Attributes()->ShownText("ProducerCg_ID"), partnerName("3"));
    EXPECT_EQ(d->Attributes()->ShownText("ImporterCg_ID"), partnerName("5"));
}

TEST_F(ItemSelectorsTest, ItemsChosenInTheItemsListAreTheReplacingAndAccountingItems) {
    auto* d = openItem("0000007");
    ASSERT_NE(d, nullptr);
    auto* a = d->Attributes();

    agent->answerSelector("Code = '0000003'", "Продукт");
    pick(d, "SecItm_ID");
    EXPECT_EQ(C2Str(a->Value("SecItm_ID")), itemId("0000003"));
    EXPECT_EQ(a->ShownText("SecItm_ID"), itemName("0000003"));
    agent->answerSelector("Code = '0000004'", "Счетоводен продукт");
    pick(d, "AccItm_ID");
    agent->answerSelector("Code = '0000005'", "Основен вариант");
    pick(d, "VariantParentItm_ID");
    EXPECT_EQ(a->ShownText("VariantParentItm_ID"), itemName("0000005"));

    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    const std::string id = itemId("0000007");
    EXPECT_EQ(column("SecItm_ID", id), itemId("0000003"));
    EXPECT_EQ(column("AccItm_ID", id), itemId("0000004"));
    EXPECT_EQ(column("VariantParentItm_ID", id), itemId("0000005"));
    EXPECT_FALSE(f(d)->isModified());
}

TEST_F(ItemSelectorsTest, ACancelledOrUnansweredSelectorChangesNothing) {
    auto* d = openItem(firstCode());
    ASSERT_NE(d, nullptr);
    auto* a = d->Attributes();
    const pelta::Variant before = a->Value("SecItm_ID");

    agent->cancelSelector();
    pick(d, "SecItm_ID");
    EXPECT_EQ(a->Value("SecItm_ID"), before);
    EXPECT_FALSE(f(d)->isModified());

    // A row the list does not show cannot be chosen (the form's handler
    // takes the scripting error for its own; the agent remembers it).
    agent->answerSelector("Code = 'няма такъв'");
    pick(d, "SecItm_ID");
    ASSERT_FALSE(agent->unscripted().empty());
    EXPECT_EQ(agent->unscripted()[0].kind, pelta::fw::PromptKind::Selector);
    EXPECT_EQ(a->Value("SecItm_ID"), before);

    // The cost centres are still typed by code.
    agent->answerInput(pelta::Variant(""), "Код или име:");
    pick(d, "CcProject_ID");
    EXPECT_TRUE(a->Value("CcProject_ID").isNull());
}

TEST_F(ItemSelectorsTest, TheSelectorsLiveWithTheFormAndGoWithIt) {
    close();
    const int64_t none = LibObject::liveObjects();
    open();
    auto* d = openItem(firstCode());
    ASSERT_NE(d, nullptr);
    const int64_t withForm = LibObject::liveObjects();
    agent->answerSelector("Code = '3'");
    pick(d, "ProducerCg_ID");
    agent->answerSelector("Code = '0000003'");
    pick(d, "SecItm_ID");
    EXPECT_EQ(LibObject::liveObjects(), withForm + 2) << "one selector of each kind";
    agent->answerSelector("Code = '0000004'");
    pick(d, "AccItm_ID");
    EXPECT_EQ(LibObject::liveObjects(), withForm + 2) << "kept, not made again";

    details.reset();
    close();  // the list terminates its form, which terminates its selectors
    EXPECT_EQ(LibObject::liveObjects(), none);
}

}  // namespace
}  // namespace screentest
