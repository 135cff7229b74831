// The partner editor driven as the framework drives it: new partners with
// their defaults and default person, the checks in their order, the
// identification numbers, the duplicate questions, the copy and the delete.
#include "partners_support.h"

namespace screentest {
namespace {

// Passes calls on, but repeats a save as the first attempt (without
// "CheckBulstat"), as a service would that refuses a duplicate again.
class StubbornConnection final : public IBllConnection {
public:
    explicit StubbornConnection(pelta::Ref<IBllConnection> inner) : inner_(std::move(inner)) {}
    void Call(int32_t CallKind, const std::string& Operation, const pelta::Bytes& Request,
              pelta::Bytes& Response, int32_t Reserved, pelta::ObjectRef& Context,
              const std::string& Options, bool& Success) override {
        ++calls[Operation];
        pelta::Bytes request = Request;
        if (Operation == "UpdNomContragentsDetails") {
            auto bag = pelta::PropertyBag::fromContents(Request);
            if (bag->hasProperty("CheckBulstat")) ++repeated;
            bag->writeProperty("CheckBulstat", pelta::Variant(true));
            request = bag->contents();
        }
        inner_->Call(CallKind, Operation, request, Response, Reserved, Context, Options, Success);
    }
    pelta::Ref<IAppParameters> AppParameters() override { return inner_->AppParameters(); }
    std::string CurrentUserID() override { return inner_->CurrentUserID(); }
    std::string CurrentUserName() override { return inner_->CurrentUserName(); }

    std::map<std::string, int> calls;
    int repeated = 0;

private:
    pelta::Ref<IBllConnection> inner_;
};

class PartnerDetailsTest : public PartnersScreenTest {
protected:
    // A new partner filled as a user fills it.
    frmContragentsDetails* typedPartner(const std::string& name, const std::string& type,
                                        const std::string& bulstat = {}) {
        auto* d = newPartner();
        EXPECT_NE(d, nullptr);
        if (!d) return nullptr;
        auto* f = form(d->FormExtender());
        f->userSetValue("cboCgType", pelta::Variant(typeId(type)));
        f->userSetValue("txtName", pelta::Variant(name));
        f->userSetValue("txtAddress", pelta::Variant("гр. Ловеч"));
        f->userSetValue("txtBulstat", pelta::Variant(bulstat));
        return d;
    }
    pelta::fw::FormExtender* f(frmContragentsDetails* d) { return form(d->FormExtender()); }
    // Anchored messages and message boxes shown, by title or text.
    std::string lastTitle() { return agent->last().title; }
};

TEST_F(PartnerDetailsTest, ANewPartnerStartsWithItsDefaults) {
    auto* d = newPartner();
    ASSERT_NE(d, nullptr);
    EXPECT_TRUE(d->Key().empty());
    auto head = d->Head();
    EXPECT_TRUE(IsGuid(C2Str(head->value("ID")))) << "a key of its own until saved";
    EXPECT_EQ(C2Str(f(d)->ControlValue("txtTaxNo")), "BG");
    EXPECT_EQ(C2Str(f(d)->ControlValue("cboCgType")), typeId("CL"));
    EXPECT_TRUE(C2Bool(f(d)->ControlValue("chkIsActive")));
    EXPECT_EQ(C2Str(head->value("CU")), connection->CurrentUserID());
    // The reference lists arrived with the first record.
    EXPECT_TRUE(d->Reference("ContragentType"));
    EXPECT_NE(f(d)->controlList("cboCgType"), nullptr);
    EXPECT_NE(f(d)->controlList("attWayOfPayment"), nullptr);
    EXPECT_EQ(f(d)->controlList("attWayOfPayment")->rows->recordCount(), 9);
}

TEST_F(PartnerDetailsTest, ANaturalPersonGetsADefaultPersonThatFollowsTheName) {
    auto* d = typedPartner("Петя Колева", "NP", ValidPersonal("750315123"));
    auto persons = d->Rows("Person");
    ASSERT_EQ(persons->recordCount(), 1);
    persons->moveFirst();
    EXPECT_EQ(C2Str(persons->value("Name")), "Петя Колева");
    for (const char* flag : {"IsActive", "IsMol", "IsOsp", "IsDefMol", "IsDefOsp", "IsContact"})
        EXPECT_TRUE(C2Bool(persons->value(flag))) << flag;
    EXPECT_EQ(C2Str(persons->value("Cg_ID")), C2Str(d->Head()->value("ID")));

    f(d)->userSetValue("txtName", pelta::Variant("Петя Колева-Иванова"));
    ASSERT_EQ(persons->recordCount(), 1) << "the same person, renamed";
    persons->moveFirst();
    EXPECT_EQ(C2Str(persons->value("Name")), "Петя Колева-Иванова");

    ASSERT_TRUE(d->FormExtender()->SaveDocument());
    const std::string id = d->Key();
    EXPECT_EQ(text("SELECT Name FROM nom_cgpersons WHERE Cg_ID = ?1 AND IsDefMol = 1",
                   pelta::Variant(id)),
              "Петя Колева-Иванова");
    EXPECT_FALSE(text("SELECT Code FROM nom_contragents WHERE ID = ?1", pelta::Variant(id)).empty())
        << "the service numbered it";
    EXPECT_EQ(list->GridExtender()->CurrentValue("ID").toString(), id) << "the list shows it";

    // A client's name change leaves the persons alone.
    auto* c = typedPartner("Клиент ООД", "CL");
    EXPECT_EQ(c->Rows("Person")->recordCount(), 0);
}

TEST_F(PartnerDetailsTest, ChecksComeInTheirOrderAndNothingIsSentUntilAllPass) {
    auto* d = newPartner();
    auto attempt = [&](const char* expectedControl) {
        agent->clear();
        EXPECT_FALSE(d->FormExtender()->SaveDocument());
        auto shown = agent->last();
        EXPECT_EQ(shown.control, expectedControl);
        return shown;
    };
    f(d)->userSetValue("txtCode", pelta::Variant("X-1"));  // modified
    EXPECT_EQ(attempt("txtName").text, "Невалидно име");
    f(d)->userSetValue("txtName", pelta::Variant("  "));
    EXPECT_EQ(attempt("txtName").text, "Невалидно име");
    f(d)->userSetValue("txtName", pelta::Variant("Проверки ООД"));
    EXPECT_EQ(attempt("txtAddress").text, "Невалиден адрес");
    f(d)->userSetValue("txtAddress", pelta::Variant("гр. Шумен"));
    f(d)->userSetValue("txtBulstat", pelta::Variant("123456789"));
    auto bulstat = attempt("txtBulstat");
    EXPECT_EQ(bulstat.title, "Невалиден Идент. No.");
    EXPECT_EQ(bulstat.text, "Невалидна контролна цифра");
    EXPECT_EQ(bulstat.hint, "Ако желаете номерът да не се валидира въведете интервал в началото.");
    f(d)->userSetValue("txtBulstat", pelta::Variant(ValidCompany("12345678")));
    f(d)->userSetValue("cboCgType", pelta::Variant());
    EXPECT_EQ(attempt("cboCgType").text, "Невалиден тип на контрагент");
    f(d)->userSetValue("cboCgType", pelta::Variant(typeId("CL")));

    // The default dimension, when required.
    exec("UPDATE nom_cgdimensions SET IsRequired = 1 WHERE Code = 'REG'");
    d->Reference("Dimensions")->moveFirst();
    for (auto dims = d->Reference("Dimensions"); !dims->eof(); dims->moveNext())
        if (dims->value("Code").toString() == "REG") {
            dims->setValue("IsRequired", pelta::Variant(true));
            dims->update();
        }
    EXPECT_EQ(attempt("cboCgDimension").text, "Невалидна дименсия");
    f(d)->userSetValue("cboCgDimension",
                       pelta::Variant(text("SELECT ID FROM nom_cgdimvalues WHERE Name = 'Русе'")));

    auto persons = attempt("gePersons");
    EXPECT_EQ(persons.title, "Липсва персона.");
    EXPECT_EQ(persons.text,
              "За потвърждаване на данните на контрагента, задължително трябва да бъде въведена "
              "поне една персона.");
    auto* pg = grid(d->Grid("gePersons"));
    pg->addRow();
    pg->editCell("Name", pelta::Variant("Лице"));
    ASSERT_TRUE(pg->commitRow());

    f(d)->userSetValue("attIsDepRequired", pelta::Variant(true));
    auto deps = attempt("attIsDepRequired");
    EXPECT_EQ(deps.title, "Невалидна стойност");
    EXPECT_EQ(deps.hint,
              "Използвайте списък Поделения за да добавите поне едно поделение на контрагента.");
    EXPECT_EQ(connection->calls["UpdNomContragentsDetails"], 0);

    f(d)->userSetValue("attIsDepRequired", pelta::Variant(false));
    agent->clear();
    ASSERT_TRUE(d->FormExtender()->SaveDocument());
    EXPECT_EQ(text("SELECT v.Name FROM nom_cgdimlinks l JOIN nom_cgdimvalues v ON "
                   "v.ID = l.DimValue_ID WHERE l.Cg_ID = ?1",
                   pelta::Variant(d->Key())),
              "Русе");
    EXPECT_EQ(text("SELECT Cg_ID FROM nom_cgpersons WHERE Name = 'Лице'"), d->Key());
}

TEST_F(PartnerDetailsTest, AStoreNeedsNoPersonAndANumberInTheVatFieldMoves) {
    auto* d = typedPartner("Обект Център", "ST");
    const std::string number = ValidCompany("20406080");
    f(d)->userSetValue("txtTaxNo", pelta::Variant(" " + number));
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    EXPECT_EQ(text("SELECT Bulstat FROM nom_contragents WHERE ID = ?1", pelta::Variant(d->Key())),
              " " + number);
    EXPECT_TRUE(scalar("SELECT TaxNo FROM nom_contragents WHERE ID = ?1", pelta::Variant(d->Key()))
                    .isNull());
}

TEST_F(PartnerDetailsTest, TheLeadingSpaceTurnsTheCheckOffButTrailingSpacesAreTrimmed) {
    const std::string valid = ValidCompany("13579246");
    auto* d = typedPartner("Интервали ООД", "SU");
    auto* pg = grid(d->Grid("gePersons"));
    pg->addRow();
    pg->editCell("Name", pelta::Variant("Лице"));
    ASSERT_TRUE(pg->commitRow());

    f(d)->userSetValue("txtBulstat", pelta::Variant("12345 "));
    EXPECT_FALSE(d->FormExtender()->SaveDocument());
    EXPECT_EQ(agent->last().text, "Невалидна дължина") << "the trimmed value is checked";
    f(d)->userSetValue("txtBulstat", pelta::Variant(valid + "  "));
    EXPECT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;

    auto* e = typedPartner("Без проверка ООД", "SU", " 12345");
    pg = grid(e->Grid("gePersons"));
    pg->addRow();
    pg->editCell("Name", pelta::Variant("Лице 2"));
    ASSERT_TRUE(pg->commitRow());
    EXPECT_TRUE(e->FormExtender()->SaveDocument()) << agent->last().text;
    EXPECT_EQ(text("SELECT Bulstat FROM nom_contragents WHERE ID = ?1", pelta::Variant(e->Key())),
              " 12345");
}

TEST_F(PartnerDetailsTest, ADuplicateNumberIsAskedAboutAndNoLeavesTheEditsUnsaved) {
    const std::string owner = text("SELECT Name FROM nom_contragents WHERE Code = '1'");
    const std::string bulstat = text("SELECT Bulstat FROM nom_contragents WHERE Code = '1'");
    auto* d = typedPartner("Двойник ЕООД", "CL", bulstat);
    f(d)->userSetValue("txtTaxNo", pelta::Variant("BG"));
    auto* pg = grid(d->Grid("gePersons"));
    pg->addRow();
    pg->editCell("Name", pelta::Variant("Лице"));
    ASSERT_TRUE(pg->commitRow());

    const std::string question =
        "Дублиране на Идент. No. с контрагент '" + owner + "'\r\n\r\nЖелаете ли да продължите?";
    agent->answer(vbNo, question);
    EXPECT_FALSE(d->FormExtender()->SaveDocument());
    EXPECT_TRUE(d->Key().empty());
    EXPECT_TRUE(f(d)->isModified());
    EXPECT_EQ(C2Str(f(d)->ControlValue("txtName")), "Двойник ЕООД");

    agent->answer(vbYes, question);
    ASSERT_TRUE(d->FormExtender()->SaveDocument());
    EXPECT_EQ(
        count("SELECT COUNT(*) FROM nom_contragents WHERE Bulstat = ?1", pelta::Variant(bulstat)),
        2);
    EXPECT_EQ(agent->pending(), 0u);
}

TEST_F(PartnerDetailsTest, TheSameRefusalAfterYesIsShownNotAskedAgain) {
    auto stubborn = pelta::makeRef<StubbornConnection>(connection);
    site = pelta::makeRef<pelta::fw::ClientSite>(stubborn);
    list->Terminate();
    openPartners();

    const std::string owner = text("SELECT Name FROM nom_contragents WHERE Code = '2'");
    const std::string taxNo = text("SELECT TaxNo FROM nom_contragents WHERE Code = '2'");
    auto* d = typedPartner("Упорит ЕООД", "CL");
    f(d)->userSetValue("txtTaxNo", pelta::Variant(taxNo));
    auto* pg = grid(d->Grid("gePersons"));
    pg->addRow();
    pg->editCell("Name", pelta::Variant("Лице"));
    ASSERT_TRUE(pg->commitRow());

    agent->clear();
    agent->answer(vbYes, "Дублиране на ДДС No. с контрагент '" + owner + "'");
    EXPECT_FALSE(d->FormExtender()->SaveDocument());
    EXPECT_EQ(stubborn->calls["UpdNomContragentsDetails"], 2) << "one repeat, no loop";
    EXPECT_EQ(stubborn->repeated, 1);
    auto shown = agent->last();
    EXPECT_EQ(shown.text, "Дублиране на ДДС No. с контрагент '" + owner + "'");
    EXPECT_EQ(shown.style & vbYesNo, 0) << "an error, not a question";
    EXPECT_TRUE(agent->unscripted().empty());
    EXPECT_TRUE(d->Key().empty());

    // The next save asks again: agreement lasts one save.
    agent->answer(vbNo, "Дублиране на ДДС No.");
    EXPECT_FALSE(d->FormExtender()->SaveDocument());
    EXPECT_EQ(agent->pending(), 0u);
}

TEST_F(PartnerDetailsTest, DuplicateCodeAndNameAreShownAtTheirFields) {
    auto* d = openPartner("3");
    ASSERT_NE(d, nullptr);
    f(d)->userSetValue("txtCode", pelta::Variant("1"));
    EXPECT_FALSE(d->FormExtender()->SaveDocument());
    auto shown = agent->last();
    EXPECT_EQ(shown.control, "txtCode");
    EXPECT_EQ(shown.title, "Дублиране на код");
    EXPECT_EQ(shown.text, "Вече съществува контрагент '" +
                              text("SELECT Name FROM nom_contragents WHERE Code = '1'") +
                              "' с този код");
    f(d)->userSetValue("txtCode", pelta::Variant("3"));
    f(d)->userSetValue("txtName",
                       pelta::Variant(text("SELECT Name FROM nom_contragents WHERE Code = '2'")));
    EXPECT_FALSE(d->FormExtender()->SaveDocument());
    EXPECT_EQ(agent->last().text, "Вече съществува контрагент с това име.");
    EXPECT_EQ(agent->last().control, "txtName");
}

TEST_F(PartnerDetailsTest, ACopyGetsNewKeysLinkedAsTheSourceAndNoCode) {
    // Partner 1 with a department linked to its address, account and person.
    const std::string source = partnerId("1");
    const std::string address =
        text("SELECT ID FROM nom_cgaddresses WHERE Cg_ID = ?1", pelta::Variant(source));
    const std::string account =
        text("SELECT ID FROM nom_cgbankaccounts WHERE Cg_ID = ?1", pelta::Variant(source));
    const std::string person =
        text("SELECT ID FROM nom_cgpersons WHERE Cg_ID = ?1", pelta::Variant(source));
    ASSERT_FALSE(address.empty() || account.empty() || person.empty());
    exec(
        "INSERT INTO nom_cgdepartments (ID, Cg_ID, Code, Name, DeliveryAddress_ID, BankAcc_ID, "
        "PrsMol_ID) VALUES ('{0D0D0D0D-0000-4000-8000-000000000001}', '" +
        source + "', 'D1', 'Склад', '" + address + "', '" + account + "', '" + person + "')");

    auto* d = openPartner("1");
    ASSERT_NE(d, nullptr);
    f(d)->userSetValue("txtName", pelta::Variant("Копие ЕООД"));  // on screen, not saved
    d->FormExtender()->Execute(kCmdCopy);

    EXPECT_TRUE(d->Key().empty()) << "a new record";
    auto head = d->Head();
    const std::string id = C2Str(head->value("ID"));
    EXPECT_TRUE(IsGuid(id));
    EXPECT_NE(id, source);
    EXPECT_EQ(C2Str(f(d)->ControlValue("txtCode")), "");
    EXPECT_EQ(C2Str(f(d)->ControlValue("txtName")), "Копие ЕООД");

    auto one = [&](const char* list) {
        auto rows = d->Rows(list);
        EXPECT_EQ(rows->recordCount(), 1) << list;
        rows->moveFirst();
        EXPECT_EQ(C2Str(rows->value("Cg_ID")), id) << list;
        return rows;
    };
    auto addresses = one("CgAddresses");
    auto accounts = one("BankAcc");
    auto persons = one("Person");
    auto departments = one("Departments");
    const std::string newAddress = C2Str(addresses->value("ID"));
    const std::string newAccount = C2Str(accounts->value("ID"));
    const std::string newPerson = C2Str(persons->value("ID"));
    EXPECT_NE(newAddress, address);
    EXPECT_NE(newAccount, account);
    EXPECT_NE(newPerson, person);
    EXPECT_NE(C2Str(departments->value("ID")), "{0D0D0D0D-0000-4000-8000-000000000001}");
    EXPECT_EQ(C2Str(departments->value("DeliveryAddress_ID")), newAddress);
    EXPECT_EQ(C2Str(departments->value("BankAcc_ID")), newAccount);
    EXPECT_EQ(C2Str(departments->value("PrsMol_ID")), newPerson);
    EXPECT_TRUE(departments->value("Code").isNull()) << "codes are unique across partners";
    EXPECT_EQ(C2Str(head->value("DeliveryAddress_ID")), newAddress);
    EXPECT_EQ(C2Str(head->value("PrsOsp_ID")), newPerson);
    EXPECT_GE(d->Rows("CgDimensions")->recordCount(), 1);

    // The account may not repeat another partner's: with its own IBAN the copy saves.
    accounts->setValue("AccountCode", pelta::Variant("BG18RZBB91550123456789"));
    accounts->update();
    f(d)->userSetValue("txtBulstat", pelta::Variant(" "));
    f(d)->userSetValue("txtTaxNo", pelta::Variant());
    ASSERT_TRUE(d->FormExtender()->SaveDocument()) << agent->last().text;
    EXPECT_EQ(d->Key(), id);
    EXPECT_EQ(text("SELECT DeliveryAddress_ID FROM nom_cgdepartments WHERE Cg_ID = ?1",
                   pelta::Variant(id)),
              newAddress);
    EXPECT_EQ(
        count("SELECT COUNT(*) FROM nom_cgdepartments WHERE Cg_ID = ?1", pelta::Variant(source)), 1)
        << "the source keeps its own";
}

TEST_F(PartnerDetailsTest, DeleteAsksAndRefreshesTheList) {
    auto* d = openPartner("5");
    ASSERT_NE(d, nullptr);
    const std::string id = d->Key();
    agent->answer(vbNo, "Желаете ли да изтриете номенклатурата?");
    d->FormExtender()->Execute(kCmdDelete);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_contragents WHERE ID = ?1", pelta::Variant(id)), 1);
    agent->answer(vbYes, "Желаете ли да изтриете номенклатурата?");
    d->FormExtender()->Execute(kCmdDelete);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_contragents WHERE ID = ?1", pelta::Variant(id)), 0);
    EXPECT_FALSE(list->ListRecordset()->clone()->find("ID = '" + id + "'"));
    EXPECT_TRUE(f(d)->closed());
}

class PartnerDetailsOperatorTest : public PartnerDetailsTest {
protected:
    void SetUp() override {
        ScreenTest::SetUp();
        connect("operator");
        openPartners();
    }
};

TEST_F(PartnerDetailsOperatorTest, AUserWhoMayNotCreateIsToldSo) {
    list->FormExtender()->Execute(kCmdNew);
    EXPECT_EQ(agent->last().text, "Недостатъчни права за създаване на Контрагент");
}

}  // namespace
}  // namespace screentest
