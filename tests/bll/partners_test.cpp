// Business partners through bag bytes: the list with its restrictions, one
// partner with its sub-lists, the save with its generated code and duplicate
// checks, the refusals told by their owner, and the delete.
#include "platform/automation/guid.h"
#include "tests/bll/bll_support.h"

namespace bll_test {
namespace {

using pelta::FieldType;
using pelta::PropertyBag;
using pelta::Recordset;

class PartnersTest : public BllTest {
protected:
    Reply list(const std::vector<std::pair<std::string, Variant>>& props = {}) {
        PropertyBag req;
        for (const auto& [name, value] : props)
            req.writeProperty(name, value);
        return call(*admin_, "GetNomContragents", props.empty() ? nullptr : &req);
    }
    Reply details(const std::string& id, bool referentials = false) {
        PropertyBag req;
        req.writeProperty("ID", Variant(id));
        req.writeProperty("Referentials", Variant(referentials));
        return call(*admin_, "GetNomContragentsDetails", &req);
    }
    static constexpr const char* kSubLists[] = {
        "PriceList",    "Person",        "BankAcc",    "Departments", "ItemsCodes",
        "SupplCodes",   "CgBonuses",     "CgMinQuo",   "DealersDeps", "CgCodes",
        "CgDimensions", "CgAttachments", "CgAddresses"};
    Reply save(const Reply& fetched, std::optional<bool> checkBulstat = std::nullopt) {
        PropertyBag req;
        req.writeProperty(
            "ID", Variant(fetched.rs("Head")->recordCount() ? fetched.rs("Head")->value("ID")
                                                            : Variant()));
        req.writeProperty("Head", Variant(fetched.rs("Head")));
        for (const char* s : kSubLists)
            req.writeProperty(s, Variant(fetched.rs(s)));
        req.writeProperty("NeedFetch", Variant(false));
        req.writeProperty("NeedList", Variant("ctxPr|ctxContragents"));
        if (checkBulstat) req.writeProperty("CheckBulstat", Variant(*checkBulstat));
        return call(*admin_, "UpdNomContragentsDetails", &req);
    }
    std::string typeId(const std::string& code) {
        return scalar("SELECT ID FROM nom_cgtypes WHERE Code = ?1", {Variant(code)}).toString();
    }
    std::string partnerId(const std::string& code) {
        return scalar("SELECT ID FROM nom_contragents WHERE Code = ?1", {Variant(code)}).toString();
    }
    std::string partnerText(const std::string& code, const std::string& column) {
        return scalar("SELECT " + column + " FROM nom_contragents WHERE Code = ?1", {Variant(code)})
            .toString();
    }
    // A new partner fetched the way the form starts one.
    Reply newPartner(const std::string& name, const std::string& bulstat = {},
                     const std::string& taxNo = {}) {
        Reply r = details("", false);
        auto head = r.rs("Head");
        head->addNew();
        head->setValue("ID", Variant(pelta::newGuidString()));
        head->setValue("Name", Variant(name));
        head->setValue("Address", Variant("гр. Враца"));
        head->setValue("IsActive", Variant(true));
        head->setValue("CgType_ID", Variant(typeId("CL")));
        if (!bulstat.empty()) head->setValue("Bulstat", Variant(bulstat));
        if (!taxNo.empty()) head->setValue("TaxNo", Variant(taxNo));
        head->update();
        return r;
    }
    static void addPerson(Recordset& rows, const std::string& name, const char* code = nullptr) {
        rows.addNew();
        rows.setValue("ID", Variant(pelta::newGuidString()));
        rows.setValue("Name", Variant(name));
        if (code) rows.setValue("Code", Variant(code));
        rows.update();
    }
};

TEST_F(PartnersTest, ListHasItsColumnsReferenceListsAndADimensionColumnEach) {
    Reply r = list();
    ASSERT_TRUE(r.success);
    ASSERT_EQ(r.bllError(), 0);
    auto rows = r.rs("List");
    EXPECT_EQ(rows->recordCount(), scalar("SELECT COUNT(*) FROM nom_contragents").toInt64());
    for (const char* f : {"ID", "Code", "Name", "CgTypeName", "TaxNo", "Bulstat", "DefMolName",
                          "DefMolEgn", "ContactPhoneWork", "ContactPhoneMobile", "PosCards",
                          "DimValueName", "CgType_ID", "NoteRtf", "REG", "GRP"})
        EXPECT_GE(rows->fieldIndex(f), 0) << f;
    EXPECT_EQ(rows->fieldDef(rows->fieldIndex("IsEmployee")).type, FieldType::Boolean);
    EXPECT_EQ(rows->fieldDef(rows->fieldIndex("CreditLimitation")).type, FieldType::Decimal);
    EXPECT_TRUE(r.rs("Type")->recordCount() >= 5);
    EXPECT_EQ(r.rs("Dimensions")->recordCount(), 2);
    EXPECT_EQ(r.rs("DimValues")->recordCount(), 8);
    EXPECT_TRUE(r.has("CustomFormats"));

    // The region column holds the partner's value; the default dimension is
    // the region, so "DimValueName" repeats it.
    ASSERT_TRUE(rows->find("REG = 'Пловдив'"));
    EXPECT_EQ(rows->value("DimValueName").toString(), "Пловдив");
    // Employees are marked as such.
    rows->moveFirst();
    ASSERT_TRUE(rows->find("CgType_ID = '" + typeId("EM") + "'"));
    EXPECT_TRUE(rows->value("IsEmployee").toBool());
    rows->moveFirst();
    ASSERT_TRUE(rows->find("CgType_ID = '" + typeId("SU") + "'"));
    EXPECT_FALSE(rows->value("IsEmployee").toBool());
}

TEST_F(PartnersTest, TheListIsRestrictedByTypesAndByDimensionValue) {
    const auto all = list().rs("List")->recordCount();
    const std::string types = typeId("NP") + "\x01" + typeId("EM");
    auto people = list({{"CgTypes", Variant(types)}}).rs("List");
    EXPECT_EQ(people->recordCount(),
              scalar("SELECT COUNT(*) FROM nom_contragents c JOIN nom_cgtypes t ON "
                     "t.ID = c.CgType_ID WHERE t.Code IN ('NP', 'EM')")
                  .toInt64());
    EXPECT_LT(people->recordCount(), all);
    // A second restriction narrows the first.
    auto employees =
        list({{"CgTypes", Variant(types)}, {"CgTypes2", Variant(typeId("EM"))}}).rs("List");
    for (employees->moveFirst(); !employees->eof(); employees->moveNext())
        EXPECT_TRUE(employees->value("IsEmployee").toBool());

    const std::string sofia =
        scalar("SELECT ID FROM nom_cgdimvalues WHERE Name = 'София'").toString();
    auto inSofia = list({{"DimValue_ID", Variant(sofia)}}).rs("List");
    ASSERT_GT(inSofia->recordCount(), 0);
    for (inSofia->moveFirst(); !inSofia->eof(); inSofia->moveNext())
        EXPECT_EQ(inSofia->value("REG").toString(), "София");
    // A restriction made of quotes is only a value.
    EXPECT_EQ(list({{"CgTypes", Variant("' OR 1=1 --")}}).rs("List")->recordCount(), 0);
}

TEST_F(PartnersTest, AUserWithoutAnyRightMayNotReadTheList) {
    admin_->database().execute(
        "INSERT INTO sec_users (ID, Name, IsActive) VALUES "
        "('{11111111-2222-3333-4444-555555555555}', 'guest', 1)");
    auto guest = pelta::bll::Connection::open(path_, "guest", logger_);
    Reply r = call(*guest, "GetNomContragents");
    ASSERT_TRUE(r.success);
    EXPECT_EQ(r.bllError(), 24);
    EXPECT_FALSE(r.has("List"));
}

TEST_F(PartnersTest, DetailsCarryTheRecordItsSubListsAndReferenceLists) {
    const std::string id = partnerId("1");
    Reply r = details(id, true);
    ASSERT_TRUE(r.success);
    ASSERT_EQ(r.rs("Head")->recordCount(), 1);
    EXPECT_EQ(r.rs("Head")->value("ID").toString(), id);
    for (const char* s : kSubLists)
        ASSERT_TRUE(r.rs(s)) << s;
    EXPECT_EQ(r.rs("Person")->recordCount(), 1);
    EXPECT_EQ(r.rs("CgAddresses")->recordCount(), 1);
    EXPECT_GE(r.rs("CgDimensions")->recordCount(), 1);
    for (const char* ref :
         {"ContragentType", "PriceListType", "Currency",      "PersonPosition", "Measures",
          "DiscountSchema", "Osp",           "OwnPersons",    "Accounts",       "ItmDimensions",
          "ItmDimValues",   "Countries",     "Bonuses",       "ObjectType",     "Dimensions",
          "DimValues",      "CgStore",       "CustomFormats", "Cities",         "PayReasons"})
        EXPECT_TRUE(r.rs(ref)) << ref;
    EXPECT_FALSE(details(id, false).has("ContragentType"));
    EXPECT_EQ(details(pelta::newGuidString()).rs("Head")->recordCount(), 0);
}

TEST_F(PartnersTest, ANewPartnerGetsTheNextCodeAndItsRowsTheirPartner) {
    Reply r = newPartner("Нов Партньор ООД");
    addPerson(*r.rs("Person"), "Мария Иванова");
    const std::string id = r.rs("Head")->value("ID").toString();
    Reply saved = save(r);
    ASSERT_TRUE(saved.success);
    ASSERT_EQ(saved.bllError(), 0);
    EXPECT_EQ(saved.get("ID").toString(), id) << "the key the form gave is kept";
    const auto codes = scalar("SELECT COUNT(*) FROM nom_contragents").toInt64();
    EXPECT_EQ(saved.rs("Head")->value("Code").toString(), std::to_string(codes));
    EXPECT_EQ(scalar("SELECT Cg_ID FROM nom_cgpersons WHERE Name = 'Мария Иванова'").toString(),
              id);
    EXPECT_EQ(scalar("SELECT Code FROM nom_cgpersons WHERE Name = 'Мария Иванова'").isNull(), true)
        << "no code is kept as Null";
    auto row = saved.rs("ListResult");
    ASSERT_TRUE(row);
    ASSERT_EQ(row->recordCount(), 1);
    EXPECT_EQ(row->value("Name").toString(), "Нов Партньор ООД");
    EXPECT_EQ(row->value("CgTypeName").toString(), "Клиенти");
}

TEST_F(PartnersTest, DuplicateIdentificationAndVatNumbersAskUnlessTheUserAgreed) {
    const std::string bulstat = partnerText("1", "Bulstat");
    const std::string owner = partnerText("1", "Name");
    const std::string before = dump(path_);

    Reply r = newPartner("Двойник ЕООД", "  " + bulstat + " ");
    Reply refused = save(r);
    EXPECT_EQ(refused.bllError(), 8108);
    EXPECT_EQ(refused.get("BllContragent").toString(), owner);
    EXPECT_EQ(dump(path_), before);

    Reply agreed = save(r, false);
    EXPECT_EQ(agreed.bllError(), 0);

    Reply t = newPartner("Двойник 2 ЕООД", {}, "bg" + bulstat);
    Reply vat = save(t);
    EXPECT_EQ(vat.bllError(), 8109);
    EXPECT_EQ(vat.get("BllContragent").toString(), owner);
    EXPECT_EQ(save(t, false).bllError(), 0);

    // Placeholders are no numbers: nines only, or a country prefix alone.
    EXPECT_EQ(save(newPartner("Без номер 1", "999999999", "BG")).bllError(), 0);
    EXPECT_EQ(save(newPartner("Без номер 2", "999999999", "BG")).bllError(), 0);
}

TEST_F(PartnersTest, DuplicateCodeAndNameAreRefusedNamingThePartner) {
    Reply r = newPartner("Съвсем нов ЕООД");
    r.rs("Head")->setValue("Code", Variant("1"));
    r.rs("Head")->update();
    Reply code = save(r);
    EXPECT_EQ(code.bllError(), 10);
    EXPECT_EQ(code.get("BllContragent").toString(), partnerText("1", "Name"));
    EXPECT_TRUE(code.get("BllPrs_ID").isEmpty());

    Reply n = newPartner(partnerText("2", "Name"));
    EXPECT_EQ(save(n).bllError(), 11);
}

TEST_F(PartnersTest, DuplicatesInSubListsAreToldByTheirOwner) {
    // A person code, a department code and an account of partner 1.
    Reply first = details(partnerId("1"));
    auto persons = first.rs("Person");
    persons->moveFirst();
    persons->setValue("Code", Variant("P-1"));
    persons->update();
    auto deps = first.rs("Departments");
    deps->addNew();
    deps->setValue("ID", Variant(pelta::newGuidString()));
    deps->setValue("Name", Variant("Склад"));
    deps->setValue("Code", Variant("D-1"));
    deps->update();
    auto acc = first.rs("BankAcc");
    acc->addNew();
    acc->setValue("ID", Variant(pelta::newGuidString()));
    acc->setValue("Name", Variant("Основна"));
    acc->setValue("AccountCode", Variant("BG80BNBG96611020345678"));
    acc->setValue("BankCode", Variant("BNBGBGSD"));
    acc->update();
    ASSERT_EQ(save(first).bllError(), 0);
    const std::string owner = partnerText("1", "Name");
    const std::string before = dump(path_);

    Reply p = newPartner("Персони ЕООД");
    addPerson(*p.rs("Person"), "Друг", "P-1");
    Reply person = save(p);
    EXPECT_EQ(person.bllError(), 10);
    EXPECT_FALSE(person.get("BllPrs_ID").isEmpty());
    EXPECT_EQ(person.get("BllPerson").toString(), persons->value("Name").toString());
    EXPECT_EQ(person.get("BllContragent").toString(), owner);

    Reply d = newPartner("Поделения ЕООД");
    auto rows = d.rs("Departments");
    rows->addNew();
    rows->setValue("ID", Variant(pelta::newGuidString()));
    rows->setValue("Name", Variant("Магазин"));
    rows->setValue("Code", Variant("D-1"));
    rows->update();
    Reply dep = save(d);
    EXPECT_EQ(dep.bllError(), 10);
    EXPECT_EQ(dep.get("BllDepartment").toString(), "Склад");
    EXPECT_EQ(dep.get("BllContragent").toString(), owner);

    Reply b = newPartner("Сметки ЕООД");
    auto accounts = b.rs("BankAcc");
    accounts->addNew();
    accounts->setValue("ID", Variant(pelta::newGuidString()));
    accounts->setValue("Name", Variant("Копие"));
    accounts->setValue("AccountCode", Variant("BG80BNBG96611020345678"));
    accounts->setValue("BankCode", Variant("BNBGBGSD"));
    accounts->update();
    Reply bank = save(b);
    EXPECT_EQ(bank.bllError(), 10);
    EXPECT_EQ(bank.get("BllBankAccount").toString(), "Основна");
    EXPECT_EQ(bank.get("BllContragent").toString(), owner);
    EXPECT_FALSE(bank.get("BllBankAcc_ID").isEmpty());

    EXPECT_EQ(dump(path_), before) << "refused saves leave nothing behind";
}

TEST_F(PartnersTest, DeletingAPartnerTakesItsSubListsAlong) {
    const std::string id = partnerId("3");
    ASSERT_GT(
        scalar("SELECT COUNT(*) FROM nom_cgpersons WHERE Cg_ID = ?1", {Variant(id)}).toInt64(), 0);
    PropertyBag req;
    req.writeProperty("ID", Variant(id));
    Reply r = call(*admin_, "DelNomContragents", &req);
    ASSERT_TRUE(r.success);
    EXPECT_EQ(r.bllError(), 0);
    for (const char* t : {"nom_contragents WHERE ID", "nom_cgpersons WHERE Cg_ID",
                          "nom_cgaddresses WHERE Cg_ID", "nom_cgdimlinks WHERE Cg_ID"})
        EXPECT_EQ(
            scalar(std::string("SELECT COUNT(*) FROM ") + t + " = ?1", {Variant(id)}).toInt64(), 0)
            << t;
}

}  // namespace
}  // namespace bll_test
