// Currency rates through bag bytes: list, details, save, delete, and every
// refusal produced by a real violation, leaving the database as it was.
#include "tests/bll/bll_support.h"

#include "platform/automation/guid.h"

namespace bll_test {
namespace {

using pelta::Date;
using pelta::Decimal;
using pelta::FieldType;
using pelta::PropertyBag;
using pelta::Recordset;
using pelta::RowStatus;

class CurrRatiosTest : public BllTest {
protected:
    Reply details(PeltaNom15::IBllConnection& conn, const std::string& id, bool referentials) {
        PropertyBag req;
        req.writeProperty("ID", Variant(id));
        req.writeProperty("Referentials", Variant(referentials));
        return call(conn, "GetNomCurrRatiosDetails", &req);
    }
    Reply save(PeltaNom15::IBllConnection& conn, const Reply& fetched) {
        PropertyBag req;
        req.writeProperty("Head", Variant(fetched.rs("Head")));
        req.writeProperty("Rows", Variant(fetched.rs("Rows")));
        req.writeProperty("Currencies", Variant(fetched.rs("Currencies")));
        req.writeProperty("NeedFetch", Variant(true));
        req.writeProperty("NeedList", Variant("ctxRatios"));
        return call(conn, "UpdNomCurrRatiosDetails", &req);
    }
    // Any rate record of the bank.
    std::string ratioOf(const std::string& bank) {
        return scalar("SELECT ID FROM nom_currratios WHERE Pr_ID = ?1 ORDER BY Date",
                      {Variant(bank)})
            .toString();
    }
    static void addRow(Recordset& rows, const std::string& currency, int units, const char* rate) {
        rows.addNew();
        rows.setValue("Currency_ID", Variant(currency));
        rows.setValue("Units", Variant(units));
        rows.setValue("Rate", Variant(*Decimal::parse(rate)));
        rows.update();
    }
    // A new record of `bank` on `date` with rows, fetched the way a form
    // starts a new record.
    Reply newRecord(const std::string& bank, Date date) {
        Reply r = details(*admin_, "", true);
        auto head = r.rs("Head");
        head->addNew();
        head->setValue("Date", Variant(date));
        head->setValue("IsActive", Variant(true));
        head->setValue("Pr_ID", Variant(bank));
        head->update();
        return r;
    }
};

TEST_F(CurrRatiosTest, ListHasTypedColumnsAndEveryRecord) {
    Reply r = call(*admin_, "GetNomCurrRatios");
    ASSERT_TRUE(r.success);
    auto list = r.rs("List");
    ASSERT_TRUE(list);
    EXPECT_EQ(list->recordCount(), 6);
    EXPECT_EQ(list->fieldDef(list->fieldIndex("ID")).type, FieldType::Guid);
    EXPECT_EQ(list->fieldDef(list->fieldIndex("Date")).type, FieldType::Date);
    EXPECT_EQ(list->fieldDef(list->fieldIndex("IsActive")).type, FieldType::Boolean);
    EXPECT_EQ(list->fieldDef(list->fieldIndex("LD")).type, FieldType::Date);
    for (const char* f : {"Pr_ID", "PrName", "Note", "CU", "CD", "LU"})
        EXPECT_GE(list->fieldIndex(f), 0) << f;
    list->moveFirst();
    EXPECT_EQ(list->status(), RowStatus::Unmodified);
    // Newest first.
    Date first = list->value("Date").toDate();
    list->moveLast();
    EXPECT_GE(first.oa, list->value("Date").toDate().oa);
    list->moveFirst();
    EXPECT_TRUE(list->find("PrName = 'БНБ'"));
}

TEST_F(CurrRatiosTest, DetailsGiveHeadRowsAndReferenceListsOnRequest) {
    std::string id = ratioOf(bankId("БНБ"));
    Reply r = details(*admin_, id, true);
    ASSERT_TRUE(r.success);
    auto head = r.rs("Head");
    ASSERT_EQ(head->recordCount(), 1);
    EXPECT_EQ(head->value("ID").toString(), id);
    EXPECT_EQ(head->value("PrName").toString(), "БНБ");
    auto rows = r.rs("Rows");
    ASSERT_EQ(rows->recordCount(), 3);
    EXPECT_EQ(rows->fieldDef(rows->fieldIndex("Rate")).type, FieldType::Decimal);
    for (rows->moveFirst(); !rows->eof(); rows->moveNext()) {
        EXPECT_EQ(rows->value("CurrRatio_ID").toString(), id);
        EXPECT_EQ(rows->value("Rate").type(), pelta::VarType::Decimal);
        EXPECT_FALSE(rows->value("CurrencyCode").toString().empty());
    }
    EXPECT_EQ(r.rs("Currencies")->recordCount(), 16);
    auto banks = r.rs("Banks");
    ASSERT_TRUE(banks);
    for (const char* f : {"Name", "Description", "GroupName"})
        EXPECT_GE(banks->fieldIndex(f), 0);

    Reply plain = details(*admin_, id, false);
    EXPECT_FALSE(plain.has("Currencies"));
    EXPECT_FALSE(plain.has("Banks"));
    // A key that is not there: an empty head, which the form reports.
    Reply missing = details(*admin_, pelta::newGuidString(), false);
    ASSERT_TRUE(missing.success);
    EXPECT_EQ(missing.rs("Head")->recordCount(), 0);
}

TEST_F(CurrRatiosTest, NewRecordIsSavedWithRowsAuditAndListRow) {
    std::string bank = bankId("БНБ");
    Reply r = newRecord(bank, pelta::makeDate(2030, 5, 17, 13, 45));
    addRow(*r.rs("Rows"), currencyId("EUR"), 1, "1.95583");
    addRow(*r.rs("Rows"), currencyId("JPY"), 100, "1.2345678");  // rounds to 6 places

    Reply saved = save(*admin_, r);
    ASSERT_TRUE(saved.success);
    ASSERT_EQ(saved.bllError(), 0);
    std::string id = saved.get("ID").toString();
    ASSERT_TRUE(pelta::Guid::parse(id));
    EXPECT_EQ(pelta::Guid::parse(id)->toString(), id);  // braced upper case

    auto head = saved.rs("Head");
    ASSERT_EQ(head->recordCount(), 1);
    EXPECT_EQ(head->value("Date").toDate().oa, pelta::makeDate(2030, 5, 17).oa);  // a whole day
    EXPECT_EQ(head->value("CU").toString(), admin_->CurrentUserID());
    EXPECT_EQ(head->value("LU").toString(), admin_->CurrentUserID());
    EXPECT_FALSE(head->value("CD").isNull());

    auto rows = saved.rs("Rows");
    ASSERT_EQ(rows->recordCount(), 2);
    ASSERT_TRUE(rows->find("CurrencyCode = 'JPY'"));
    EXPECT_EQ(rows->value("Units").toLong(), 100);
    EXPECT_EQ(rows->value("Rate").toDecimal(), *Decimal::parse("1.234568"));
    EXPECT_EQ(rows->value("Pr_ID").toString(), bank);
    // Stored exactly, as an integer of millionths.
    EXPECT_EQ(scalar("SELECT typeof(Rate) || ':' || Rate FROM nom_currratiosdetails "
                     "WHERE CurrRatio_ID = ?1 AND Units = 100",
                     {Variant(id)})
                  .toString(),
              "integer:1234568");

    auto listRow = saved.rs("ListResult");
    ASSERT_TRUE(listRow);
    ASSERT_EQ(listRow->recordCount(), 1);
    auto list = call(*admin_, "GetNomCurrRatios").rs("List");
    ASSERT_EQ(listRow->fieldCount(), list->fieldCount());
    for (size_t f = 0; f < list->fieldCount(); ++f)
        EXPECT_EQ(listRow->fieldDef(f).name, list->fieldDef(f).name);
    EXPECT_EQ(listRow->value("ID").toString(), id);
    EXPECT_EQ(listRow->value("PrName").toString(), "БНБ");
}

TEST_F(CurrRatiosTest, EditedRecordUpdatesDeletesAndAddsRows) {
    std::string id = ratioOf(bankId("БНБ"));
    Reply r = details(*admin_, id, true);
    auto head = r.rs("Head");
    head->setValue("Note", Variant("коригиран"));
    head->update();
    auto rows = r.rs("Rows");
    ASSERT_TRUE(rows->find("CurrencyCode = 'EUR'"));
    rows->setValue("Rate", Variant(*Decimal::parse("1.955830")));
    rows->update();
    rows->moveFirst();
    ASSERT_TRUE(rows->find("CurrencyCode = 'USD'"));
    rows->deleteRecord();
    addRow(*rows, currencyId("CHF"), 1, "2.1");

    Reply saved = save(*admin_, r);
    ASSERT_TRUE(saved.success);
    ASSERT_EQ(saved.bllError(), 0);
    auto out = saved.rs("Rows");
    EXPECT_EQ(out->recordCount(), 3);
    EXPECT_TRUE(out->find("CurrencyCode = 'CHF'"));
    out->moveFirst();
    EXPECT_FALSE(out->find("CurrencyCode = 'USD'"));
    out->moveFirst();
    ASSERT_TRUE(out->find("CurrencyCode = 'EUR'"));
    EXPECT_EQ(out->value("Rate").toDecimal(), *Decimal::parse("1.95583"));
    EXPECT_EQ(saved.rs("Head")->value("Note").toString(), "коригиран");
}

TEST_F(CurrRatiosTest, DuplicateRateIsRefusedNamingTheCurrencyAndWritesNothing) {
    const std::string bank = bankId("БНБ");
    const std::string before = dump(path_);

    // Twice in the same record.
    {
        Reply r = newRecord(bank, pelta::makeDate(2031, 1, 1));
        addRow(*r.rs("Rows"), currencyId("EUR"), 1, "1.95583");
        addRow(*r.rs("Rows"), currencyId("EUR"), 1, "1.96");
        Reply refused = save(*admin_, r);
        ASSERT_TRUE(refused.success);
        EXPECT_EQ(refused.bllError(), 20);
        EXPECT_EQ(refused.get("BllRowID").toString(), currencyId("EUR"));
        EXPECT_EQ(refused.get("BllTable").toString(), "nom_currratiosdetails");
        EXPECT_NE(refused.get("BllColumn").toString().find("Currency_ID"), std::string::npos);
        EXPECT_FALSE(refused.get("BllSqlError").toString().empty());
        EXPECT_FALSE(refused.has("Head"));
        EXPECT_EQ(dump(path_), before);
    }
    // Already defined by another record of the bank on that date.
    {
        Date taken =
            scalar("SELECT Date FROM nom_currratios WHERE ID = ?1", {Variant(ratioOf(bank))})
                .toDate();
        Reply r = newRecord(bank, taken);
        addRow(*r.rs("Rows"), currencyId("CAD"), 1, "1.3");  // free
        addRow(*r.rs("Rows"), currencyId("USD"), 1, "1.8");  // taken
        Reply refused = save(*admin_, r);
        EXPECT_EQ(refused.bllError(), 20);
        EXPECT_EQ(refused.get("BllRowID").toString(), currencyId("USD"));
        EXPECT_EQ(dump(path_), before);
    }
    // An existing record moved onto a date where the bank has those rates.
    {
        auto st = admin_->database().prepare(
            "SELECT ID FROM nom_currratios WHERE Pr_ID = ?1 ORDER BY Date");
        st->bind(1, Variant(bank));
        ASSERT_TRUE(st->step());
        std::string first(st->text(0));
        ASSERT_TRUE(st->step());
        std::string second(st->text(0));
        st.reset();
        Date firstDate =
            scalar("SELECT Date FROM nom_currratios WHERE ID = ?1", {Variant(first)}).toDate();
        Reply r = details(*admin_, second, false);
        r.rs("Head")->setValue("Date", Variant(firstDate));
        r.rs("Head")->update();
        Reply refused = save(*admin_, r);
        EXPECT_EQ(refused.bllError(), 20);
        EXPECT_FALSE(refused.get("BllRowID").toString().empty());
        EXPECT_EQ(dump(path_), before);
    }
    // The same currency on another bank's record of that date is fine.
    Reply r = newRecord(bankId("Банка 1"), pelta::makeDate(2031, 1, 1));
    addRow(*r.rs("Rows"), currencyId("EUR"), 1, "1.95583");
    EXPECT_EQ(save(*admin_, r).bllError(), 0);
}

TEST_F(CurrRatiosTest, ChangeByAnotherConnectionIsDetected) {
    auto other = pelta::bll::Connection::open(path_, "admin", logger_);
    std::string id = ratioOf(bankId("БНБ"));
    Reply mine = details(*admin_, id, false);
    Reply theirs = details(*other, id, false);

    theirs.rs("Head")->setValue("Note", Variant("first"));
    theirs.rs("Head")->update();
    ASSERT_EQ(save(*other, theirs).bllError(), 0);

    const std::string before = dump(path_);
    mine.rs("Head")->setValue("Note", Variant("second"));
    mine.rs("Head")->update();
    Reply refused = save(*admin_, mine);
    ASSERT_TRUE(refused.success);
    EXPECT_EQ(refused.bllError(), 18);
    EXPECT_EQ(refused.get("BllTable").toString(), "nom_currratios");
    EXPECT_EQ(dump(path_), before);

    // A change of the rows alone is checked against the head as well.
    Reply stale = details(*admin_, id, false);
    Reply fresh = details(*other, id, false);
    fresh.rs("Head")->setValue("Note", Variant("third"));
    fresh.rs("Head")->update();
    ASSERT_EQ(save(*other, fresh).bllError(), 0);
    auto rows = stale.rs("Rows");
    rows->moveFirst();
    rows->setValue("Units", Variant(10));
    rows->update();
    EXPECT_EQ(save(*admin_, stale).bllError(), 18);

    // Read again, the change goes through.
    Reply again = details(*admin_, id, false);
    again.rs("Head")->setValue("Note", Variant("second"));
    again.rs("Head")->update();
    EXPECT_EQ(save(*admin_, again).bllError(), 0);
}

TEST_F(CurrRatiosTest, UnknownBankIsRefusedAsABrokenLink) {
    const std::string before = dump(path_);
    Reply r = newRecord(pelta::newGuidString(), pelta::makeDate(2031, 2, 1));
    addRow(*r.rs("Rows"), currencyId("EUR"), 1, "1.95583");
    Reply refused = save(*admin_, r);
    ASSERT_TRUE(refused.success);
    EXPECT_EQ(refused.bllError(), 19);
    EXPECT_EQ(refused.get("BllTable").toString(), "nom_banks");
    EXPECT_EQ(refused.get("BllColumn").toString(), "Pr_ID");
    EXPECT_EQ(dump(path_), before);
}

TEST_F(CurrRatiosTest, DeleteTakesSeveralKeysWithTheirRows) {
    std::string bank = bankId("Банка 1");
    auto st = admin_->database().prepare("SELECT ID FROM nom_currratios WHERE Pr_ID = ?1");
    st->bind(1, Variant(bank));
    std::vector<std::string> ids;
    while (st->step())
        ids.emplace_back(st->text(0));
    st.reset();
    ASSERT_EQ(ids.size(), 3u);
    PropertyBag req;
    req.writeProperty("ID", Variant(ids[0] + "\x01" + ids[2]));
    Reply r = call(*admin_, "DelNomCurrRatios", &req);
    ASSERT_TRUE(r.success);
    EXPECT_EQ(r.bllError(), 0);
    EXPECT_EQ(
        scalar("SELECT COUNT(*) FROM nom_currratios WHERE Pr_ID = ?1", {Variant(bank)}).toLong(),
        1);
    EXPECT_EQ(scalar("SELECT COUNT(*) FROM nom_currratiosdetails WHERE CurrRatio_ID IN (?1, ?2)",
                     {Variant(ids[0]), Variant(ids[2])})
                  .toLong(),
              0);
}

TEST_F(CurrRatiosTest, DeletingWhatRatesReferToIsRefused) {
    const std::string before = dump(path_);
    PropertyBag req;
    req.writeProperty("ID", Variant(currencyId("GBP")));
    Reply r = call(*admin_, "DelNomCurrencies", &req);
    ASSERT_TRUE(r.success);
    EXPECT_EQ(r.bllError(), 19);
    EXPECT_EQ(r.get("BllTable").toString(), "nom_currratiosdetails");
    EXPECT_EQ(r.get("BllColumn").toString(), "ID");
    EXPECT_NE(r.get("BllSqlError").toString().find("FOREIGN KEY"), std::string::npos);

    PropertyBag banks;
    banks.writeProperty("ID", Variant(bankId("Банка 1")));
    Reply b = call(*admin_, "DelNomBanks", &banks);
    EXPECT_EQ(b.bllError(), 19);
    EXPECT_EQ(b.get("BllTable").toString(), "nom_currratios");
    EXPECT_EQ(dump(path_), before);

    // A currency nothing refers to goes.
    PropertyBag unused;
    unused.writeProperty("ID", Variant(currencyId("AUD")));
    EXPECT_EQ(call(*admin_, "DelNomCurrencies", &unused).bllError(), 0);
    EXPECT_TRUE(currencyId("AUD").empty());
}

TEST_F(CurrRatiosTest, DuplicateCodeNameAndValuesOfCurrencies) {
    const std::string before = dump(path_);
    auto attempt = [&](const char* code, const char* name) {
        auto list = call(*admin_, "GetNomCurrencies").rs("List");
        list->addNew();
        list->setValue("Code", Variant(code));
        list->setValue("Name", Variant(name));
        list->setValue("IsActive", Variant(true));
        list->update();
        PropertyBag req;
        req.writeProperty("List", Variant(list));
        return call(*admin_, "UpdNomCurrencies", &req);
    };
    EXPECT_EQ(attempt("EUR", "Нова валута").bllError(), 10);
    EXPECT_EQ(attempt("XXX", "Евро").bllError(), 11);
    EXPECT_EQ(dump(path_), before);
    Reply ok = attempt("XAU", "Злато");
    ASSERT_EQ(ok.bllError(), 0);
    EXPECT_EQ(ok.rs("List")->recordCount(), 17);

    // A key sent twice meets the primary key: duplicate values.
    auto list = call(*admin_, "GetNomCurrencies").rs("List");
    std::string eur = currencyId("EUR");
    list->addNew();
    list->setValue("ID", Variant(eur));
    list->setValue("Code", Variant("XAG"));
    list->setValue("Name", Variant("Сребро"));
    list->setValue("IsActive", Variant(true));
    list->update();
    PropertyBag req;
    req.writeProperty("List", Variant(list));
    Reply dup = call(*admin_, "UpdNomCurrencies", &req);
    ASSERT_TRUE(dup.success);
    EXPECT_EQ(dup.bllError(), 20);
    EXPECT_EQ(dup.get("BllTable").toString(), "nom_currencies");
    EXPECT_EQ(dup.get("BllColumn").toString(), "ID");
    EXPECT_EQ(dup.get("BllRowID").toString(), eur);
}

TEST_F(CurrRatiosTest, RestrictedUserMayReadButNotChange) {
    auto op = pelta::bll::Connection::open(path_, "operator", logger_);
    std::string id = ratioOf(bankId("БНБ"));
    const std::string before = dump(path_);

    Reply r = details(*op, id, true);
    ASSERT_TRUE(r.success);
    ASSERT_EQ(r.bllError(), 0);
    r.rs("Head")->setValue("Note", Variant("x"));
    r.rs("Head")->update();
    Reply refused = save(*op, r);
    ASSERT_TRUE(refused.success);
    EXPECT_EQ(refused.bllError(), 24);

    Reply fresh = newRecord(bankId("БНБ"), pelta::makeDate(2032, 1, 1));
    EXPECT_EQ(save(*op, fresh).bllError(), 24);

    PropertyBag del;
    del.writeProperty("ID", Variant(id));
    EXPECT_EQ(call(*op, "DelNomCurrRatios", &del).bllError(), 24);
    EXPECT_EQ(dump(path_), before);
}

}  // namespace
}  // namespace bll_test
