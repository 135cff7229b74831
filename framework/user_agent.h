// The user agent: whoever answers the screens' message boxes, questions and
// input boxes. Every prompt a screen shows goes through the framework to the
// agent of the calling thread. In tests a scripted agent answers from a queue
// and records every prompt; in the web shell an agent per browser session
// shows the prompt and blocks the session's user-interface thread until the
// person answers.
#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>
#include <filesystem>
#include <mutex>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

#include "platform/automation/object.h"
#include "platform/automation/variant.h"

namespace pelta::fw {

enum class PromptKind {
    MessageBox,  // text, style, caption, details; answers a button
    Anchored,    // a message shown at a control, with title and hint
    InputBox,    // prompt and title; answers a value or cancel
    SaveFile,    // a save-file dialog; answers a path or cancel
    Selector,    // a list shown for choosing; its caption is the text
};

struct Prompt {
    PromptKind kind = PromptKind::MessageBox;
    std::string text;
    int32_t style = 0;  // message boxes: vbYesNo + vbQuestion ...
    std::string caption;
    std::string details;
    std::string control;   // anchored messages
    std::string title;     // anchored messages and input boxes
    std::string hint;      // anchored messages
    pelta::Variant value;  // input boxes: the default offered
    // Save-file dialogs (with `title`): the filter ("Описание|*.ext|..."),
    // the folder offered first and the file name offered.
    std::string filter;
    std::string initialDir;
    std::string fileName;
};

// The buttons a message-box style offers (vbOK, vbYes ...), in order.
std::vector<int32_t> buttonsOfStyle(int32_t style);
// True when the style offers a choice (more than the OK button).
bool isQuestion(int32_t style);

class FormExtender;
class GridExtender;

// A selector's list shown for choosing (FrameworkServices::ShowSelector).
struct ListPick {
    std::string caption;
    pelta::Object* selector = nullptr;  // the list control
    FormExtender* form = nullptr;       // its form extender
    GridExtender* grid = nullptr;       // the grid the person chooses in
};

class UserAgent : public virtual pelta::Object {
public:
    // Shows a message box; answers the button pressed.
    virtual int32_t messageBox(const Prompt& prompt) = 0;
    // Shows a message at a control; nothing to answer.
    virtual void anchoredMessage(const Prompt& prompt) = 0;
    // Asks for a value; nullopt when cancelled.
    virtual std::optional<pelta::Variant> inputBox(const Prompt& prompt) = 0;
    // Asks where to save a file the screen will write; nullopt when
    // cancelled. The default cancels: an agent that cannot save files.
    virtual std::optional<std::filesystem::path> saveFile(const Prompt& prompt) {
        (void)prompt;
        return std::nullopt;
    }
    // A form has shown a document (a detail form opened by its list, or
    // moved to another record): a host with windows brings it forward. The
    // default does nothing, as a test needs nothing shown.
    virtual void documentShown(FormExtender& form) { (void)form; }
    // Shows a selector's list: the person stands on or marks rows of
    // `pick.grid` (the list's quick filter works meanwhile) and chooses
    // (True), the grid's current row and marks then telling what, or cancels
    // (False). The default cancels, as an agent that shows no lists must.
    virtual bool chooseFromList(const ListPick& pick) {
        (void)pick;
        return false;
    }
};

// Thrown by the scripted agent when a screen asks what the test did not
// script, or a scripted answer does not fit the question. Deliberately not a
// pelta::Error, so that a screen's error handling does not mistake it for an
// error of its own.
class UnscriptedPrompt : public std::logic_error {
public:
    using std::logic_error::logic_error;
};

// Answers in the order scripted; records every prompt. A message box without
// a choice (OK only) answers OK by itself, and an anchored message needs no
// answer; a question or an input box without a scripted answer throws
// UnscriptedPrompt (and is remembered in unscripted(), in case a screen
// swallows the exception).
class ScriptedUserAgent : public UserAgent {
public:
    // The next question is answered with `button`; when `expectText` is given
    // the question's text must contain it.
    ScriptedUserAgent& answer(int32_t button, std::string expectText = {});
    // The next input box is answered with `value` (or cancelled).
    ScriptedUserAgent& answerInput(pelta::Variant value, std::string expectText = {});
    ScriptedUserAgent& cancelInput(std::string expectText = {});
    // The next save-file dialog is answered with `path` (or cancelled); when
    // `expectTitle` is given the dialog's title must be it. Save-file
    // answers have their own queue.
    ScriptedUserAgent& answerSaveFile(std::filesystem::path path, std::string expectTitle = {});
    ScriptedUserAgent& cancelSaveFile(std::string expectTitle = {});
    // The next selector is answered by standing on the first row of its grid
    // that matches the criterion ("Code = '0000003'"), among the rows its
    // filters leave; with several criteria those rows are marked, the first
    // current. No such row throws UnscriptedPrompt. `expectText` must then be
    // part of the selector's caption. Selectors take their answers in order,
    // apart from the other prompts.
    ScriptedUserAgent& answerSelector(std::string criterion, std::string expectText = {});
    ScriptedUserAgent& answerSelectorRows(std::vector<std::string> criteria,
                                          std::string expectText = {});
    ScriptedUserAgent& cancelSelector(std::string expectText = {});

    int32_t messageBox(const Prompt& prompt) override;
    void anchoredMessage(const Prompt& prompt) override;
    std::optional<pelta::Variant> inputBox(const Prompt& prompt) override;
    std::optional<std::filesystem::path> saveFile(const Prompt& prompt) override;
    bool chooseFromList(const ListPick& pick) override;

    // Everything shown, in order.
    std::vector<Prompt> prompts() const;
    // The texts shown, in order.
    std::vector<std::string> texts() const;
    // The last prompt; throws when nothing was shown.
    Prompt last() const;
    size_t pending() const;  // scripted answers not used yet, of every kind
    std::vector<Prompt> unscripted() const;
    void clear();  // forgets prompts and answers

private:
    struct Answer {
        bool input = false;
        int32_t button = 0;
        std::optional<pelta::Variant> value;
        std::string expectText;
    };
    Answer takeAnswer(const Prompt& prompt, bool input);

    mutable std::mutex mutex_;
    std::deque<Answer> answers_;
    struct SaveAnswer {
        std::optional<std::filesystem::path> path;
        std::string expectTitle;
    };
    std::deque<SaveAnswer> saveAnswers_;
    struct SelectorAnswer {
        std::vector<std::string> rows;  // empty: cancelled
        std::string expectText;
    };
    std::deque<SelectorAnswer> selectorAnswers_;
    std::vector<Prompt> prompts_;
    std::vector<Prompt> unscripted_;
};

// The agent prompts of the calling thread go to: the thread's own (see
// UserAgentScope) when set, else the process-wide one of the framework
// services. Null when neither is set.
pelta::Ref<UserAgent> currentUserAgent();

// Sets the calling thread's agent for the scope's lifetime (a browser
// session's user-interface thread; a test).
class UserAgentScope {
public:
    explicit UserAgentScope(pelta::Ref<UserAgent> agent);
    ~UserAgentScope();
    UserAgentScope(const UserAgentScope&) = delete;
    UserAgentScope& operator=(const UserAgentScope&) = delete;

private:
    pelta::Ref<UserAgent> previous_;
};

}  // namespace pelta::fw
