// The item editor opened from the items list, as the framework opens it.
#pragma once

#include <string>

#include "items_support.h"
#include "library/items/frmItemsDetails.h"
#include "platform/data/propertybag.h"

namespace screentest {

// Answers every save of an item with the refusal it was given, as a service
// would that checks what this one does not.
class RefusingConnection final : public IBllConnection {
public:
    explicit RefusingConnection(pelta::Ref<IBllConnection> inner) : inner_(std::move(inner)) {}
    void Call(int32_t CallKind, const std::string& Operation, const pelta::Bytes& Request,
              pelta::Bytes& Response, int32_t Reserved, pelta::ObjectRef& Context,
              const std::string& Options, bool& Success) override {
        if (Operation != "UpdNomItemsDetails" || code == 0) {
            inner_->Call(CallKind, Operation, Request, Response, Reserved, Context, Options,
                         Success);
            return;
        }
        pelta::PropertyBag bag;
        bag.writeProperty("BllError", pelta::Variant(code));
        bag.writeProperty("BllItem", pelta::Variant("Цвят"));
        Response = bag.contents();
        Success = true;
    }
    pelta::Ref<IAppParameters> AppParameters() override { return inner_->AppParameters(); }
    std::string CurrentUserID() override { return inner_->CurrentUserID(); }
    std::string CurrentUserName() override { return inner_->CurrentUserName(); }

    int32_t code = 0;

private:
    pelta::Ref<IBllConnection> inner_;
};

class ItemDetailsTest : public ItemsTest {
protected:
    void TearDown() override {
        details.reset();
        ItemsTest::TearDown();
    }

    frmItemsDetails* opened() {
        auto found = pelta::fw::services()->RecordDeletion()->FindDetailForm(items->FormExtender());
        details = pelta::Ref<frmItemsDetails>(pelta::query<frmItemsDetails>(found.get()));
        return details.get();
    }
    frmItemsDetails* newItem() {
        items->FormExtender()->Execute(kCmdNew);
        return opened();
    }
    frmItemsDetails* openItem(const std::string& code) {
        g()->SetSelectedBookmarks({});
        EXPECT_TRUE(g()->MoveToRow("Code = '" + code + "'"));
        items->FormExtender()->Execute(kCmdOpen);
        return opened();
    }
    pelta::fw::FormExtender* f(frmItemsDetails* d) { return form(d->FormExtender()); }
    std::string text(const std::string& sql, const pelta::Variant& p1 = {}) {
        auto v = scalar(sql, p1);
        return v.isNull() ? std::string() : v.toString();
    }
    std::string firstCode() { return text("SELECT Code FROM nom_items ORDER BY Code LIMIT 1"); }
    // A save that is refused: the anchored message it showed.
    pelta::fw::Prompt refused(frmItemsDetails* d) {
        agent->clear();
        EXPECT_FALSE(d->FormExtender()->SaveDocument());
        return agent->last();
    }

    pelta::Ref<frmItemsDetails> details;
};

}  // namespace screentest
