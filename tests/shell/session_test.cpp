#include "shell/session.h"

#include <gtest/gtest.h>

#include <future>
#include <mutex>

#include "fixture/fixture_screens.h"
#include "library/contracts/Constants.h"
#include "shell_test_util.h"

namespace pelta::shell {
namespace {

using fixture::FixtureProvider;
using testing::nextEvent;

SessionOptions noReaping() {
    SessionOptions o;
    o.idleTimeout = std::chrono::hours(1);
    o.reapInterval = std::chrono::hours(1);
    return o;
}

TEST(Session, ReleasedMidQuestionUnblocksWithNoAndTerminatesItsScreens) {
    FixtureProvider provider(100);
    SessionManager sessions(provider, noReaping());
    auto s = sessions.create();
    ASSERT_TRUE(s);
    int64_t list = s->ui().call([&] { return s->openList(FixtureProvider::kListId); });

    CommandTarget target;
    target.currentKey = "N3";
    auto running = std::async(std::launch::async, [&] {
        return s->ui().call(
            [&] { return s->screen(list)->execute(PeltaNom15::kCmdDeleteInactive, target); });
    });
    uint64_t seen = 0;
    nextEvent(s->events(), "dialog", seen);  // the question waits for the person

    EXPECT_TRUE(sessions.release(s->id()));
    EXPECT_TRUE(running.get());                    // the command ran to its end...
    EXPECT_EQ(provider.journal().rowsDeleted, 0);  // ...taking the answer No
    EXPECT_EQ(provider.journal().screensTerminated, 1);
    EXPECT_EQ(provider.journal().sessionsTerminated, 1);
    EXPECT_TRUE(s->released());
    EXPECT_EQ(sessions.count(), 0u);
    EXPECT_FALSE(sessions.find(s->id()));
    EXPECT_THROW(s->ui().call([] { return 0; }), ThreadStopped);
    EXPECT_NO_THROW(nextEvent(s->events(), "closed", seen));
    EXPECT_TRUE(s->events().closed());
    EXPECT_FALSE(sessions.release(s->id()));  // once only
}

// Screens that write down when they terminate.
class RecordingScreen : public Screen {
public:
    RecordingScreen(std::string name, std::vector<std::string>& log, std::mutex& m)
        : name_(std::move(name)), log_(log), m_(m) {}
    std::string kind() override { return "list"; }
    std::string caption() override { return name_; }
    std::vector<CommandInfo> commands() override { return {}; }
    std::vector<ControlInfo> controls() override { return {}; }
    std::vector<GridInfo> grids() override { return {}; }
    RowsPage rows(const std::string&, int64_t, int64_t, const std::vector<SortKey>&) override {
        return {};
    }
    bool execute(int32_t, const CommandTarget&) override { return false; }
    void setValue(const std::string&, const Variant&) override {}
    bool save() override { return true; }
    bool queryTerminate() override { return !refuse; }
    void terminate() override {
        std::lock_guard lock(m_);
        log_.push_back(name_);
        if (name_ == "throws") throw std::runtime_error("terminate failed");
    }
    bool refuse = false;

private:
    std::string name_;
    std::vector<std::string>& log_;
    std::mutex& m_;
};

class RecordingProvider : public ScreenProvider {
public:
    std::vector<NavigationEntry> navigation() override { return {}; }
    std::unique_ptr<LibrarySession> startSession(ScreenHost& host) override {
        struct S : LibrarySession {
            S(RecordingProvider& p, ScreenHost& h) : p(p), h(h) {}
            std::shared_ptr<Screen> openList(const std::string& id) override {
                return std::make_shared<RecordingScreen>(id, p.log, p.m);
            }
            void terminate() override {
                std::lock_guard lock(p.m);
                p.log.push_back("library");
            }
            RecordingProvider& p;
            ScreenHost& h;
        };
        return std::make_unique<S>(*this, host);
    }
    std::vector<std::string> log;
    std::mutex m;
};

TEST(Session, TerminatesScreensLastOpenedFirstThenTheLibrary) {
    RecordingProvider provider;
    SessionManager sessions(provider, noReaping());
    auto s = sessions.create();
    s->ui().call([&] {
        s->openList("first");
        s->openList("throws");  // a failing screen does not stop the others
        s->openList("third");
    });
    sessions.releaseAll();
    EXPECT_EQ(provider.log, (std::vector<std::string>{"third", "throws", "first", "library"}));
}

TEST(Session, AScreenThatRefusesStaysOpenUnlessForced) {
    RecordingProvider provider;
    SessionManager sessions(provider, noReaping());
    auto s = sessions.create();
    int64_t id = s->ui().call([&] { return s->openList("keeps"); });
    s->ui().call([&] { static_cast<RecordingScreen&>(*s->screen(id)).refuse = true; });
    EXPECT_FALSE(s->ui().call([&] { return s->closeScreen(id, false); }));
    EXPECT_TRUE(provider.log.empty());
    EXPECT_TRUE(s->ui().call([&] { return s->closeScreen(id, true); }));
    EXPECT_EQ(provider.log, std::vector<std::string>{"keeps"});
    EXPECT_FALSE(s->ui().call([&] { return s->screen(id) != nullptr; }));
}

TEST(SessionManager, ReleasesIdleSessionsThatNoPageListensTo) {
    FixtureProvider provider(10);
    SessionOptions o = noReaping();
    o.idleTimeout = std::chrono::milliseconds(0);
    SessionManager sessions(provider, o);
    auto listened = sessions.create();
    auto abandoned = sessions.create();
    listened->events().attach();
    std::this_thread::sleep_for(std::chrono::milliseconds(2));  // both are now past the idle time

    EXPECT_EQ(sessions.reapIdle(), 1u);
    EXPECT_TRUE(abandoned->released());
    EXPECT_FALSE(listened->released());

    listened->events().detach();  // the tab closed
    std::this_thread::sleep_for(std::chrono::milliseconds(2));
    EXPECT_EQ(sessions.reapIdle(), 1u);
    EXPECT_TRUE(listened->released());
    EXPECT_EQ(provider.journal().sessionsTerminated, 2);
}

TEST(SessionManager, RefusesSessionsBeyondTheLimitAndHandsOutUnguessableIds) {
    FixtureProvider provider(10);
    SessionOptions o = noReaping();
    o.maxSessions = 2;
    SessionManager sessions(provider, o);
    auto a = sessions.create();
    auto b = sessions.create();
    EXPECT_FALSE(sessions.create());
    EXPECT_NE(a->id(), b->id());
    EXPECT_EQ(a->id().size(), 32u);
    EXPECT_EQ(a->id().find_first_not_of("0123456789abcdef"), std::string::npos);
    sessions.release(a->id());
    EXPECT_TRUE(sessions.create());
}

}  // namespace
}  // namespace pelta::shell
