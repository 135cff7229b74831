// A selector's dialog waits on the session's thread while that same thread
// serves the requests of the list the dialog shows: the modal wait runs the
// tasks of that screen only, lets other sessions run meanwhile, and ends with
// the answer, the session's end or the thread's stop.
#include <gtest/gtest.h>

#include <atomic>
#include <future>
#include <thread>

#include "library/contracts/Constants.h"
#include "shell/apartment.h"
#include "shell/dialog_broker.h"
#include "shell/event_channel.h"
#include "shell/ui_thread.h"
#include "shell_test_util.h"

namespace pelta::shell {
namespace {

using namespace PeltaNom15;
using testing::nextEvent;

TEST(ModalWait, ServesTheTasksOfItsScreenAndLeavesTheOthersForLater) {
    UiThread ui, other;
    std::atomic<bool> done{false}, entered{false};
    std::vector<std::string> order;  // written on the thread only
    auto modal = std::async(std::launch::async, [&] {
        return ui.call([&] {
            entered = true;
            bool ended =
                ui.serveUntil([&] { return done.load(); }, [](int64_t tag) { return tag == 7; });
            order.push_back("modal ended");
            return ended;
        });
    });
    ASSERT_TRUE(testing::eventually([&] { return entered.load(); }));

    // A task for another screen waits; one for the screen shown runs at once,
    // inside the wait, and sees the other not run yet.
    std::promise<void> laterRan;
    ASSERT_TRUE(ui.post([&] {
        order.push_back("other screen");
        laterRan.set_value();
    }));
    {
        UiTaskTag tag(7);
        EXPECT_EQ(UiTaskTag::current(), 7);
        EXPECT_EQ(ui.call([&] {
            order.push_back("shown screen");
            return order.size();
        }),
                  1u);
        // Another session's thread runs while this one waits for its person.
        EXPECT_EQ(other.call([] { return 42; }), 42);
    }
    EXPECT_EQ(UiTaskTag::current(), 0) << "the tag ends with its scope";
    EXPECT_EQ(modal.wait_for(std::chrono::milliseconds(0)), std::future_status::timeout);

    done = true;
    ui.wake();
    EXPECT_TRUE(modal.get());
    laterRan.get_future().get();
    ASSERT_EQ(order.size(), 3u);
    EXPECT_EQ(order[1], "modal ended");
    EXPECT_EQ(order[2], "other screen") << "the deferred task runs after the dialog";
}

TEST(ModalWait, AStoppingThreadEndsTheWait) {
    auto ui = std::make_unique<UiThread>();
    std::atomic<bool> entered{false};
    auto modal = std::async(std::launch::async, [&] {
        return ui->call([&] {
            entered = true;
            return ui->serveUntil([] { return false; }, [](int64_t) { return true; });
        });
    });
    ASSERT_TRUE(testing::eventually([&] { return entered.load(); }));
    std::thread stopper([&] { ui->stop(); });
    EXPECT_FALSE(modal.get());
    stopper.join();
}

// A broker wired to a thread as a session wires it.
struct ModalBroker {
    EventChannel events;
    DialogBroker broker{events};
    UiThread ui;
    ModalBroker() {
        broker.setModalWait(
            [this](int64_t screen, const std::function<bool()>& done) {
                ui.serveUntil(done, [screen](int64_t tag) { return tag == screen; });
            },
            [this] { ui.wake(); });
    }
    std::future<std::optional<RowsChoice>> choose(int64_t screen) {
        return std::async(std::launch::async, [this, screen] {
            return ui.call([this, screen] { return broker.chooseRows(screen, "Производител"); });
        });
    }
};

TEST(ModalWait, ASelectorIsAnsweredWithTheRowsChosenWhileItsListIsServed) {
    ModalBroker m;
    uint64_t seen = 0;
    auto chosen = m.choose(12);
    auto dialog = nextEvent(m.events, "dialog", seen);
    EXPECT_EQ(dialog["kind"], "selector");
    EXPECT_EQ(dialog["screen"], 12);
    EXPECT_EQ(dialog["caption"], "Производител");
    EXPECT_EQ(dialog["buttons"], nlohmann::json({vbOK, vbCancel}));
    uint64_t id = dialog["id"];
    EXPECT_EQ(m.broker.waitingId(), id);
    {
        UiTaskTag tag(12);
        EXPECT_EQ(m.ui.call([] { return 5; }), 5) << "the list's rows are served meanwhile";
    }
    EXPECT_EQ(m.broker.answer(id, {vbYes, {}, {}}), DialogBroker::AnswerResult::InvalidButton);
    DialogAnswer a{vbOK, {}, {"41", {"41", "43"}}};
    EXPECT_EQ(m.broker.answer(id, a), DialogBroker::AnswerResult::Accepted);
    auto rows = chosen.get();
    ASSERT_TRUE(rows);
    EXPECT_EQ(rows->current, "41");
    EXPECT_EQ(rows->selected, (std::vector<std::string>{"41", "43"}));
    EXPECT_EQ(nextEvent(m.events, "dialog-closed", seen)["id"], id);
    EXPECT_FALSE(m.broker.waitingId());

    // Cancelled: the rows that came along are not taken.
    auto cancelled = m.choose(13);
    id = nextEvent(m.events, "dialog", seen)["id"];
    m.broker.answer(id, {vbCancel, {}, {"41", {}}});
    EXPECT_FALSE(cancelled.get());
}

TEST(ModalWait, ASessionEndingDuringASelectorCancelsIt) {
    ModalBroker m;
    uint64_t seen = 0;
    auto chosen = m.choose(3);
    uint64_t id = nextEvent(m.events, "dialog", seen)["id"];
    m.broker.close();
    EXPECT_FALSE(chosen.get());
    EXPECT_EQ(nextEvent(m.events, "dialog-closed", seen)["id"], id);
    EXPECT_FALSE(m.choose(4).get()) << "later selectors are not shown at all";
    EXPECT_EQ(m.broker.answer(id, {vbOK, {}, {}}), DialogBroker::AnswerResult::UnknownDialog);
}

TEST(ModalWait, WithoutAModalWaitASelectorWaitsAsAMessageBoxDoes) {
    EventChannel events;
    DialogBroker broker(events);
    uint64_t seen = 0;
    auto chosen = std::async(std::launch::async, [&] { return broker.chooseRows(9, "Продукт"); });
    uint64_t id = nextEvent(events, "dialog", seen)["id"];
    broker.answer(id, {vbOK, {}, {"7", {}}});
    auto rows = chosen.get();
    ASSERT_TRUE(rows);
    EXPECT_EQ(rows->current, "7");
}

}  // namespace
}  // namespace pelta::shell
