// The web user agent: a dialog asked on a session's user-interface thread is
// posted to the page as a "dialog" event, and the thread waits until the
// person answers it (POST /api/dialog/<id>) or the session ends. A session
// that ends answers every waiting and later dialog as a closed window would:
// Cancel, or No when there is no Cancel, so that the screen's code unwinds.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <functional>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "shell/user_agent.h"

namespace pelta::shell {

class EventChannel;

// Selector: a list screen shown for choosing rows, answered OK with the
// rows chosen, or Cancel.
enum class DialogKind { Message, Input, Notice, Selector };

struct DialogRequest {
    DialogKind kind = DialogKind::Message;
    std::string text;  // message, or the input box's prompt
    std::string caption;
    std::string details;
    int32_t style = 0;    // message boxes: buttons, icon and default flags
    std::string value;    // input boxes: the default
    std::string control;  // notices: the control the message points at
    std::string hint;     // notices
    int64_t screen = 0;   // selectors: the screen shown
};

struct DialogAnswer {
    int32_t button = 0;
    std::optional<std::string> value;  // input boxes: the text entered
    RowsChoice rows{};                 // selectors: the rows chosen with OK
};

// Buttons a message box of this style offers, in order (vbOK, vbCancel ...).
std::vector<int32_t> dialogButtons(DialogKind kind, int32_t style);
// What a dialog answers when nobody can answer it any more.
int32_t dismissButton(DialogKind kind, int32_t style);
// The dialog as the page receives it (JSON text).
std::string dialogJson(uint64_t id, const DialogRequest& request);

class DialogBroker : public UserAgent {
public:
    explicit DialogBroker(EventChannel& events);

    // Posts the dialog and blocks until it is answered or the broker closes.
    DialogAnswer ask(const DialogRequest& request);

    enum class AnswerResult { Accepted, UnknownDialog, InvalidButton };
    // Answers the waiting dialog `id` (from any thread).
    AnswerResult answer(uint64_t id, const DialogAnswer& answer);

    // Dismisses the waiting dialog and every later one. Idempotent.
    void close();
    bool closed() const;
    // The dialog now waiting, if any (for a page that reconnects).
    std::optional<uint64_t> waitingId() const;

    // How a selector waits on the session's thread: until `done` holds,
    // serving the requests of `screen` meanwhile; `wake` makes it ask `done`
    // again. Without it a selector waits as a message box does.
    using ModalWait = std::function<void(int64_t screen, const std::function<bool()>& done)>;
    void setModalWait(ModalWait wait, std::function<void()> wake);

    // UserAgent
    int32_t messageBox(const std::string& text, int32_t style, const std::string& caption,
                       const std::string& details) override;
    bool inputBox(const std::string& prompt, const std::string& title, std::string& value) override;
    void showMessage(const std::string& control, const std::string& text, const std::string& title,
                     const std::string& hint) override;
    std::optional<RowsChoice> chooseRows(int64_t screen, const std::string& caption) override;

private:
    struct Waiting {
        uint64_t id;
        DialogRequest request;
        std::optional<DialogAnswer> answer;
    };

    DialogAnswer askModal(const DialogRequest& request);
    void wakeModal();

    EventChannel& events_;
    ModalWait modalWait_;
    std::function<void()> modalWake_;
    mutable std::mutex mutex_;
    std::condition_variable answered_;
    std::vector<Waiting*> waiting_;  // a dialog may be asked while another waits
    uint64_t nextId_ = 1;
    bool closed_ = false;
};

}  // namespace pelta::shell
