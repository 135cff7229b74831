#include "shell/api.h"

#include <gtest/gtest.h>

#include <future>

#include "fixture/fixture_screens.h"
#include "library/contracts/Constants.h"
#include "shell/session.h"
#include "shell_test_util.h"

namespace pelta::shell {
namespace {

using fixture::FixtureProvider;
using json = nlohmann::json;
using testing::nextEvent;

class ApiTest : public ::testing::Test {
protected:
    ApiTest() : provider(1000), sessions(provider, quiet()), api(sessions, ApiOptions{}) {}

    static SessionOptions quiet() {
        SessionOptions o;
        o.reapInterval = std::chrono::hours(1);
        return o;
    }

    ApiResponse call(const std::string& method, const std::string& path,
                     const std::string& body = {}, std::map<std::string, std::string> query = {}) {
        return api.handle(ApiRequest{method, path, std::move(query), body, session});
    }
    json ok(const std::string& method, const std::string& path, const std::string& body = {},
            std::map<std::string, std::string> query = {}) {
        ApiResponse r = call(method, path, body, std::move(query));
        EXPECT_LT(r.status, 300) << method << " " << path << ": " << r.body;
        return json::parse(r.body);
    }
    void start() {
        ApiResponse r = call("POST", "/api/session", "{}");
        ASSERT_EQ(r.status, 201);
        session = json::parse(r.body)["session"];
        EXPECT_NE(r.setCookie.find("pelta_session=" + session), std::string::npos);
        EXPECT_NE(r.setCookie.find("HttpOnly"), std::string::npos);
    }
    int64_t openList() {
        json screen = ok("POST", "/api/lists", R"({"id":"fixture.Numbers"})");
        return screen["id"];
    }
    Session& live() { return *sessions.find(session); }

    FixtureProvider provider;
    SessionManager sessions;
    Api api;
    std::string session;
};

TEST_F(ApiTest, MalformedRequestsGetAClearClientError) {
    start();
    int64_t list = openList();
    std::string s = "/api/screens/" + std::to_string(list);
    struct Case {
        const char* method;
        std::string path;
        std::string body;
        std::map<std::string, std::string> query;
        int status;
    };
    const Case cases[] = {
        {"POST", "/api/lists", "{not json", {}, 400},
        {"POST", "/api/lists", "[1,2]", {}, 400},
        {"POST", "/api/lists", "{}", {}, 400},
        {"POST", "/api/lists", R"({"id":42})", {}, 400},
        {"POST", "/api/lists", R"({"id":""})", {}, 400},
        {"GET", "/api/screens/abc", "", {}, 400},
        {"GET", "/api/screens/-1", "", {}, 400},
        {"GET", "/api/screens/99999999999999999999999", "", {}, 400},
        {"GET", "/api/screens/77", "", {}, 404},
        {"GET", s + "/rows", "", {{"count", "0"}}, 400},
        {"GET", s + "/rows", "", {{"count", "100000"}}, 400},
        {"GET", s + "/rows", "", {{"offset", "1e3"}}, 400},
        {"GET", s + "/rows", "", {{"sort", "Nope:asc"}}, 400},
        {"GET", s + "/rows", "", {{"sort", "Code:sideways"}}, 400},
        {"GET", s + "/rows", "", {{"grid", "other"}}, 400},
        {"POST", s + "/execute", R"({"command":"101"})", {}, 400},
        {"POST", s + "/execute", R"({"command":1.5})", {}, 400},
        {"POST", s + "/execute", R"({"command":18446744073709551615})", {}, 400},
        {"POST", s + "/execute", R"({"command":205,"selected":"N1"})", {}, 400},
        {"POST", s + "/execute", R"({"command":205,"selected":[1]})", {}, 400},
        {"POST", s + "/values", R"({"control":"nothing","value":1})", {}, 400},
        {"POST", s + "/values", R"({"control":"geCtl"})", {}, 400},
        {"POST", s + "/values", R"({"control":"geCtl","value":{"a":1}})", {}, 400},
        {"POST", "/api/dialog/x", R"({"button":1})", {}, 400},
        {"POST", "/api/dialog/5", R"({"button":"yes"})", {}, 400},
        {"POST", "/api/dialog/5", R"({"button":6})", {}, 404},
        {"GET", "/api/dialog/5", "", {}, 405},
        {"PUT", "/api/navigation", "", {}, 405},
        {"GET", "/api/nothing", "", {}, 404},
        {"GET", "/elsewhere", "", {}, 404},
        {"GET", s + "/rows/more", "", {}, 404},
    };
    for (const Case& c : cases) {
        ApiResponse r = call(c.method, c.path, c.body, c.query);
        EXPECT_EQ(r.status, c.status) << c.method << " " << c.path << " " << c.body;
        json body = json::parse(r.body, nullptr, false);
        ASSERT_TRUE(body.is_object()) << r.body;
        EXPECT_EQ(body["error"]["status"], c.status);
        EXPECT_FALSE(body["error"]["message"].get<std::string>().empty());
    }
    // The session is unharmed.
    EXPECT_EQ(ok("GET", s)["caption"], "Числа");
}

TEST_F(ApiTest, RequestsWithoutASessionAreRefused) {
    for (std::string id : std::vector<std::string>{"", "0123", "../../etc", std::string(32, 'a')}) {
        session = id;
        EXPECT_EQ(call("GET", "/api/navigation").status, 401) << id;
    }
    EXPECT_EQ(call("GET", "/api/info").status, 200);  // the one open door
}

TEST_F(ApiTest, ALoginIsAskedWhenTheServerRequiresOne) {
    ApiOptions o;
    o.requireLogin = true;
    o.password = "дълга парола";
    o.userExists = [](const std::string& user) { return user == "admin"; };
    Api guarded(sessions, o);
    auto login = [&](const std::string& body) {
        return guarded.handle({"POST", "/api/session", {}, body, {}});
    };
    EXPECT_EQ(login("{}").status, 401);
    EXPECT_EQ(login(R"({"user":"admin","password":"дълга"})").status, 401);
    EXPECT_EQ(login(R"({"password":"дълга парола"})").status, 401) << "a user is required";
    EXPECT_EQ(login(R"({"user":"nobody","password":"дълга парола"})").status, 401);
    EXPECT_EQ(login(R"({"user":5,"password":"дълга парола"})").status, 400);
    ApiResponse r = login(R"({"user":"admin","password":"дълга парола"})");
    ASSERT_EQ(r.status, 201);
    std::string id = json::parse(r.body)["session"];
    EXPECT_EQ(sessions.find(id)->userName(), "admin");
    EXPECT_EQ(guarded.handle({"GET", "/api/navigation", {}, "", id}).status, 200);
    EXPECT_EQ(json::parse(guarded.handle({"GET", "/api/info", {}, "", {}}).body)["login"], true);
}

TEST_F(ApiTest, RowsTravelOnePageAtATimeInTheAskedOrder) {
    start();
    int64_t list = openList();
    std::string rows = "/api/screens/" + std::to_string(list) + "/rows";

    json page = ok("GET", rows, "", {{"offset", "10"}, {"count", "5"}});
    EXPECT_EQ(page["total"], 1000);
    ASSERT_EQ(page["rows"].size(), 5u);
    EXPECT_EQ(page["rows"][0]["index"], 10);
    EXPECT_EQ(page["rows"][0]["cells"][0], 11);  // Code
    EXPECT_EQ(page["rows"][0]["cells"][1], "Ред 11");
    EXPECT_TRUE(page["rows"][0]["cells"][2].is_string());  // exact decimals travel as text

    page = ok("GET", rows, "", {{"count", "3"}, {"sort", "Code:desc"}});
    EXPECT_EQ(page["rows"][0]["cells"][0], 1000);
    EXPECT_EQ(page["rows"][2]["cells"][0], 998);
    EXPECT_EQ(page["rows"][0]["key"], "N999");

    page = ok("GET", rows, "", {{"offset", "998"}, {"count", "50"}});
    EXPECT_EQ(page["rows"].size(), 2u);  // the end of the list cuts the page
    page = ok("GET", rows, "", {{"offset", "5000"}, {"count", "50"}});
    EXPECT_EQ(page["rows"].size(), 0u);
    EXPECT_EQ(page["total"], 1000);

    json screen = ok("GET", "/api/screens/" + std::to_string(list));
    EXPECT_EQ(screen["kind"], "list");
    EXPECT_EQ(screen["grids"][0]["rowCount"], 1000);
    EXPECT_EQ(screen["grids"][0]["columns"][1]["caption"], "Име");
    json commands = screen["commands"];
    ASSERT_EQ(commands[0]["id"], PeltaNom15::kCmdNew);
    EXPECT_EQ(commands[0]["caption"], "Ново число...");  // the shortcut is taken out...
    EXPECT_EQ(commands[0]["shortcut"], "Ctrl+N");        // ...and given apart
    EXPECT_EQ(commands[2]["shortcut"], "Del");           // standard commands have theirs
    EXPECT_EQ(commands[3]["shortcut"], "F5");
}

TEST_F(ApiTest, AQuestionAnsweredInThePageLetsTheCommandFinish) {
    start();
    int64_t list = openList();
    std::string base = "/api/screens/" + std::to_string(list);
    uint64_t seen = live().events().lastSequence();

    auto executing = std::async(std::launch::async, [&] {
        return call("POST", base + "/execute", R"({"command":205,"current":"N3"})");
    });
    json dialog = nextEvent(live().events(), "dialog", seen);
    EXPECT_EQ(dialog["text"], "Желаете ли да изтриете избраните числа?");
    // A wrong button is refused and the question still waits.
    std::string answer = "/api/dialog/" + std::to_string(dialog["id"].get<int64_t>());
    EXPECT_EQ(call("POST", answer, R"({"button":1})").status, 400);
    EXPECT_EQ(ok("POST", answer, R"({"button":6})")["answered"], true);

    ApiResponse done = executing.get();
    EXPECT_EQ(done.status, 200);
    EXPECT_EQ(json::parse(done.body)["handled"], true);
    EXPECT_EQ(provider.journal().rowsDeleted, 1);
    EXPECT_EQ(nextEvent(live().events(), "refresh", seen)["screen"], list);
    EXPECT_EQ(ok("GET", base + "/rows", "", {{"count", "1"}})["total"], 999);
}

TEST_F(ApiTest, DetailFormsOpenValidateAndSave) {
    start();
    int64_t list = openList();
    uint64_t seen = live().events().lastSequence();
    ok("POST", "/api/screens/" + std::to_string(list) + "/execute", R"({"command":101})");
    json opened = nextEvent(live().events(), "screen", seen);
    EXPECT_EQ(opened["change"], "opened");
    std::string form = "/api/screens/" + std::to_string(opened["screen"].get<int64_t>());

    json screen = ok("GET", form);
    EXPECT_EQ(screen["kind"], "detail");
    EXPECT_EQ(screen["controls"][1]["name"], "txtName");
    EXPECT_EQ(screen["controls"][1]["hint"], "Въведете име");
    EXPECT_EQ(screen["controls"][3]["value"], true);

    // Saving without a name shows the message at the name field and saves nothing.
    auto saving = std::async(std::launch::async, [&] { return call("POST", form + "/save"); });
    json notice = nextEvent(live().events(), "dialog", seen);
    EXPECT_EQ(notice["kind"], "notice");
    EXPECT_EQ(notice["control"], "txtName");
    EXPECT_EQ(notice["text"], "Моля въведете име");
    ok("POST", "/api/dialog/" + std::to_string(notice["id"].get<int64_t>()), R"({"button":1})");
    EXPECT_EQ(json::parse(saving.get().body)["saved"], false);

    // A value that does not fit its control is refused as a bad request.
    EXPECT_EQ(call("POST", form + "/values", R"({"control":"txtAmount","value":"много"})").status,
              400);
    ok("POST", form + "/values", R"({"control":"txtName","value":"Ново число"})");
    ok("POST", form + "/values", R"({"control":"txtAmount","value":"12.345"})");
    EXPECT_EQ(ok("POST", form + "/save")["saved"], true);
    EXPECT_EQ(ok("GET", form)["controls"][2]["value"], "12.345");

    json last = ok("GET", "/api/screens/" + std::to_string(list) + "/rows", "",
                   {{"offset", "1000"}, {"count", "1"}});
    EXPECT_EQ(last["total"], 1001);
    EXPECT_EQ(last["rows"][0]["cells"][1], "Ново число");

    // Closing the form: nothing unsaved, so nothing is asked.
    EXPECT_EQ(ok("DELETE", form)["closed"], true);
    EXPECT_EQ(call("GET", form).status, 404);
}

TEST_F(ApiTest, AnEndedSessionAnswersGoneOrUnknown) {
    start();
    ok("DELETE", "/api/session");
    EXPECT_EQ(call("GET", "/api/navigation").status, 401);
    EXPECT_EQ(provider.journal().sessionsTerminated, 1);
}

TEST_F(ApiTest, AListThatCannotBeCreatedIsAnErrorOfItsOwn) {
    start();
    ApiResponse r = call("POST", "/api/lists", R"({"id":"fixture.Missing"})");
    EXPECT_EQ(r.status, 422);
    EXPECT_EQ(json::parse(r.body)["error"]["message"], "No list fixture.Missing");
    EXPECT_EQ(ok("GET", "/api/screens")["screens"].size(), 0u);
}

}  // namespace
}  // namespace pelta::shell
