// Browser sessions. Each has its own user-interface thread on which the
// library's screens run, its event channel to the page and its dialog broker.
// A session ends when the page says so, or when no page has listened to its
// events for the idle time (a closed tab); its screens are then terminated.
#pragma once

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "shell/dialog_broker.h"
#include "shell/downloads.h"
#include "shell/event_channel.h"
#include "shell/screen.h"
#include "shell/ui_thread.h"

namespace pelta::shell {

using Clock = std::chrono::steady_clock;

class Session : public ScreenHost {
public:
    // `user`: the login name of the person (empty on loopback without login).
    Session(std::string id, ScreenProvider& provider, std::string user = {});
    ~Session() override;

    const std::string& id() const noexcept { return id_; }
    EventChannel& events() noexcept { return events_; }
    DialogBroker& dialogs() noexcept { return dialogs_; }
    UiThread& ui() noexcept { return ui_; }

    // ---- on the user-interface thread --------------------------------------
    // Opens a list by its navigation id; answers the screen id.
    int64_t openList(const std::string& navigationId);
    std::shared_ptr<Screen> screen(int64_t id) const;  // null when unknown
    std::vector<std::pair<int64_t, std::shared_ptr<Screen>>> screens() const;
    // Asks the screen to terminate (unless `force`) and closes it; false when refused.
    bool closeScreen(int64_t id, bool force);

    // ScreenHost
    UserAgent& userAgent() override { return dialogs_; }
    Downloads* downloads() override { return &downloads_; }
    std::string userName() const override { return user_; }
    int64_t openScreen(std::shared_ptr<Screen> screen) override;
    void screenChanged(Screen& screen) override;
    void gridChanged(Screen& screen, const std::string& grid) override;
    void closeScreen(Screen& screen) override;
    int64_t openModalScreen(std::shared_ptr<Screen> screen) override;
    void closeModalScreen(int64_t id) override;

    // ---- from any thread ----------------------------------------------------
    void touch() noexcept;
    Clock::time_point lastActivity() const noexcept;
    // Dismisses waiting dialogs, terminates the screens last to first and the
    // library's hold, stops the thread and closes the event channel. Waits for
    // all that; idempotent. Never call it on the session's own thread.
    void release();
    bool released() const noexcept { return released_; }

private:
    void start();
    void terminateAll();
    int64_t idOf(const Screen& screen) const;
    void publishScreen(int64_t id, const char* change);

    std::string id_;
    std::string user_;
    ScreenProvider& provider_;
    EventChannel events_;
    DialogBroker dialogs_;
    Downloads downloads_;
    std::atomic<int64_t> lastActivity_;
    std::atomic<bool> released_{false};
    std::mutex releaseMutex_;

    // Owned by the user-interface thread.
    std::unique_ptr<LibrarySession> library_;
    std::vector<std::pair<int64_t, std::shared_ptr<Screen>>> screens_;  // in opening order
    std::vector<std::pair<int64_t, std::shared_ptr<Screen>>> modal_;    // shown in dialogs
    int64_t nextScreen_ = 1;

    UiThread ui_;  // last: stops first, before the members its tasks use
};

struct SessionOptions {
    // A session none of whose pages listens for this long is released.
    std::chrono::milliseconds idleTimeout{std::chrono::seconds(45)};
    std::chrono::milliseconds reapInterval{std::chrono::seconds(1)};
    size_t maxSessions = 64;
};

class SessionManager {
public:
    SessionManager(ScreenProvider& provider, SessionOptions options = {});
    ~SessionManager();  // releases every session
    SessionManager(const SessionManager&) = delete;
    SessionManager& operator=(const SessionManager&) = delete;

    // A new session of `user`; null when the limit is reached.
    std::shared_ptr<Session> create(const std::string& user = {});
    // The live session with this id, marked active; null when there is none.
    std::shared_ptr<Session> find(const std::string& id);
    bool release(const std::string& id);
    void releaseAll();
    size_t count() const;
    // Releases the sessions idle past the timeout with no page listening;
    // answers how many. The reaper thread calls it every reap interval.
    size_t reapIdle();

    const SessionOptions& options() const noexcept { return options_; }
    ScreenProvider& provider() noexcept { return provider_; }

private:
    void reaper();

    ScreenProvider& provider_;
    SessionOptions options_;
    mutable std::mutex mutex_;
    std::map<std::string, std::shared_ptr<Session>> sessions_;
    std::condition_variable stopReaper_;
    bool stopping_ = false;
    std::thread reaper_;
};

// 128 random bits as 32 hexadecimal digits.
std::string newSessionId();

}  // namespace pelta::shell
