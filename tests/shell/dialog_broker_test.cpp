#include "shell/dialog_broker.h"

#include <gtest/gtest.h>

#include <future>
#include <thread>

#include "library/contracts/Constants.h"
#include "shell/event_channel.h"
#include "shell/ui_thread.h"
#include "shell_test_util.h"

namespace pelta::shell {
namespace {

using namespace PeltaNom15;
using testing::nextEvent;

TEST(DialogBroker, QuestionBlocksTheUiThreadUntilAnswered) {
    EventChannel events;
    DialogBroker broker(events);
    UiThread ui;
    std::atomic<bool> laterTaskRan{false};

    auto answer = std::async(std::launch::async, [&] {
        return ui.call([&] {
            return broker.messageBox("Желаете ли да изтриете избраните неактивни номенклатури?",
                                     vbYesNo | vbQuestion, "Валутни курсове", "");
        });
    });
    uint64_t seen = 0;
    auto dialog = nextEvent(events, "dialog", seen);
    ui.post([&] { laterTaskRan = true; });

    EXPECT_EQ(dialog["kind"], "message");
    EXPECT_EQ(dialog["text"], "Желаете ли да изтриете избраните неактивни номенклатури?");
    EXPECT_EQ(dialog["caption"], "Валутни курсове");
    EXPECT_EQ(dialog["icon"], "question");
    EXPECT_EQ(dialog["buttons"], nlohmann::json({vbYes, vbNo}));
    EXPECT_EQ(dialog["defaultButton"], vbYes);
    uint64_t id = dialog["id"];
    ASSERT_EQ(broker.waitingId(), id);

    // The thread waits: neither the question's caller nor the next task has run on.
    EXPECT_EQ(answer.wait_for(std::chrono::milliseconds(0)), std::future_status::timeout);
    EXPECT_FALSE(laterTaskRan);

    // Buttons the question does not offer and other ids are refused; it still waits.
    EXPECT_EQ(broker.answer(id, {vbOK, {}}), DialogBroker::AnswerResult::InvalidButton);
    EXPECT_EQ(broker.answer(id + 1, {vbYes, {}}), DialogBroker::AnswerResult::UnknownDialog);
    EXPECT_EQ(answer.wait_for(std::chrono::milliseconds(0)), std::future_status::timeout);

    EXPECT_EQ(broker.answer(id, {vbNo, {}}), DialogBroker::AnswerResult::Accepted);
    EXPECT_EQ(answer.get(), vbNo);
    EXPECT_EQ(broker.answer(id, {vbYes, {}}), DialogBroker::AnswerResult::UnknownDialog);
    EXPECT_EQ(nextEvent(events, "dialog-closed", seen)["id"], id);
    EXPECT_TRUE(testing::eventually([&] { return laterTaskRan.load(); }));
    EXPECT_FALSE(broker.waitingId());
}

TEST(DialogBroker, InputBoxCarriesTheDefaultInAndTheTextOut) {
    EventChannel events;
    DialogBroker broker(events);
    uint64_t seen = 0;

    auto asked = std::async(std::launch::async, [&] {
        std::string value = "Стара стойност";
        bool ok = broker.inputBox("Ново име:", "Преименуване", value);
        return std::make_pair(ok, value);
    });
    auto dialog = nextEvent(events, "dialog", seen);
    EXPECT_EQ(dialog["kind"], "input");
    EXPECT_EQ(dialog["value"], "Стара стойност");
    EXPECT_EQ(broker.answer(dialog["id"], {vbOK, "Ново"}), DialogBroker::AnswerResult::Accepted);
    EXPECT_EQ(asked.get(), std::make_pair(true, std::string("Ново")));

    // Cancel leaves the value as it was, whatever text came with it.
    auto cancelled = std::async(std::launch::async, [&] {
        std::string value = "Стара";
        bool ok = broker.inputBox("Ново име:", "", value);
        return std::make_pair(ok, value);
    });
    dialog = nextEvent(events, "dialog", seen);
    broker.answer(dialog["id"], {vbCancel, "пренебрегнат"});
    EXPECT_EQ(cancelled.get(), std::make_pair(false, std::string("Стара")));
}

TEST(DialogBroker, ClosingAnswersAsAClosedWindowWould) {
    struct Case {
        int32_t style;
        int32_t expected;
    };
    for (Case c : {Case{vbYesNo, vbNo}, Case{vbYesNoCancel, vbCancel}, Case{vbOKOnly, vbOK},
                   Case{vbOKCancel, vbCancel}, Case{vbRetryCancel, vbCancel},
                   Case{vbAbortRetryIgnore, vbAbort}}) {
        EventChannel events;
        DialogBroker broker(events);
        uint64_t seen = 0;
        auto answer =
            std::async(std::launch::async, [&] { return broker.messageBox("?", c.style, "", ""); });
        nextEvent(events, "dialog", seen);
        broker.close();
        EXPECT_EQ(answer.get(), c.expected) << "style " << c.style;
        EXPECT_NO_THROW(nextEvent(events, "dialog-closed", seen));
        // Later dialogs do not wait at all.
        EXPECT_EQ(broker.messageBox("?", c.style, "", ""), c.expected);
    }
    EventChannel events;
    DialogBroker broker(events);
    broker.close();
    std::string value = "запазена";
    EXPECT_FALSE(broker.inputBox("?", "", value));
    EXPECT_EQ(value, "запазена");
    EXPECT_NO_THROW(broker.showMessage("txtName", "Моля въведете име", "", ""));
    EXPECT_EQ(events.lastSequence(), 0u);  // nothing was posted after closing
}

TEST(DialogBroker, DialogDescriptionFollowsTheStyle) {
    DialogRequest r;
    r.style = vbYesNoCancel | vbExclamation | 256;  // second button is the default
    auto j = nlohmann::json::parse(dialogJson(3, r));
    EXPECT_EQ(j["buttons"], nlohmann::json({vbYes, vbNo, vbCancel}));
    EXPECT_EQ(j["defaultButton"], vbNo);
    EXPECT_EQ(j["icon"], "exclamation");

    r.style = vbOKOnly | 512;  // a default beyond the buttons falls back to the first
    EXPECT_EQ(nlohmann::json::parse(dialogJson(4, r))["defaultButton"], vbOK);

    r.kind = DialogKind::Notice;
    r.control = "cboBank";
    r.text = "Моля изберете банка";
    j = nlohmann::json::parse(dialogJson(5, r));
    EXPECT_EQ(j["kind"], "notice");
    EXPECT_EQ(j["control"], "cboBank");
    EXPECT_EQ(j["buttons"], nlohmann::json({vbOK}));

    r.text = std::string("bad \xff byte");  // never stops the page
    EXPECT_NO_THROW(nlohmann::json::parse(dialogJson(6, r)));
}

TEST(EventChannel, ReadersResumeAfterTheLastEventTheySaw) {
    EventChannel events(3);
    for (int i = 1; i <= 5; ++i)
        events.publish("screen", "{\"n\":" + std::to_string(i) + "}");
    auto after2 = events.waitAfter(2, std::chrono::milliseconds(0));
    ASSERT_EQ(after2.size(), 3u);  // the backlog keeps the last three
    EXPECT_EQ(after2.front().sequence, 3u);
    EXPECT_TRUE(events.waitAfter(5, std::chrono::milliseconds(0)).empty());

    auto waiting = std::async(std::launch::async,
                              [&] { return events.waitAfter(5, std::chrono::seconds(30)); });
    events.close();
    EXPECT_TRUE(waiting.get().empty());  // closing wakes the reader at once
    events.publish("screen", "{}");
    EXPECT_EQ(events.lastSequence(), 5u);
}

TEST(EventChannel, ServerSentEventsSplitDataAtLineBreaks) {
    EXPECT_EQ(formatServerSentEvent({7, "dialog", "{\"a\":1}"}),
              "id: 7\nevent: dialog\ndata: {\"a\":1}\n\n");
    EXPECT_EQ(formatServerSentEvent({8, "x", "one\ntwo"}),
              "id: 8\nevent: x\ndata: one\ndata: two\n\n");
}

TEST(UiThread, CallsReturnResultsAndExceptionsAndFailAfterStop) {
    UiThread ui;
    EXPECT_EQ(ui.call([] { return 42; }), 42);
    EXPECT_TRUE(ui.call([&] { return ui.isCurrent(); }));
    EXPECT_FALSE(ui.isCurrent());
    EXPECT_THROW(ui.call([]() -> int { throw std::logic_error("x"); }), std::logic_error);
    ui.stop();
    EXPECT_THROW(ui.call([] { return 1; }), ThreadStopped);
    EXPECT_FALSE(ui.post([] {}));
}

}  // namespace
}  // namespace pelta::shell
