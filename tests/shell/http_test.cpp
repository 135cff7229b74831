// The server over real sockets: what a browser, a broken client or a closed
// tab does to it.
#include "shell/http_server.h"

#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <future>
#include <thread>

#include "fixture/fixture_screens.h"
#include "shell/api.h"
#include "shell/session.h"
#include "shell_test_util.h"

namespace pelta::shell {
namespace {

using fixture::FixtureProvider;
using json = nlohmann::json;

// A client connection on loopback.
class Connection {
public:
    explicit Connection(int port) : fd_(::socket(AF_INET, SOCK_STREAM, 0)) {
        sockaddr_in a{};
        a.sin_family = AF_INET;
        a.sin_port = htons(static_cast<uint16_t>(port));
        a.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        if (::connect(fd_, reinterpret_cast<sockaddr*>(&a), sizeof a) != 0)
            throw std::runtime_error("cannot connect");
        timeval tv{20, 0};  // a broken server fails the test instead of hanging it
        setsockopt(fd_, SOL_SOCKET, SO_RCVTIMEO, &tv, sizeof tv);
    }
    ~Connection() { close(); }
    void close() {
        if (fd_ >= 0) ::close(fd_);
        fd_ = -1;
    }
    void send(const std::string& bytes) {
        size_t sent = 0;
        while (sent < bytes.size()) {
            ssize_t n = ::send(fd_, bytes.data() + sent, bytes.size() - sent, MSG_NOSIGNAL);
            if (n <= 0) return;  // the server may close early on a refused request
            sent += static_cast<size_t>(n);
        }
    }
    // Reads until `marker` has arrived (or the peer closed); answers everything read.
    std::string readUntil(const std::string& marker) {
        while (buffer_.find(marker) == std::string::npos) {
            char chunk[4096];
            ssize_t n = ::recv(fd_, chunk, sizeof chunk, 0);
            if (n <= 0) break;
            buffer_.append(chunk, static_cast<size_t>(n));
        }
        return buffer_;
    }

    std::string readAll() {
        for (;;) {
            char chunk[4096];
            ssize_t n = ::recv(fd_, chunk, sizeof chunk, 0);
            if (n <= 0) return buffer_;
            buffer_.append(chunk, static_cast<size_t>(n));
        }
    }

private:
    int fd_;
    std::string buffer_;
};

struct Reply {
    int status = 0;
    std::string head;
    std::string body;
};

Reply request(int port, const std::string& method, const std::string& path,
              const std::string& body = {}, const std::string& headers = {}) {
    Connection c(port);
    c.send(method + " " + path + " HTTP/1.1\r\nHost: 127.0.0.1\r\nConnection: close\r\n" + headers +
           "Content-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body);
    std::string all = c.readAll();
    Reply r;
    if (all.size() > 12) r.status = std::stoi(all.substr(9, 3));
    size_t split = all.find("\r\n\r\n");
    r.head = all.substr(0, split);
    if (split != std::string::npos) r.body = all.substr(split + 4);
    return r;
}

class HttpTest : public ::testing::Test {
protected:
    HttpTest() : provider(500), sessions(provider, options()), api(sessions, ApiOptions{}) {
        HttpOptions o;
        o.port = 0;
        o.heartbeat = std::chrono::milliseconds(100);
        o.maxBody = 4096;
        o.readTimeout = std::chrono::seconds(1);
        http = std::make_unique<HttpServer>(api, o);
        port = http->bind();
        listener = std::thread([this] { http->run(); });
    }
    ~HttpTest() override {
        sessions.releaseAll();
        http->stop();
        listener.join();
    }
    static SessionOptions options() {
        SessionOptions o;
        o.idleTimeout = std::chrono::milliseconds(300);
        o.reapInterval = std::chrono::milliseconds(50);
        return o;
    }
    std::string startSession() {
        Reply r = request(port, "POST", "/api/session", "{}");
        EXPECT_EQ(r.status, 201) << r.body;
        EXPECT_NE(r.head.find("Set-Cookie: pelta_session="), std::string::npos);
        return json::parse(r.body)["session"];
    }

    FixtureProvider provider;
    SessionManager sessions;
    Api api;
    std::unique_ptr<HttpServer> http;
    int port = 0;
    std::thread listener;
};

TEST_F(HttpTest, BadRequestsGetAnErrorStatusAndTheServerGoesOn) {
    {
        Connection c(port);
        c.send("GARBAGE\r\n\r\n");
        std::string reply = c.readUntil("\r\n\r\n");
        EXPECT_EQ(reply.substr(0, 12), "HTTP/1.1 400");
    }
    {
        Connection c(port);
        c.send("POST /api/session HTTP/1.1\r\nContent-Length: 99999999\r\n\r\n{");
        EXPECT_EQ(c.readUntil("\r\n\r\n").substr(0, 12), "HTTP/1.1 413");
    }
    {
        Connection c(port);  // a client that goes away halfway through its request
        c.send("POST /api/session HTTP/1.1\r\nContent-Length: 100\r\n\r\n{\"pass");
    }
    Reply r = request(port, "GET", "/api/screens/1/rows?count=abc", "",
                      "X-Pelta-Session: " + startSession() + "\r\n");
    EXPECT_EQ(r.status, 400) << r.body;
    EXPECT_NE(r.body.find("Bad count"), std::string::npos);
    r = request(port, "GET", "/no/such/file.js");
    EXPECT_EQ(r.status, 404);
    EXPECT_EQ(request(port, "GET", "/api/info").status, 200);
}

TEST_F(HttpTest, TheSessionTravelsInTheHeaderTheQueryOrTheCookie) {
    std::string id = startSession();
    EXPECT_EQ(request(port, "GET", "/api/navigation", "", "X-Pelta-Session: " + id + "\r\n").status,
              200);
    EXPECT_EQ(request(port, "GET", "/api/navigation?session=" + id).status, 200);
    Reply r =
        request(port, "GET", "/api/navigation", "", "Cookie: a=b; pelta_session=" + id + "\r\n");
    EXPECT_EQ(r.status, 200);
    EXPECT_EQ(json::parse(r.body)["lists"][0]["caption"], "Числа");
    EXPECT_EQ(request(port, "GET", "/api/navigation", "", "Cookie: pelta_session=zz\r\n").status,
              401);
    EXPECT_EQ(request(port, "GET", "/api/events?session=nope").status, 401);
}

TEST_F(HttpTest, AClosedTabMidQuestionReleasesItsSessionAndScreens) {
    std::string id = startSession();
    std::string auth = "X-Pelta-Session: " + id + "\r\n";
    Reply opened = request(port, "POST", "/api/lists", R"({"id":"fixture.Numbers"})", auth);
    ASSERT_EQ(opened.status, 200) << opened.body;
    int64_t list = json::parse(opened.body)["id"];

    auto stream = std::make_unique<Connection>(port);
    stream->send("GET /api/events?session=" + id + " HTTP/1.1\r\nHost: x\r\n\r\n");
    EXPECT_NE(stream->readUntil(": connected").find("text/event-stream"), std::string::npos);

    // The page asks to delete a row; the question reaches it through the stream.
    auto asking = std::make_unique<Connection>(port);
    std::string body = R"({"command":205,"current":"N7"})";
    asking->send("POST /api/screens/" + std::to_string(list) + "/execute HTTP/1.1\r\nHost: x\r\n" +
                 auth + "Content-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body);
    std::string events = stream->readUntil("Желаете ли да изтриете избраните числа?");
    EXPECT_NE(events.find("event: dialog\n"), std::string::npos);

    // The tab closes: both connections go, the question unanswered.
    stream.reset();
    asking.reset();
    EXPECT_TRUE(testing::eventually([&] { return sessions.count() == 0; }));
    EXPECT_TRUE(testing::eventually([&] { return provider.journal().sessionsTerminated == 1; }));
    EXPECT_EQ(provider.journal().screensTerminated, 1);
    EXPECT_EQ(provider.journal().rowsDeleted, 0);  // the unanswered question meant No
    EXPECT_EQ(request(port, "GET", "/api/navigation", "", auth).status, 401);
    EXPECT_EQ(request(port, "GET", "/api/info").status, 200);
}

}  // namespace
}  // namespace pelta::shell
