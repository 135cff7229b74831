// The partners' list opened as a host opens it, and the partner editor it
// opens, over the real service on a demo database with partners.
#pragma once

#include <string>

#include "framework/extenders.h"
#include "library/contracts/Constants.h"
#include "library/frame/mdGlobals.h"
#include "library/partners/ctxContragents.h"
#include "library/partners/frmContragentsDetails.h"
#include "platform/automation/guid.h"
#include "platform/data/propertybag.h"
#include "screen_support.h"

namespace screentest {

class PartnersScreenTest : public ScreenTest {
protected:
    void SetUp() override {
        ScreenTest::SetUp();
        openPartners();
    }

    void openPartners() {
        listObject = openList("PeltaNom15.ctxContragents");
        list = pelta::Ref<ctxContragents>(pelta::query<ctxContragents>(listObject.get()));
        ASSERT_TRUE(list);
        list->FormExtender()->Refresh();
    }

    void TearDown() override {
        if (list) {
            bool cancel = true;  // abandon: nothing asked, nothing kept
            list->QueryTerminate(cancel);
            list->Terminate();
        }
        details.reset();
        list.reset();
        listObject.reset();
        ScreenTest::TearDown();
    }

    frmContragentsDetails* openedDetails() {
        auto found = pelta::fw::services()->RecordDeletion()->FindDetailForm(list->FormExtender());
        details =
            pelta::Ref<frmContragentsDetails>(pelta::query<frmContragentsDetails>(found.get()));
        return details.get();
    }

    // The partner of `code` opened with command 102.
    frmContragentsDetails* openPartner(const std::string& code) {
        auto* g = list->GridExtender();
        g->SetSelectedBookmarks({});
        EXPECT_TRUE(g->MoveToRow("Code = '" + code + "'"));
        list->FormExtender()->Execute(kCmdOpen);
        return openedDetails();
    }

    frmContragentsDetails* newPartner() {
        list->FormExtender()->Execute(kCmdNew);
        return openedDetails();
    }

    std::string text(const std::string& sql, const pelta::Variant& p1 = {}) {
        auto v = scalar(sql, p1);
        return v.isNull() ? std::string() : v.toString();
    }
    std::string typeId(const std::string& code) {
        return text("SELECT ID FROM nom_cgtypes WHERE Code = ?1", pelta::Variant(code));
    }
    std::string partnerId(const std::string& code) {
        return text("SELECT ID FROM nom_contragents WHERE Code = ?1", pelta::Variant(code));
    }
    void exec(const std::string& sql) {
        auto db = pelta::bll::openDatabase(dbFile_);
        db->execute(sql);
    }

    pelta::fw::GridExtender* listGrid() { return grid(list->GridExtender()); }
    pelta::fw::QuickFilterExtender* quickFilter() {
        return dynamic_cast<pelta::fw::QuickFilterExtender*>(list->QuickFilter());
    }
    // Rows the grid shows after the quick filter's text.
    int64_t filtered(const std::string& typed) {
        quickFilter()->SetText(ctxContragents::kFilterFind, typed);
        quickFilter()->Apply();
        return listGrid()->rowCount();
    }

    pelta::ObjectRef listObject;
    pelta::Ref<ctxContragents> list;
    pelta::Ref<frmContragentsDetails> details;
};

// A valid personal number of a birth date and serial; a valid nine-digit
// company number of eight digits.
inline std::string ValidPersonal(const std::string& nine) {
    static const int w[] = {2, 4, 8, 5, 10, 9, 7, 3, 6};
    int sum = 0;
    for (int i = 0; i < 9; ++i)
        sum += (nine[i] - '0') * w[i];
    return nine + static_cast<char>('0' + (sum % 11) % 10);
}
inline std::string ValidCompany(const std::string& eight) {
    int a = 0, b = 0;
    for (int i = 0; i < 8; ++i) {
        a += (eight[i] - '0') * (i + 1);
        b += (eight[i] - '0') * (i + 3);
    }
    int c = a % 11 == 10 ? (b % 11) % 10 : a % 11;
    return eight + static_cast<char>('0' + c);
}

}  // namespace screentest
