#include "framework/user_agent.h"

#include <algorithm>

#include "framework/grid_extender.h"
#include "framework/services.h"
#include "library/contracts/Constants.h"

namespace pelta::fw {

using namespace PeltaNom15;

std::vector<int32_t> buttonsOfStyle(int32_t style) {
    switch (style & 0x0F) {
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
        default:
            return {vbOK};
    }
}

bool isQuestion(int32_t style) {
    return buttonsOfStyle(style).size() > 1;
}

namespace {

std::string describe(const Prompt& p) {
    std::string kind = p.kind == PromptKind::InputBox ? "input box" : "question";
    return kind + " \"" + p.text + "\" (style " + std::to_string(p.style) + ", caption \"" +
           p.caption + "\")";
}

}  // namespace

ScriptedUserAgent& ScriptedUserAgent::answer(int32_t button, std::string expectText) {
    std::lock_guard lock(mutex_);
    answers_.push_back(Answer{false, button, std::nullopt, std::move(expectText)});
    return *this;
}

ScriptedUserAgent& ScriptedUserAgent::answerInput(pelta::Variant value, std::string expectText) {
    std::lock_guard lock(mutex_);
    answers_.push_back(Answer{true, 0, std::move(value), std::move(expectText)});
    return *this;
}

ScriptedUserAgent& ScriptedUserAgent::cancelInput(std::string expectText) {
    std::lock_guard lock(mutex_);
    answers_.push_back(Answer{true, 0, std::nullopt, std::move(expectText)});
    return *this;
}

ScriptedUserAgent& ScriptedUserAgent::answerSaveFile(std::filesystem::path path,
                                                     std::string expectTitle) {
    std::lock_guard lock(mutex_);
    saveAnswers_.push_back(SaveAnswer{std::move(path), std::move(expectTitle)});
    return *this;
}

ScriptedUserAgent& ScriptedUserAgent::cancelSaveFile(std::string expectTitle) {
    std::lock_guard lock(mutex_);
    saveAnswers_.push_back(SaveAnswer{std::nullopt, std::move(expectTitle)});
    return *this;
}

ScriptedUserAgent& ScriptedUserAgent::answerSelector(std::string criterion,
                                                     std::string expectText) {
    return answerSelectorRows({std::move(criterion)}, std::move(expectText));
}

ScriptedUserAgent& ScriptedUserAgent::answerSelectorRows(std::vector<std::string> criteria,
                                                         std::string expectText) {
    if (criteria.empty()) throw std::logic_error("A selector is answered with at least one row");
    std::lock_guard lock(mutex_);
    selectorAnswers_.push_back(SelectorAnswer{std::move(criteria), std::move(expectText)});
    return *this;
}

ScriptedUserAgent& ScriptedUserAgent::cancelSelector(std::string expectText) {
    std::lock_guard lock(mutex_);
    selectorAnswers_.push_back(SelectorAnswer{{}, std::move(expectText)});
    return *this;
}

ScriptedUserAgent::Answer ScriptedUserAgent::takeAnswer(const Prompt& prompt, bool input) {
    // Called with the mutex held; the prompt is already recorded.
    auto refuse = [&](const std::string& why) -> Answer {
        unscripted_.push_back(prompt);
        throw UnscriptedPrompt(why + ": " + describe(prompt));
    };
    if (answers_.empty()) refuse("No answer was scripted for the " + describe(prompt));
    Answer a = answers_.front();
    if (a.input != input)
        refuse(std::string("The next scripted answer is for ") +
               (a.input ? "an input box" : "a question") + ", not for this");
    if (!a.expectText.empty() && prompt.text.find(a.expectText) == std::string::npos)
        refuse("The scripted answer expected a text containing \"" + a.expectText + "\"");
    if (!input) {
        auto buttons = buttonsOfStyle(prompt.style);
        if (std::find(buttons.begin(), buttons.end(), a.button) == buttons.end())
            refuse("The scripted button " + std::to_string(a.button) + " is not offered");
    }
    answers_.pop_front();
    return a;
}

int32_t ScriptedUserAgent::messageBox(const Prompt& prompt) {
    std::lock_guard lock(mutex_);
    prompts_.push_back(prompt);
    if (!isQuestion(prompt.style)) return vbOK;
    return takeAnswer(prompt, false).button;
}

void ScriptedUserAgent::anchoredMessage(const Prompt& prompt) {
    std::lock_guard lock(mutex_);
    prompts_.push_back(prompt);
}

std::optional<pelta::Variant> ScriptedUserAgent::inputBox(const Prompt& prompt) {
    std::lock_guard lock(mutex_);
    prompts_.push_back(prompt);
    return takeAnswer(prompt, true).value;
}

std::optional<std::filesystem::path> ScriptedUserAgent::saveFile(const Prompt& prompt) {
    std::lock_guard lock(mutex_);
    prompts_.push_back(prompt);
    auto refuse = [&](const std::string& why) {
        unscripted_.push_back(prompt);
        throw UnscriptedPrompt(why + " save-file dialog \"" + prompt.title + "\"");
    };
    if (saveAnswers_.empty()) refuse("No answer was scripted for the");
    SaveAnswer a = saveAnswers_.front();
    if (!a.expectTitle.empty() && prompt.title != a.expectTitle)
        refuse("The scripted answer expected the title \"" + a.expectTitle + "\", not the");
    saveAnswers_.pop_front();
    return a.path;
}

bool ScriptedUserAgent::chooseFromList(const ListPick& pick) {
    Prompt prompt;
    prompt.kind = PromptKind::Selector;
    prompt.text = pick.caption;
    prompt.caption = pick.caption;
    SelectorAnswer a;
    auto refuse = [&](const std::string& why) {
        {
            std::lock_guard lock(mutex_);
            unscripted_.push_back(prompt);
        }
        throw UnscriptedPrompt(why + ": the selector \"" + pick.caption + "\"");
    };
    {
        std::lock_guard lock(mutex_);
        prompts_.push_back(prompt);
        if (selectorAnswers_.empty()) {
            unscripted_.push_back(prompt);
            throw UnscriptedPrompt("No answer was scripted for the selector \"" + pick.caption +
                                   "\"");
        }
        a = std::move(selectorAnswers_.front());
        selectorAnswers_.pop_front();
    }
    if (!a.expectText.empty() && pick.caption.find(a.expectText) == std::string::npos)
        refuse("The scripted answer expected a caption containing \"" + a.expectText + "\"");
    if (a.rows.empty()) return false;
    if (!pick.grid) refuse("The selector shows no grid");
    // Outside the lock: moving in the grid raises the list's events.
    GridExtender& grid = *pick.grid;
    std::vector<pelta::Variant> marks;
    for (const std::string& criterion : a.rows) {
        if (!grid.MoveToRow(criterion)) refuse("No row shown matches " + criterion);
        marks.push_back(grid.CurrentBookmark());
    }
    if (marks.size() > 1 && !grid.MultiSelect()) grid.SetMultiSelect(true);
    grid.SetSelectedBookmarks(marks.size() > 1 ? marks : std::vector<pelta::Variant>{});
    grid.SetCurrentBookmark(marks.front());
    return true;
}

std::vector<Prompt> ScriptedUserAgent::prompts() const {
    std::lock_guard lock(mutex_);
    return prompts_;
}

std::vector<std::string> ScriptedUserAgent::texts() const {
    std::lock_guard lock(mutex_);
    std::vector<std::string> out;
    for (const auto& p : prompts_)
        out.push_back(p.text);
    return out;
}

Prompt ScriptedUserAgent::last() const {
    std::lock_guard lock(mutex_);
    if (prompts_.empty()) throw std::logic_error("Nothing was shown to the user");
    return prompts_.back();
}

size_t ScriptedUserAgent::pending() const {
    std::lock_guard lock(mutex_);
    return answers_.size() + saveAnswers_.size() + selectorAnswers_.size();
}

std::vector<Prompt> ScriptedUserAgent::unscripted() const {
    std::lock_guard lock(mutex_);
    return unscripted_;
}

void ScriptedUserAgent::clear() {
    std::lock_guard lock(mutex_);
    answers_.clear();
    saveAnswers_.clear();
    selectorAnswers_.clear();
    prompts_.clear();
    unscripted_.clear();
}

namespace {
thread_local pelta::Ref<UserAgent> t_agent;
}

pelta::Ref<UserAgent> currentUserAgent() {
    if (t_agent) return t_agent;
    return FrameworkServices::instance()->userAgent();
}

UserAgentScope::UserAgentScope(pelta::Ref<UserAgent> agent) : previous_(std::move(t_agent)) {
    t_agent = std::move(agent);
}

UserAgentScope::~UserAgentScope() {
    t_agent = std::move(previous_);
}

}  // namespace pelta::fw
