// What every extender shares: the owner it serves and the raising of events.
//
// An event is raised by calling the handler the screen attached, if any.
// Nothing is trapped: an error thrown by a handler propagates to whoever drove
// the framework operation (the host, the web shell, a test), just as an error
// leaving an event handler reaches the caller on the original platform.
#pragma once

#include <functional>
#include <utility>

#include "platform/automation/object.h"

namespace pelta::fw {

class ExtenderBase {
public:
    // The object that owns the extender (a screen). Not a reference: the
    // screen holds its extenders, never the other way round.
    pelta::Object* owner() const noexcept { return owner_; }

protected:
    void setOwner(pelta::Object* owner) noexcept { owner_ = owner; }

    // Calls `handler` when set; answers whether it was set.
    template <class... Sig, class... Args>
    static bool raise(const std::function<void(Sig...)>& handler, Args&&... args) {
        if (!handler) return false;
        handler(std::forward<Args>(args)...);
        return true;
    }

private:
    pelta::Object* owner_ = nullptr;
};

}  // namespace pelta::fw
