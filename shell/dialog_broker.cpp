#include "shell/dialog_broker.h"

#include "shell/apartment.h"

#include <algorithm>
#include <nlohmann/json.hpp>

#include "library/contracts/Constants.h"
#include "shell/event_channel.h"

namespace pelta::shell {

using namespace PeltaNom15;  // vbOK, vbYesNo ... shared with the library

namespace {

const char* kindName(DialogKind kind) {
    switch (kind) {
        case DialogKind::Input:
            return "input";
        case DialogKind::Notice:
            return "notice";
        case DialogKind::Selector:
            return "selector";
        case DialogKind::Message:
            break;
    }
    return "message";
}

const char* iconName(int32_t style) {
    switch (style & 0x70) {
        case vbCritical:
            return "critical";
        case vbQuestion:
            return "question";
        case vbExclamation:
            return "exclamation";
        case vbInformation:
            return "information";
    }
    return "";
}

}  // namespace

std::vector<int32_t> dialogButtons(DialogKind kind, int32_t style) {
    if (kind == DialogKind::Notice) return {vbOK};
    if (kind == DialogKind::Input || kind == DialogKind::Selector) return {vbOK, vbCancel};
    switch (style & 7) {
        case vbOKCancel:
            return {vbOK, vbCancel};
        case vbAbortRetryIgnore:
            return {vbAbort, vbRetry, vbIgnore};
        case vbYesNoCancel:
            return {vbYes, vbNo, vbCancel};
        case vbYesNo:
            return {vbYes, vbNo};
        case vbRetryCancel:
            return {vbRetry, vbCancel};
    }
    return {vbOK};
}

int32_t dismissButton(DialogKind kind, int32_t style) {
    auto buttons = dialogButtons(kind, style);
    if (std::find(buttons.begin(), buttons.end(), vbCancel) != buttons.end()) return vbCancel;
    if (std::find(buttons.begin(), buttons.end(), vbNo) != buttons.end()) return vbNo;
    if (std::find(buttons.begin(), buttons.end(), vbAbort) != buttons.end()) return vbAbort;
    return vbOK;
}

std::string dialogJson(uint64_t id, const DialogRequest& r) {
    auto buttons = dialogButtons(r.kind, r.style);
    size_t defaultIndex = r.kind == DialogKind::Message ? ((r.style >> 8) & 3) : 0;
    if (defaultIndex >= buttons.size()) defaultIndex = 0;
    nlohmann::json j = {
        {"id", id},
        {"kind", kindName(r.kind)},
        {"text", r.text},
        {"caption", r.caption},
        {"details", r.details},
        {"style", r.style},
        {"icon", iconName(r.style)},
        {"buttons", buttons},
        {"defaultButton", buttons[defaultIndex]},
    };
    if (r.kind == DialogKind::Input) j["value"] = r.value;
    if (r.kind == DialogKind::Notice) {
        j["control"] = r.control;
        j["hint"] = r.hint;
    }
    if (r.kind == DialogKind::Selector) j["screen"] = r.screen;
    // Texts come from screens and the database: never let invalid UTF-8 stop the page.
    return j.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

DialogBroker::DialogBroker(EventChannel& events) : events_(events) {}

DialogAnswer DialogBroker::ask(const DialogRequest& request) {
    if (request.kind == DialogKind::Selector && modalWait_) return askModal(request);
    Waiting w{0, request, std::nullopt};
    // Other sessions may run while this one waits for its person.
    ApartmentRelease letOthersRun;
    std::unique_lock lock(mutex_);
    if (closed_) return DialogAnswer{dismissButton(request.kind, request.style), std::nullopt};
    w.id = nextId_++;
    waiting_.push_back(&w);
    events_.publish("dialog", dialogJson(w.id, request));
    answered_.wait(lock, [&] { return w.answer.has_value() || closed_; });
    waiting_.erase(std::find(waiting_.begin(), waiting_.end(), &w));
    if (!w.answer) {
        w.answer = DialogAnswer{dismissButton(request.kind, request.style), std::nullopt};
        events_.publish("dialog-closed", nlohmann::json{{"id", w.id}}.dump());
    }
    return *w.answer;
}

DialogBroker::AnswerResult DialogBroker::answer(uint64_t id, const DialogAnswer& answer) {
    {
        std::lock_guard lock(mutex_);
        auto it = std::find_if(waiting_.begin(), waiting_.end(),
                               [&](const Waiting* w) { return w->id == id; });
        if (it == waiting_.end() || (*it)->answer) return AnswerResult::UnknownDialog;
        Waiting& w = **it;
        auto buttons = dialogButtons(w.request.kind, w.request.style);
        if (std::find(buttons.begin(), buttons.end(), answer.button) == buttons.end())
            return AnswerResult::InvalidButton;
        w.answer = answer;
        if (w.request.kind != DialogKind::Input || answer.button != vbOK)
            w.answer->value.reset();
        else if (!w.answer->value)
            w.answer->value = std::string();
        if (w.request.kind != DialogKind::Selector || answer.button != vbOK) w.answer->rows = {};
    }
    events_.publish("dialog-closed", nlohmann::json{{"id", id}}.dump());
    answered_.notify_all();
    wakeModal();
    return AnswerResult::Accepted;
}

void DialogBroker::close() {
    {
        std::lock_guard lock(mutex_);
        closed_ = true;
    }
    answered_.notify_all();
    wakeModal();
}

void DialogBroker::setModalWait(ModalWait wait, std::function<void()> wake) {
    std::lock_guard lock(mutex_);
    modalWait_ = std::move(wait);
    modalWake_ = std::move(wake);
}

void DialogBroker::wakeModal() {
    std::function<void()> wake;
    {
        std::lock_guard lock(mutex_);
        wake = modalWake_;
    }
    if (wake) wake();
}

// The thread does not block here as for a message box: the page asks for the
// rows of the screen shown while the person chooses, and those requests run
// on this same thread, in the modal wait.
DialogAnswer DialogBroker::askModal(const DialogRequest& request) {
    Waiting w{0, request, std::nullopt};
    const DialogAnswer dismissed{dismissButton(request.kind, request.style), std::nullopt, {}};
    {
        std::lock_guard lock(mutex_);
        if (closed_) return dismissed;
        w.id = nextId_++;
        waiting_.push_back(&w);
        events_.publish("dialog", dialogJson(w.id, request));
    }
    try {
        modalWait_(request.screen, [&] {
            std::lock_guard lock(mutex_);
            return w.answer.has_value() || closed_;
        });
    } catch (...) {
        std::lock_guard lock(mutex_);
        waiting_.erase(std::find(waiting_.begin(), waiting_.end(), &w));
        throw;
    }
    std::lock_guard lock(mutex_);
    waiting_.erase(std::find(waiting_.begin(), waiting_.end(), &w));
    if (!w.answer) {
        w.answer = dismissed;
        events_.publish("dialog-closed", nlohmann::json{{"id", w.id}}.dump());
    }
    return *w.answer;
}

bool DialogBroker::closed() const {
    std::lock_guard lock(mutex_);
    return closed_;
}

std::optional<uint64_t> DialogBroker::waitingId() const {
    std::lock_guard lock(mutex_);
    if (waiting_.empty()) return std::nullopt;
    return waiting_.back()->id;
}

int32_t DialogBroker::messageBox(const std::string& text, int32_t style, const std::string& caption,
                                 const std::string& details) {
    DialogRequest r;
    r.kind = DialogKind::Message;
    r.text = text;
    r.style = style;
    r.caption = caption;
    r.details = details;
    return ask(r).button;
}

bool DialogBroker::inputBox(const std::string& prompt, const std::string& title,
                            std::string& value) {
    DialogRequest r;
    r.kind = DialogKind::Input;
    r.text = prompt;
    r.caption = title;
    r.value = value;
    DialogAnswer a = ask(r);
    if (a.button != vbOK || !a.value) return false;
    value = *a.value;
    return true;
}

std::optional<RowsChoice> DialogBroker::chooseRows(int64_t screen, const std::string& caption) {
    DialogRequest r;
    r.kind = DialogKind::Selector;
    r.caption = caption;
    r.screen = screen;
    DialogAnswer a = ask(r);
    if (a.button != vbOK) return std::nullopt;
    return a.rows;
}

void DialogBroker::showMessage(const std::string& control, const std::string& text,
                               const std::string& title, const std::string& hint) {
    DialogRequest r;
    r.kind = DialogKind::Notice;
    r.control = control;
    r.text = text;
    r.caption = title;
    r.hint = hint;
    ask(r);
}

}  // namespace pelta::shell
