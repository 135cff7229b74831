// Files screens write for the person: a path of the shell's own choosing,
// offered to the page once written, fetched once by its token and by its
// session only, and never a path a request names.
#include "shell/downloads.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

#include "fixture/fixture_screens.h"
#include "shell/api.h"
#include "shell/event_channel.h"
#include "shell/session.h"
#include "shell_test_util.h"

namespace pelta::shell {
namespace {

namespace fs = std::filesystem;
using json = nlohmann::json;

void write(const fs::path& p, const std::string& bytes) {
    std::ofstream out(p, std::ios::binary);
    out << bytes;
}

std::vector<json> downloadEvents(EventChannel& events) {
    std::vector<json> out;
    for (const Event& e : events.waitAfter(0, std::chrono::milliseconds(0)))
        if (e.type == "download") out.push_back(json::parse(e.data));
    return out;
}

TEST(Downloads, AWrittenFileIsOfferedAndTakenOnce) {
    EventChannel events;
    fs::path folder;
    {
        Downloads d(events);
        auto p = d.reserve("3800000000072.wmf");
        ASSERT_TRUE(p);
        folder = p->parent_path().parent_path();
        EXPECT_EQ(p->filename(), "3800000000072.wmf");
        EXPECT_EQ(fs::status(folder).permissions() & fs::perms::all, fs::perms::owner_all)
            << "a private folder";
        write(*p, std::string("\xD7\xCD\xC6\x9A", 4) + "data");
        auto unwritten = d.reserve("cancelled.wmf");
        ASSERT_TRUE(unwritten);
        d.offer();

        auto offered = downloadEvents(events);
        ASSERT_EQ(offered.size(), 1u) << "a reserved path nobody wrote is not offered";
        EXPECT_EQ(offered[0]["name"], "3800000000072.wmf");
        EXPECT_EQ(offered[0]["size"], 8);
        EXPECT_FALSE(fs::exists(unwritten->parent_path()));
        const std::string token = offered[0]["token"];
        EXPECT_TRUE(wellFormedSessionId(token));

        auto file = d.take(token);
        ASSERT_TRUE(file);
        EXPECT_EQ(file->name, "3800000000072.wmf");
        EXPECT_EQ(file->bytes.size(), 8u);
        EXPECT_FALSE(fs::exists(*p)) << "served once, then gone";
        EXPECT_FALSE(d.take(token));
        EXPECT_FALSE(d.take("../../etc/passwd"));

        // What is not fetched goes with the session.
        auto left = d.reserve("left.wmf");
        write(*left, "x");
        d.offer();
        EXPECT_TRUE(fs::exists(*left));
    }
    EXPECT_FALSE(fs::exists(folder));
}

TEST(Downloads, OnlyTheLastFilesWaitAndNamesAreMadeSafe) {
    EventChannel events;
    Downloads d(events);
    std::vector<fs::path> paths;
    for (size_t i = 0; i < Downloads::kMaxWaiting + 2; ++i) {
        auto p = d.reserve("f" + std::to_string(i));
        write(*p, "x");
        paths.push_back(*p);
    }
    d.offer();
    EXPECT_FALSE(fs::exists(paths[0]));
    EXPECT_FALSE(fs::exists(paths[1]));
    EXPECT_TRUE(fs::exists(paths.back()));

    EXPECT_EQ(safeDownloadName("/etc/passwd"), "passwd");
    EXPECT_EQ(safeDownloadName("..\\..\\boot.ini"), "boot.ini");
    EXPECT_EQ(safeDownloadName(".."), "download");
    EXPECT_EQ(safeDownloadName(""), "download");
    EXPECT_EQ(safeDownloadName("a\nb:c.wmf"), "a_b_c.wmf");
    EXPECT_EQ(safeDownloadName(std::string(200, 'x')).size(), 120u);
    EXPECT_EQ(attachmentDisposition("баркод \"1\".wmf"),
              "attachment; filename=\"____________ _1_.wmf\"; "
              "filename*=UTF-8''%D0%B1%D0%B0%D1%80%D0%BA%D0%BE%D0%B4%20%221%22.wmf");
}

class DownloadsApiTest : public ::testing::Test {
protected:
    DownloadsApiTest() : provider(10), sessions(provider, quiet()), api(sessions, ApiOptions{}) {}
    static SessionOptions quiet() {
        SessionOptions o;
        o.reapInterval = std::chrono::hours(1);
        return o;
    }
    ApiResponse call(const std::string& method, const std::string& path, const std::string& who) {
        return api.handle(ApiRequest{method, path, {}, {}, who});
    }
    std::string start() {
        ApiResponse r = api.handle(ApiRequest{"POST", "/api/session", {}, "{}", {}});
        return json::parse(r.body)["session"];
    }

    fixture::FixtureProvider provider;
    SessionManager sessions;
    Api api;
};

TEST_F(DownloadsApiTest, AFileIsServedOnceToItsOwnSession) {
    const std::string mine = start();
    const std::string other = start();
    Session& s = *sessions.find(mine);
    auto p = s.downloads()->reserve("баркод.wmf");
    ASSERT_TRUE(p);
    write(*p, "WMF");
    s.downloads()->offer();
    uint64_t after = 0;
    const std::string token = testing::nextEvent(s.events(), "download", after)["token"];

    EXPECT_EQ(call("GET", "/api/downloads/" + token, other).status, 404)
        << "another session's file is no file";
    EXPECT_EQ(call("POST", "/api/downloads/" + token, mine).status, 405);
    EXPECT_EQ(call("GET", "/api/downloads/" + token, "").status, 401);
    ApiResponse r = call("GET", "/api/downloads/" + token, mine);
    ASSERT_EQ(r.status, 200);
    EXPECT_EQ(r.body, "WMF");
    EXPECT_EQ(r.contentType, "application/octet-stream");
    EXPECT_NE(r.disposition.find("attachment; "), std::string::npos);
    EXPECT_NE(r.disposition.find("%D0%B1"), std::string::npos);
    EXPECT_EQ(call("GET", "/api/downloads/" + token, mine).status, 404);
    for (const char* bad : {"/api/downloads/..%2F..%2Fetc%2Fpasswd", "/api/downloads/tmp",
                            "/api/downloads/", "/api/downloads/a/b"})
        EXPECT_EQ(call("GET", bad, mine).status, 404) << bad;
}

}  // namespace
}  // namespace pelta::shell
