// The shell over the real library, framework and service: the currency-rate
// and partner screens driven through the JSON interface as the page drives
// them, on a temporary demo database.
#include <gtest/gtest.h>
#include <stdlib.h>

#include <algorithm>
#include <filesystem>
#include <future>
#include <set>

#include "bll/database.h"
#include "bll/service.h"
#include "library/contracts/Constants.h"
#include "platform/automation/registry.h"
#include "shell/api.h"
#include "shell/framework_screens.h"
#include "shell/library_host.h"
#include "shell/session.h"
#include "shell_test_util.h"

namespace pelta::shell {
namespace {

namespace fs = std::filesystem;
using json = nlohmann::json;
using testing::nextEvent;

class LibraryScreensTest : public ::testing::Test {
protected:
    void SetUp() override {
        char tmpl[] = "/tmp/pelta_shell_lib_XXXXXX";
        dir_ = ::mkdtemp(tmpl);
        ::setenv("PELTA_REGISTRY", (dir_ / "registry.ini").c_str(), 1);
        ::setenv("PELTA_LOG_FOLDER", (dir_ / "logs").c_str(), 1);
        db_ = (dir_ / "demo.db").string();
        pelta::bll::DemoOptions demo;
        demo.banks = 2;
        demo.rateDays = 3;
        demo.currenciesPerRate = 2;
        pelta::bll::createDemoDatabase(db_, demo);

        FrameworkOptions fo;
        fo.database = db_;
        auto adapter = frameworkListAdapter(fo);  // the framework before the library
        library_ = std::make_unique<LibraryHost>(PELTA_LIBRARY_FILE);
        library_->setListAdapter(std::move(adapter));
        SessionOptions so;
        so.reapInterval = std::chrono::hours(1);
        sessions_ = std::make_unique<SessionManager>(*library_, so);
        api_ = std::make_unique<Api>(*sessions_, ApiOptions{});

        json s = ok("POST", "/api/session", "{}");
        session_ = s["session"];
    }

    void TearDown() override {
        api_.reset();
        sessions_.reset();
        library_.reset();
        ::unsetenv("PELTA_REGISTRY");
        ::unsetenv("PELTA_LOG_FOLDER");
        std::error_code ec;
        fs::remove_all(dir_, ec);
    }

    ApiResponse call(const std::string& method, const std::string& path,
                     const std::string& body = {}, std::map<std::string, std::string> query = {}) {
        return api_->handle(ApiRequest{method, path, std::move(query), body, session_});
    }
    json ok(const std::string& method, const std::string& path, const std::string& body = {},
            std::map<std::string, std::string> query = {}) {
        ApiResponse r = call(method, path, body, std::move(query));
        EXPECT_LT(r.status, 300) << method << " " << path << ": " << r.body;
        return json::parse(r.body);
    }
    Session& live() { return *sessions_->find(session_); }

    std::string scalar(const std::string& sql) {
        auto db = pelta::bll::openDatabase(db_);
        auto st = db->prepare(sql);
        return st->step() ? st->value(0).toString() : std::string();
    }
    int64_t count(const std::string& sql) { return std::stoll(scalar(sql)); }

    static std::string path(int64_t screen, const std::string& action = {}) {
        return "/api/screens/" + std::to_string(screen) + (action.empty() ? "" : "/" + action);
    }

    int64_t openRatios() {
        json list = ok("POST", "/api/lists", R"({"id":"PeltaNom15.ctxRatios"})");
        return list["id"];
    }

    // Runs a request that asks a question, answers it with `button` and
    // answers the question's text and the request's response.
    std::pair<std::string, ApiResponse> answering(int32_t button, const std::string& method,
                                                  const std::string& p, const std::string& body) {
        uint64_t after = live().events().lastSequence();
        auto pending = std::async(std::launch::async, [=, this] { return call(method, p, body); });
        json dialog = nextEvent(live().events(), "dialog", after);
        json answer = ok("POST", "/api/dialog/" + std::to_string(dialog["id"].get<uint64_t>()),
                         json{{"button", button}}.dump());
        EXPECT_EQ(answer["answered"], true);
        return {dialog["text"], pending.get()};
    }

    // A new rate through command 101, filled as the page fills it; answers the detail screen.
    int64_t newRate(int64_t list, const std::string& bank, const std::string& date,
                    const std::string& currency, const std::string& rate) {
        uint64_t after = live().events().lastSequence();
        EXPECT_EQ(ok("POST", path(list, "execute"), R"({"command":101})")["handled"], true);
        json opened = nextEvent(live().events(), "screen", after);
        int64_t detail = opened["screen"];
        ok("POST", path(detail, "values"), json{{"control", "cboBank"}, {"value", bank}}.dump());
        ok("POST", path(detail, "values"), json{{"control", "dtpDate"}, {"value", date}}.dump());
        json added = ok("POST", path(detail, "addrow"), R"({"grid":"geRows"})");
        EXPECT_EQ(added["added"], true);
        std::string row = added["key"];
        for (auto [column, value] : {std::pair<std::string, std::string>{"Currency_ID", currency},
                                     {"Units", "1"},
                                     {"Rate", rate}}) {
            json cell =
                ok("POST", path(detail, "cells"),
                   json{{"grid", "geRows"}, {"row", row}, {"column", column}, {"value", value}}
                       .dump());
            EXPECT_EQ(cell["ok"], true) << column;
        }
        return detail;
    }

    std::string bank() { return scalar("SELECT ID FROM nom_banks ORDER BY Name LIMIT 1"); }
    std::string currency(const std::string& code) {
        return scalar("SELECT ID FROM nom_currencies WHERE Code = '" + code + "'");
    }

    // ---- partners

    int64_t openPartners() {
        json list = ok("POST", "/api/lists", R"({"id":"PeltaNom15.ctxContragents"})");
        return list["id"];
    }
    // The list's quick-filter text applied; answers the rows it leaves.
    int64_t filter(int64_t list, const std::string& text) {
        json grid = ok("GET", path(list))["grids"][0];
        json r =
            ok("POST", path(list, "filter"),
               json{{"grid", grid["name"]}, {"field", grid["filters"][0]["id"]}, {"text", text}}
                   .dump());
        EXPECT_EQ(r["total"], ok("GET", path(list, "rows"), {}, {{"count", "1"}})["total"]);
        return r["total"];
    }
    // The position of a list column by its key.
    static size_t column(const json& screen, const std::string& key) {
        const json& columns = screen["grids"][0]["columns"];
        for (size_t i = 0; i < columns.size(); ++i)
            if (columns[i]["key"] == key) return i;
        ADD_FAILURE() << "no column " << key;
        return 0;
    }
    static const json& control(const json& screen, const std::string& name) {
        for (const json& c : screen["controls"])
            if (c["name"] == name) return c;
        throw std::runtime_error("no control " + name);
    }
    // Runs a command that shows a detail form; answers the form's screen.
    int64_t showing(int64_t list, const json& body) {
        uint64_t after = live().events().lastSequence();
        EXPECT_EQ(ok("POST", path(list, "execute"), body.dump())["handled"], true);
        return nextEvent(live().events(), "screen", after)["screen"];
    }
    void setValue(int64_t screen, const std::string& name, const json& value) {
        ok("POST", path(screen, "values"), json{{"control", name}, {"value", value}}.dump());
    }
    // A valid company number of eight digits and their check digit.
    static std::string companyNumber(const std::string& eight) {
        int a = 0, b = 0;
        for (int i = 0; i < 8; ++i) {
            a += (eight[i] - '0') * (i + 1);
            b += (eight[i] - '0') * (i + 3);
        }
        int c = a % 11 == 10 ? (b % 11) % 10 : a % 11;
        return eight + static_cast<char>('0' + c);
    }

    fs::path dir_;
    std::string db_;
    std::unique_ptr<LibraryHost> library_;
    std::unique_ptr<SessionManager> sessions_;
    std::unique_ptr<Api> api_;
    std::string session_;
};

TEST_F(LibraryScreensTest, NavigationOffersTheListsTheLibraryCanMake) {
    json nav = ok("GET", "/api/navigation");
    bool ratios = false, machines = false;
    for (const json& e : nav["lists"]) {
        if (e["id"] == "PeltaNom15.ctxRatios") {
            ratios = true;
            EXPECT_EQ(e["caption"], "Валутни курсове");
            EXPECT_EQ(e["available"], true);
        }
        if (e["id"] == "PeltaNom15.ctxMachines") {
            machines = true;  // a list the library does not offer yet
            EXPECT_EQ(e["available"], false);
        }
    }
    EXPECT_TRUE(ratios && machines);
    ApiResponse r = call("POST", "/api/lists", R"({"id":"PeltaNom15.ctxMachines"})");
    EXPECT_EQ(r.status, 422);
    EXPECT_NE(r.body.find("още не е наличен"), std::string::npos) << r.body;
}

TEST_F(LibraryScreensTest, TheRatesListShowsItsMenuColumnsAndGroupsAndPagesOnTheServer) {
    int64_t list = openRatios();
    json d = ok("GET", path(list));
    EXPECT_EQ(d["caption"], "Валутни курсове");
    std::map<int, std::string> shortcuts;
    for (const json& c : d["commands"])
        shortcuts[c["id"]] = c["shortcut"];
    EXPECT_EQ(shortcuts[101], "Ctrl+N");
    EXPECT_EQ(shortcuts[102], "Ctrl+O");
    EXPECT_EQ(shortcuts[205], "Del");
    EXPECT_EQ(shortcuts[207], "F5");
    EXPECT_FALSE(shortcuts.count(201)) << "the list removes save";

    const json& grid = d["grids"][0];
    EXPECT_EQ(grid["columns"][0]["caption"], "Дата");
    EXPECT_EQ(grid["groupColumn"], "PrName");
    EXPECT_EQ(grid["groups"][0], "(Всички)");
    const int64_t all = count("SELECT COUNT(*) FROM nom_currratios");
    EXPECT_EQ(grid["rowCount"], all);

    // Pages in the asked order, from a clone: the grid's own order is untouched.
    json first = ok("GET", path(list, "rows"), {}, {{"count", "5"}});
    json byBank = ok("GET", path(list, "rows"), {}, {{"count", "500"}, {"sort", "PrName:desc"}});
    EXPECT_EQ(byBank["total"], all);
    ASSERT_EQ(byBank["rows"].size(), static_cast<size_t>(all));
    // Descending is ascending reversed (texts by Bulgarian collation, on the server).
    json ascending = ok("GET", path(list, "rows"), {}, {{"count", "500"}, {"sort", "PrName:asc"}});
    std::vector<std::string> up, down;
    for (const json& row : ascending["rows"])
        up.push_back(row["cells"][1]);
    for (const json& row : byBank["rows"])
        down.push_back(row["cells"][1]);
    std::reverse(down.begin(), down.end());
    EXPECT_EQ(up, down);
    EXPECT_NE(up.front(), up.back());
    EXPECT_EQ(ok("GET", path(list, "rows"), {}, {{"count", "5"}})["rows"], first["rows"]);
    ApiResponse bad = call("GET", path(list, "rows"), {}, {{"sort", "Nope:asc"}});
    EXPECT_EQ(bad.status, 400);

    // A group filter shows one bank's rates.
    std::string bankName = grid["groups"][1];
    ok("POST", path(list, "group"), json{{"grid", "geCtl"}, {"value", bankName}}.dump());
    json one = ok("GET", path(list, "rows"), {}, {{"count", "500"}});
    EXPECT_LT(one["total"].get<int64_t>(), all);
    for (const json& row : one["rows"])
        EXPECT_EQ(row["cells"][1], bankName);
    EXPECT_EQ(call("POST", path(list, "group"), R"({"grid":"geCtl","value":"Няма такава"})").status,
              400);
}

TEST_F(LibraryScreensTest, ANewRateIsEnteredSavedAndShownInTheList) {
    int64_t list = openRatios();
    const int64_t before = count("SELECT COUNT(*) FROM nom_currratios");
    int64_t detail = newRate(list, bank(), "2031-05-04", currency("USD"), "1.812345");

    json d = ok("GET", path(detail));
    EXPECT_EQ(d["kind"], "detail");
    bool offered = false;
    for (const json& c : d["controls"]) {
        if (c["name"] != "cboBank") continue;
        EXPECT_EQ(c["prompt"], "Изберете банка");
        EXPECT_EQ(c["value"], bank());
        offered = !c["options"].empty();
    }
    EXPECT_TRUE(offered);
    const json& rowsGrid = d["grids"][0];
    EXPECT_EQ(rowsGrid["editable"], true);
    EXPECT_FALSE(rowsGrid["columns"][0]["options"].empty()) << "the currencies are offered";

    json saved = ok("POST", path(detail, "save"), "{}");
    EXPECT_EQ(saved["saved"], true);
    EXPECT_EQ(saved["unchanged"], false);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios"), before + 1);
    // Saving again with nothing changed writes nothing and says so.
    json again = ok("POST", path(detail, "save"), "{}");
    EXPECT_EQ(again["unchanged"], true);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios"), before + 1);
    EXPECT_EQ(count("SELECT Rate FROM nom_currratiosdetails d JOIN nom_currratios r ON "
                    "r.ID = d.CurrRatio_ID WHERE r.Date = 47972"),
              1812345);
    // The list shows it first when sorted by date, newest first.
    json top = ok("GET", path(list, "rows"), {}, {{"count", "1"}, {"sort", "Date:desc"}});
    EXPECT_EQ(top["total"], before + 1);
    EXPECT_EQ(top["rows"][0]["cells"][0], "2031-05-04");
}

TEST_F(LibraryScreensTest, SavingWithoutABankIsRefusedWithAMessageAtTheField) {
    int64_t list = openRatios();
    int64_t detail = newRate(list, "", "2031-05-04", currency("USD"), "1.8");
    auto [text, response] = answering(PeltaNom15::vbOK, "POST", path(detail, "save"), "{}");
    EXPECT_EQ(text, "Моля изберете банка");
    EXPECT_EQ(json::parse(response.body)["saved"], false);
}

TEST_F(LibraryScreensTest, DeleteInactiveAsksAndTheAnswerDecides) {
    int64_t list = openRatios();
    int64_t detail = newRate(list, bank(), "2031-05-04", currency("USD"), "1.8");
    ok("POST", path(detail, "values"), R"({"control":"chkIsActive","value":false})");
    ASSERT_EQ(ok("POST", path(detail, "save"), "{}")["saved"], true);
    const int64_t before = count("SELECT COUNT(*) FROM nom_currratios");

    json top = ok("GET", path(list, "rows"), {}, {{"count", "1"}, {"sort", "Date:desc"}});
    std::string key = top["rows"][0]["key"];
    std::string body = json{{"command", 205}, {"current", key}, {"selected", {key}}}.dump();
    auto [question, no] = answering(PeltaNom15::vbNo, "POST", path(list, "execute"), body);
    EXPECT_EQ(question, "Желаете ли да изтриете избраните неактивни номенклатури?");
    EXPECT_EQ(no.status, 200);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios"), before);

    auto [again, yes] = answering(PeltaNom15::vbYes, "POST", path(list, "execute"), body);
    EXPECT_EQ(yes.status, 200);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios"), before - 1);
}

TEST_F(LibraryScreensTest, DeletingFromTheFormClosesItsScreen) {
    int64_t list = openRatios();
    int64_t detail = newRate(list, bank(), "2031-05-04", currency("EUR"), "1.95583");
    ASSERT_EQ(ok("POST", path(detail, "save"), "{}")["saved"], true);
    const int64_t before = count("SELECT COUNT(*) FROM nom_currratios");
    auto [question, r] =
        answering(PeltaNom15::vbYes, "POST", path(detail, "execute"), R"({"command":118})");
    EXPECT_EQ(question, "Желаете ли да изтриете номенклатурата?");
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios"), before - 1);
    EXPECT_EQ(call("GET", path(detail)).status, 404) << "the detail screen closed";
    EXPECT_EQ(ok("GET", path(list, "rows"), {}, {{"count", "1"}})["total"], before - 1);
}

TEST_F(LibraryScreensTest, AClosedSessionTerminatesItsScreensAndReleasesTheLibrarysObjects) {
    int64_t list = openRatios();
    newRate(list, bank(), "2031-05-04", currency("USD"), "1.8");  // unsaved
    ok("POST", "/api/session/close", "{}");
    auto canUnload = reinterpret_cast<pelta::HResult (*)()>(
        pelta::serverEntryPoint(PELTA_LIBRARY_FILE, "DllCanUnloadNow"));
    EXPECT_EQ(canUnload(), pelta::kOk) << "every object of the library was released";
    EXPECT_EQ(call("GET", path(list)).status, 401);
}

TEST_F(LibraryScreensTest, ASessionEndingDuringAQuestionUnwindsTheScreen) {
    int64_t list = openRatios();
    json top = ok("GET", path(list, "rows"), {}, {{"count", "1"}});
    std::string key = top["rows"][0]["key"];
    uint64_t after = live().events().lastSequence();
    auto pending = std::async(std::launch::async, [&] {
        return call("POST", path(list, "execute"),
                    json{{"command", 205}, {"current", key}, {"selected", {key}}}.dump());
    });
    nextEvent(live().events(), "dialog", after);
    const int64_t before = count("SELECT COUNT(*) FROM nom_currratios");
    sessions_->release(session_);  // the tab went away mid-question
    EXPECT_LT(pending.get().status, 500);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_currratios"), before) << "answered No";
}

TEST_F(LibraryScreensTest, ThePartnersListOffersItsQuickFilterAndFiltersOnTheServer) {
    int64_t list = openPartners();
    json d = ok("GET", path(list));
    EXPECT_EQ(d["caption"], "Контрагенти");
    const json& grid = d["grids"][0];
    const int64_t all = count("SELECT COUNT(*) FROM nom_contragents");
    ASSERT_GT(all, 10);
    EXPECT_EQ(grid["rowCount"], all);
    EXPECT_EQ(grid["filterHint"],
              "(префикс '/' за търсене по код, '//' за търсене по адрес и др.)");
    // Only the typed field is offered: the tree's type and group fields are the list's own.
    ASSERT_EQ(grid["filters"].size(), 1u) << grid["filters"].dump();
    EXPECT_EQ(grid["filters"][0]["caption"], "Търсене");
    EXPECT_EQ(grid["filters"][0]["text"], "");

    // A page of rows, then the name search, the code search and the address search.
    EXPECT_EQ(ok("GET", path(list, "rows"), {}, {{"count", "7"}})["rows"].size(), 7u);
    const std::string name = scalar("SELECT Name FROM nom_contragents WHERE Code = '3'");
    EXPECT_EQ(filter(list, name),
              count("SELECT COUNT(*) FROM nom_contragents WHERE instr(Name, '" + name + "') > 0"));
    json rows = ok("GET", path(list, "rows"), {}, {{"count", "100"}});
    const size_t nameColumn = column(d, "Name");
    for (const json& row : rows["rows"])
        EXPECT_NE(row["cells"][nameColumn].get<std::string>().find(name), std::string::npos);
    EXPECT_EQ(ok("GET", path(list))["grids"][0]["filters"][0]["text"], name) << "the text stays";

    EXPECT_EQ(filter(list, "/1"),
              count("SELECT COUNT(*) FROM nom_contragents WHERE instr(Code, '1') > 0"));
    const std::string phone = scalar("SELECT Phone FROM nom_contragents WHERE Code = '5'");
    EXPECT_EQ(filter(list, "//" + phone), 1);
    EXPECT_EQ(filter(list, "няма 'такъв' * партньор"), 0) << "quotes and stars are plain text";
    EXPECT_EQ(filter(list, ""), all);

    // Only the offered fields may be set.
    EXPECT_EQ(call("POST", path(list, "filter"), R"({"field":803,"text":"x"})").status, 400);
    EXPECT_EQ(call("POST", path(list, "filter"), R"({"field":"1","text":"x"})").status, 400);
    EXPECT_EQ(call("POST", path(list, "filter"), R"({"field":1,"text":5})").status, 400);
}

TEST_F(LibraryScreensTest, APartnerFoundInTheListIsOpenedChangedAndSaved) {
    int64_t list = openPartners();
    const std::string name = scalar("SELECT Name FROM nom_contragents WHERE Code = '2'");
    ASSERT_EQ(filter(list, name), 1);
    std::string key = ok("GET", path(list, "rows"), {}, {{"count", "1"}})["rows"][0]["key"];
    int64_t detail = showing(list, {{"command", 102}, {"current", key}});

    json d = ok("GET", path(detail));
    EXPECT_EQ(d["kind"], "detail");
    EXPECT_EQ(control(d, "txtName")["value"], name);
    EXPECT_EQ(control(d, "attPhone")["group"], "Основни");
    EXPECT_FALSE(control(d, "cboCgType")["options"].empty()) << "the types are offered";
    std::set<std::string> grids;
    for (const json& g : d["grids"])
        grids.insert(g["name"]);
    for (const char* g : {"gePersons", "geAddresses", "geBankAcc"})
        EXPECT_TRUE(grids.count(g)) << g;
    json persons = ok("GET", path(detail, "rows"), {}, {{"grid", "gePersons"}});
    EXPECT_EQ(persons["total"], count("SELECT COUNT(*) FROM nom_cgpersons p JOIN nom_contragents "
                                      "c ON c.ID = p.Cg_ID WHERE c.Code = '2'"));

    setValue(detail, "attPhone", "+359 2 9876543");
    ASSERT_EQ(ok("POST", path(detail, "save"), "{}")["saved"], true);
    EXPECT_EQ(scalar("SELECT Phone FROM nom_contragents WHERE Code = '2'"), "+359 2 9876543");
    // The list shows the saved row, still filtered.
    json rows = ok("GET", path(list, "rows"), {}, {{"count", "5"}});
    ASSERT_EQ(rows["total"], 1);
    EXPECT_EQ(rows["rows"][0]["cells"][column(ok("GET", path(list)), "Phone")], "+359 2 9876543");
}

TEST_F(LibraryScreensTest, ANewPartnerIsCheckedSavedAndShownInTheList) {
    int64_t list = openPartners();
    const int64_t before = count("SELECT COUNT(*) FROM nom_contragents");
    int64_t detail = showing(list, {{"command", 101}});
    setValue(detail, "txtAddress", "гр. Варна, ул. Тестова 1");
    // Without a name the form says so at the field.
    auto [refusal, response] = answering(PeltaNom15::vbOK, "POST", path(detail, "save"), "{}");
    EXPECT_EQ(refusal, "Невалидно име");
    EXPECT_EQ(json::parse(response.body)["saved"], false);

    setValue(detail, "txtName", "Браузър Тест ООД");
    setValue(detail, "txtBulstat", companyNumber("20304050"));
    json added = ok("POST", path(detail, "addrow"), R"({"grid":"gePersons"})");
    ASSERT_EQ(added["added"], true);
    json cell = ok("POST", path(detail, "cells"),
                   json{{"grid", "gePersons"},
                        {"row", added["key"]},
                        {"column", "Name"},
                        {"value", "Иван Тестов"}}
                       .dump());
    EXPECT_EQ(cell["ok"], true);
    json saved = ok("POST", path(detail, "save"), "{}");
    ASSERT_EQ(saved["saved"], true);
    EXPECT_EQ(count("SELECT COUNT(*) FROM nom_contragents"), before + 1);
    EXPECT_EQ(scalar("SELECT p.Name FROM nom_cgpersons p JOIN nom_contragents c ON c.ID = "
                     "p.Cg_ID WHERE c.Name = 'Браузър Тест ООД'"),
              "Иван Тестов");
    EXPECT_EQ(filter(list, "Браузър Тест"), 1);
}

// ---- a selector shown in a dialog

class ItemSelectorScreensTest : public LibraryScreensTest {
protected:
    // The item of that code opened from the items' list; answers its screen.
    int64_t openItem(const std::string& code) {
        json list = ok("POST", "/api/lists", R"({"id":"PeltaNom15.ctxItems"})");
        items_ = list["id"];
        EXPECT_EQ(filter(items_, "/" + code), 1);
        std::string key = ok("GET", path(items_, "rows"), {}, {{"count", "1"}})["rows"][0]["key"];
        return showing(items_, {{"command", 102}, {"current", key}});
    }
    // The attribute's button pressed; answers the dialog it shows and the
    // request, which waits for the dialog.
    std::pair<json, std::future<ApiResponse>> pressButton(int64_t detail,
                                                          const std::string& field) {
        uint64_t after = live().events().lastSequence();
        auto pending = std::async(std::launch::async, [=, this] {
            return call("POST", path(detail, "attributebutton"), json{{"field", field}}.dump());
        });
        return {nextEvent(live().events(), "dialog", after), std::move(pending)};
    }
    json attribute(int64_t detail, const std::string& field) {
        const json d = ok("GET", path(detail));
        for (const json& g : d["attributeGrids"])
            for (const json& r : g["rows"])
                if (r["field"] == field) return r;
        ADD_FAILURE() << "no attribute " << field;
        return {};
    }
    ApiResponse answer(const json& dialog, const json& body) {
        return call("POST", "/api/dialog/" + std::to_string(dialog["id"].get<uint64_t>()),
                    body.dump());
    }

    int64_t items_ = 0;
};

TEST_F(ItemSelectorScreensTest, TheProducerIsChosenInThePartnersListShownInADialog) {
    int64_t detail = openItem("0000007");
    const std::string name = scalar("SELECT Name FROM nom_contragents WHERE Code = '4'");
    const std::string id = scalar("SELECT ID FROM nom_contragents WHERE Code = '4'");

    auto [dialog, pending] = pressButton(detail, "ProducerCg_ID");
    EXPECT_EQ(dialog["kind"], "selector");
    EXPECT_EQ(dialog["caption"], "Производител");
    EXPECT_EQ(dialog["buttons"], json({PeltaNom15::vbOK, PeltaNom15::vbCancel}));
    const int64_t selector = dialog["screen"];

    // While the item's request waits, the list in the dialog is described,
    // paged and filtered on the same session's thread.
    json d = ok("GET", path(selector));
    EXPECT_EQ(d["kind"], "selector");
    EXPECT_EQ(d["caption"], "Контрагенти");
    EXPECT_TRUE(d["commands"].empty());
    ASSERT_EQ(d["grids"].size(), 1u);
    EXPECT_EQ(d["grids"][0]["rowCount"], count("SELECT COUNT(*) FROM nom_contragents"));
    EXPECT_EQ(filter(selector, name), 1);
    std::string key = ok("GET", path(selector, "rows"), {}, {{"count", "1"}})["rows"][0]["key"];
    EXPECT_EQ(ok("POST", path(selector, "execute"), R"({"command":101})")["handled"], false)
        << "a selector offers no commands";
    EXPECT_EQ(pending.wait_for(std::chrono::milliseconds(0)), std::future_status::timeout);

    EXPECT_EQ(answer(dialog, {{"button", 1}, {"current", key}, {"selected", {key}}}).status, 200);
    EXPECT_EQ(pending.get().status, 200);
    json producer = attribute(detail, "ProducerCg_ID");
    EXPECT_EQ(producer["value"], id);
    EXPECT_EQ(producer["text"], name);
    EXPECT_EQ(call("GET", path(selector)).status, 404) << "gone with its dialog";

    ASSERT_EQ(ok("POST", path(detail, "save"), "{}")["saved"], true);
    EXPECT_EQ(scalar("SELECT ProducerCg_ID FROM nom_items WHERE Code = '0000007'"), id);
}

TEST_F(ItemSelectorScreensTest, ACancelledSelectorLeavesTheAttributeAndBadAnswersAreRefused) {
    int64_t detail = openItem("0000007");
    auto [dialog, pending] = pressButton(detail, "SecItm_ID");
    EXPECT_EQ(dialog["caption"], "Продукт");
    const int64_t selector = dialog["screen"];
    EXPECT_EQ(ok("GET", path(selector))["caption"], "Продукти и материали");
    EXPECT_EQ(answer(dialog, {{"button", 1}, {"selected", "x"}}).status, 400);
    EXPECT_EQ(answer(dialog, {{"button", 1}, {"selected", {1}}}).status, 400);
    EXPECT_EQ(answer(dialog, {{"button", 6}}).status, 400);
    EXPECT_EQ(answer(dialog, {{"button", 2}}).status, 200);
    EXPECT_EQ(pending.get().status, 200);
    EXPECT_TRUE(attribute(detail, "SecItm_ID")["value"].is_null());

    // A row key the list does not have chooses nothing.
    auto [again, waiting] = pressButton(detail, "SecItm_ID");
    EXPECT_EQ(answer(again, {{"button", 1}, {"current", "999999"}}).status, 200);
    EXPECT_EQ(waiting.get().status, 200);
    EXPECT_TRUE(attribute(detail, "SecItm_ID")["value"].is_null());
}

TEST_F(ItemSelectorScreensTest, ASessionEndingDuringASelectorUnwindsAndReleasesEverything) {
    int64_t detail = openItem("0000007");
    auto [dialog, pending] = pressButton(detail, "ImporterCg_ID");
    ok("GET", path(dialog["screen"].get<int64_t>(), "rows"), {}, {{"count", "5"}});
    sessions_->release(session_);  // the tab went away with the dialog up
    EXPECT_LT(pending.get().status, 500);
    auto canUnload = reinterpret_cast<pelta::HResult (*)()>(
        pelta::serverEntryPoint(PELTA_LIBRARY_FILE, "DllCanUnloadNow"));
    EXPECT_EQ(canUnload(), pelta::kOk) << "the selector went with its form";
}

}  // namespace
}  // namespace pelta::shell

namespace pelta::shell {
namespace {

// The item editor's barcode preview as the page drives it: the preview is an
// SVG value of its control, the row the person stands on is drawn, and the
// saved metafile reaches the page as a download.
TEST_F(LibraryScreensTest, TheItemsBarcodePreviewFollowsTheChosenRowAndIsSavedAsADownload) {
    json opened = ok("POST", "/api/lists", R"({"id":"PeltaNom15.ctxItems"})");
    int64_t list = opened["id"];
    std::string key = ok("GET", path(list, "rows"), {}, {{"count", "1"}})["rows"][0]["key"];
    int64_t detail = showing(list, {{"command", 102}, {"current", key}});
    ASSERT_EQ(
        ok("POST", path(detail, "activate"), R"({"tree":"trvLists","key":"Баркодове"})")["ok"],
        true);

    json d = ok("GET", path(detail));
    const json& picture = control(d, "imgBarCode");
    EXPECT_EQ(picture["kind"], "picture");
    EXPECT_EQ(picture["group"], "Баркодове");
    EXPECT_TRUE(picture["readOnly"]);
    ASSERT_TRUE(picture["value"].is_string());
    EXPECT_EQ(picture["value"].get<std::string>().rfind("<svg", 0), 0u);
    EXPECT_EQ(call("POST", path(detail, "values"),
                   R"({"control":"imgBarCode","value":"<svg onload=\"x\"/>"})")
                  .status,
              400)
        << "the page never sets the picture";

    json rows = ok("GET", path(detail, "rows"), {}, {{"grid", "geBarCodes"}});
    ASSERT_EQ(rows["total"], 2);
    size_t codeColumn = 0;
    for (const json& g : d["grids"])
        if (g["name"] == "geBarCodes")
            for (size_t i = 0; i < g["columns"].size(); ++i)
                if (g["columns"][i]["key"] == "Code") codeColumn = i;
    const json& second = rows["rows"][1];
    EXPECT_EQ(ok("POST", path(detail, "current"),
                 json{{"grid", "geBarCodes"}, {"row", second["key"]}}.dump())["ok"],
              true);
    d = ok("GET", path(detail));
    const std::string code = second["cells"][codeColumn];
    EXPECT_EQ(control(d, "txtBarCode")["value"], code);
    EXPECT_NE(control(d, "imgBarCode")["value"].get<std::string>().find(code.substr(1, 6)),
              std::string::npos);
    EXPECT_EQ(
        call("POST", path(detail, "current"), R"({"grid":"geBarCodes","row":"999999"})").status,
        422);
    EXPECT_EQ(call("POST", path(detail, "current"), R"({"grid":"geNone","row":"1"})").status, 400);

    uint64_t after = live().events().lastSequence();
    EXPECT_EQ(ok("POST", path(detail, "execute"), R"({"command":10006})")["handled"], true);
    json offered = nextEvent(live().events(), "download", after);
    EXPECT_EQ(offered["name"], code + ".wmf");
    ApiResponse file = call("GET", "/api/downloads/" + offered["token"].get<std::string>());
    ASSERT_EQ(file.status, 200);
    EXPECT_EQ(file.body.substr(0, 4), std::string("\xD7\xCD\xC6\x9A", 4));
    EXPECT_NE(file.disposition.find(code + ".wmf"), std::string::npos);
}

}  // namespace
}  // namespace pelta::shell
