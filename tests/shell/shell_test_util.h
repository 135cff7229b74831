// Helpers shared by the shell's tests.
#pragma once

#include <chrono>
#include <nlohmann/json.hpp>
#include <stdexcept>
#include <string>

#include "shell/event_channel.h"

namespace pelta::shell::testing {

// The next event of `type` after `after` (which moves past it); raises when
// none comes within a generous bound, so that a broken build fails instead of hanging.
inline nlohmann::json nextEvent(EventChannel& channel, const std::string& type, uint64_t& after) {
    auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    while (std::chrono::steady_clock::now() < deadline) {
        for (const Event& e : channel.waitAfter(after, std::chrono::milliseconds(200))) {
            after = e.sequence;
            if (e.type == type) return nlohmann::json::parse(e.data);
        }
    }
    throw std::runtime_error("no \"" + type + "\" event came");
}

// Polls `condition` until it holds; false when it never did within a generous bound.
template <class F>
bool eventually(F condition) {
    auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    while (std::chrono::steady_clock::now() < deadline) {
        if (condition()) return true;
        std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    return condition();
}

}  // namespace pelta::shell::testing
