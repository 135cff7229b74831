// The person in front of a screen, as the shell's screens reach it: message
// boxes, questions, input boxes and messages anchored to a control. Every call
// blocks the calling (user-interface) thread until it is answered.
//
// The framework's own user-agent interface will be implemented over this one
// (see WebUserAgent in dialog_broker.h) when the framework is in the build.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace pelta::shell {

// The rows chosen in a list shown for choosing: the keys of the row the
// person stood on and of the rows marked.
struct RowsChoice {
    std::string current;
    std::vector<std::string> selected;
};

class UserAgent {
public:
    virtual ~UserAgent() = default;
    // Answers the button pressed (vbOK, vbYes, vbNo, vbCancel ...). `style`
    // holds the standard button, icon and default-button flags.
    virtual int32_t messageBox(const std::string& text, int32_t style, const std::string& caption,
                               const std::string& details) = 0;
    // False when cancelled; `value` carries the default in and the answer out.
    virtual bool inputBox(const std::string& prompt, const std::string& title,
                          std::string& value) = 0;
    // A message shown at a control of the screen.
    virtual void showMessage(const std::string& control, const std::string& text,
                             const std::string& title, const std::string& hint) = 0;
    // The list screen `screen` shown in a modal dialog for choosing rows (a
    // selector's list). While the person chooses, the calling thread keeps
    // serving that screen's requests (its rows, its quick filter). Nothing
    // when cancelled; the default cancels, as an agent that shows no lists.
    virtual std::optional<RowsChoice> chooseRows(int64_t screen, const std::string& caption) {
        (void)screen, (void)caption;
        return std::nullopt;
    }
};

}  // namespace pelta::shell
