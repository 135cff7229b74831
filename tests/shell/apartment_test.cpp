// Sessions' user-interface threads take turns in the library: never two tasks
// at once, and a session waiting for its person lets the others run.
#include "shell/apartment.h"

#include <gtest/gtest.h>

#include <atomic>
#include <future>
#include <thread>
#include <vector>

#include "library/contracts/Constants.h"
#include "shell/dialog_broker.h"
#include "shell/event_channel.h"
#include "shell/ui_thread.h"
#include "shell_test_util.h"

namespace pelta::shell {
namespace {

using namespace PeltaNom15;
using testing::nextEvent;

TEST(Apartment, TasksOfDifferentSessionsNeverRunAtOnce) {
    std::atomic<int> inside{0}, most{0};
    auto task = [&] {
        int now = ++inside;
        most = std::max(most.load(), now);
        std::this_thread::yield();
        --inside;
    };
    UiThread a, b, c;
    std::vector<std::future<void>> done;
    for (int i = 0; i < 200; ++i)
        for (UiThread* t : {&a, &b, &c})
            done.push_back(std::async(std::launch::async, [=] { t->call(task); }));
    for (auto& d : done)
        d.get();
    EXPECT_EQ(most.load(), 1);
}

TEST(Apartment, ASessionWaitingForAnAnswerLetsOthersRun) {
    EventChannel events;
    DialogBroker broker(events);
    UiThread asking, other;
    auto answer = std::async(std::launch::async, [&] {
        return asking.call([&] {
            return broker.messageBox("Желаете ли да изтриете номенклатурата?", vbYesNo | vbQuestion,
                                     "", "");
        });
    });
    uint64_t seen = 0;
    uint64_t id = nextEvent(events, "dialog", seen)["id"];
    // The other session runs to the end while the question is up.
    EXPECT_EQ(other.call([] { return 42; }), 42);
    EXPECT_EQ(broker.answer(id, {vbYes, {}}), DialogBroker::AnswerResult::Accepted);
    EXPECT_EQ(answer.get(), vbYes);
}

}  // namespace
}  // namespace pelta::shell
