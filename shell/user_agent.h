// The person in front of a screen, as the shell's screens reach it: message
// boxes, questions, input boxes and messages anchored to a control. Every call
// blocks the calling (user-interface) thread until it is answered.
//
// The framework's own user-agent interface will be implemented over this one
// (see WebUserAgent in dialog_broker.h) when the framework is in the build.
#pragma once

#include <cstdint>
#include <string>

namespace pelta::shell {

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
};

}  // namespace pelta::shell
