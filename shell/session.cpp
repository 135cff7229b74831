#include "shell/session.h"

#include <algorithm>
#include <cstdio>
#include <exception>
#include <nlohmann/json.hpp>
#include <random>

#include "platform/automation/error.h"
#include "shell/log.h"

namespace pelta::shell {

namespace {

int64_t ticks(Clock::time_point t) {
    return t.time_since_epoch().count();
}

std::string describe(const std::exception_ptr& e) {
    try {
        std::rethrow_exception(e);
    } catch (const pelta::Error& err) {
        return err.description() + " (" + err.source() + ")";
    } catch (const std::exception& err) {
        return err.what();
    } catch (...) {
    }
    return "unknown error";
}

}  // namespace

std::string newSessionId() {
    static std::mutex mutex;
    static std::random_device device;  // the kernel's random source
    std::lock_guard lock(mutex);
    std::string id;
    for (int i = 0; i < 4; ++i) {
        char part[9];
        std::snprintf(part, sizeof part, "%08x", static_cast<unsigned>(device()));
        id += part;
    }
    return id;
}

// ---- Session ------------------------------------------------------------------

Session::Session(std::string id, ScreenProvider& provider, std::string user)
    : id_(std::move(id)),
      user_(std::move(user)),
      provider_(provider),
      dialogs_(events_),
      downloads_(events_),
      lastActivity_(ticks(Clock::now())) {
    // A selector's dialog waits on the thread, serving its own screen's requests.
    dialogs_.setModalWait(
        [this](int64_t screen, const std::function<bool()>& done) {
            ui_.serveUntil(done, [screen](int64_t tag) { return tag == screen; });
        },
        [this] { ui_.wake(); });
    ui_.call([this] { library_ = provider_.startSession(*this); });
}

Session::~Session() {
    release();
}

void Session::touch() noexcept {
    lastActivity_ = ticks(Clock::now());
}

Clock::time_point Session::lastActivity() const noexcept {
    return Clock::time_point(Clock::duration(lastActivity_.load()));
}

int64_t Session::openList(const std::string& navigationId) {
    if (!library_) pelta::raise(pelta::errc::Fail, "The session has ended", "pelta.shell");
    return openScreen(library_->openList(navigationId));
}

std::shared_ptr<Screen> Session::screen(int64_t id) const {
    for (const auto& [sid, s] : screens_)
        if (sid == id) return s;
    for (const auto& [sid, s] : modal_)
        if (sid == id) return s;
    return nullptr;
}

int64_t Session::openModalScreen(std::shared_ptr<Screen> screen) {
    if (!screen)
        pelta::raise(pelta::errc::ObjectVariableNotSet, "No screen to show", "pelta.shell");
    int64_t id = nextScreen_++;
    modal_.emplace_back(id, std::move(screen));
    return id;
}

void Session::closeModalScreen(int64_t id) {
    modal_.erase(
        std::remove_if(modal_.begin(), modal_.end(), [&](const auto& p) { return p.first == id; }),
        modal_.end());
}

std::vector<std::pair<int64_t, std::shared_ptr<Screen>>> Session::screens() const {
    return screens_;
}

bool Session::closeScreen(int64_t id, bool force) {
    auto it = std::find_if(screens_.begin(), screens_.end(),
                           [&](const auto& p) { return p.first == id; });
    if (it == screens_.end()) return false;
    std::shared_ptr<Screen> s = it->second;
    if (!force && !s->queryTerminate()) return false;
    // The screen may have closed itself meanwhile (through a question's answer).
    it = std::find_if(screens_.begin(), screens_.end(),
                      [&](const auto& p) { return p.first == id; });
    if (it == screens_.end()) return true;
    screens_.erase(it);
    try {
        s->terminate();
    } catch (...) {
        logLine("screen " + std::to_string(id) +
                " failed to terminate: " + describe(std::current_exception()));
    }
    publishScreen(id, "closed");
    return true;
}

int64_t Session::openScreen(std::shared_ptr<Screen> screen) {
    if (!screen)
        pelta::raise(pelta::errc::ObjectVariableNotSet, "No screen to open", "pelta.shell");
    // A screen opened twice (a reused detail form) keeps its id and comes forward.
    for (const auto& [sid, s] : screens_) {
        if (s == screen) {
            publishScreen(sid, "opened");
            return sid;
        }
    }
    int64_t id = nextScreen_++;
    screens_.emplace_back(id, std::move(screen));
    publishScreen(id, "opened");
    return id;
}

void Session::screenChanged(Screen& screen) {
    if (int64_t id = idOf(screen)) publishScreen(id, "changed");
}

void Session::gridChanged(Screen& screen, const std::string& grid) {
    if (int64_t id = idOf(screen))
        events_.publish("refresh", nlohmann::json{{"screen", id}, {"grid", grid}}.dump(
                                       -1, ' ', false, nlohmann::json::error_handler_t::replace));
}

void Session::closeScreen(Screen& screen) {
    if (int64_t id = idOf(screen)) closeScreen(id, true);
}

int64_t Session::idOf(const Screen& screen) const {
    for (const auto& [sid, s] : screens_)
        if (s.get() == &screen) return sid;
    return 0;
}

void Session::publishScreen(int64_t id, const char* change) {
    events_.publish("screen", nlohmann::json{{"screen", id}, {"change", change}}.dump());
}

void Session::terminateAll() {
    // Last opened first, as the host terminates its forms.
    size_t screens = 0;
    while (!screens_.empty()) {
        closeScreen(screens_.back().first, true);
        ++screens;
    }
    logLine("session " + id_.substr(0, 8) + " released: " + std::to_string(screens) +
            " screens terminated");
    if (library_) {
        try {
            library_->terminate();
        } catch (...) {
            logLine("the library failed to terminate: " + describe(std::current_exception()));
        }
        library_.reset();
    }
}

void Session::release() {
    std::lock_guard lock(releaseMutex_);
    if (released_) return;
    released_ = true;
    dialogs_.close();  // unblocks a screen waiting for an answer
    try {
        ui_.call([this] { terminateAll(); });
    } catch (const ThreadStopped&) {
    } catch (...) {
        logLine("session " + id_.substr(0, 8) +
                " failed to terminate: " + describe(std::current_exception()));
    }
    ui_.stop();
    events_.publish("closed", "{}");
    events_.close();
}

// ---- SessionManager -----------------------------------------------------------

SessionManager::SessionManager(ScreenProvider& provider, SessionOptions options)
    : provider_(provider), options_(options), reaper_([this] { reaper(); }) {}

SessionManager::~SessionManager() {
    {
        std::lock_guard lock(mutex_);
        stopping_ = true;
    }
    stopReaper_.notify_all();
    reaper_.join();
    releaseAll();
}

std::shared_ptr<Session> SessionManager::create(const std::string& user) {
    {
        std::lock_guard lock(mutex_);
        if (stopping_ || sessions_.size() >= options_.maxSessions) return nullptr;
    }
    // Started outside the lock: the library's start runs on the new thread.
    auto session = std::make_shared<Session>(newSessionId(), provider_, user);
    std::lock_guard lock(mutex_);
    if (stopping_ || sessions_.size() >= options_.maxSessions) return nullptr;  // releases it
    sessions_.emplace(session->id(), session);
    return session;
}

std::shared_ptr<Session> SessionManager::find(const std::string& id) {
    std::lock_guard lock(mutex_);
    auto it = sessions_.find(id);
    if (it == sessions_.end()) return nullptr;
    it->second->touch();
    return it->second;
}

bool SessionManager::release(const std::string& id) {
    std::shared_ptr<Session> session;
    {
        std::lock_guard lock(mutex_);
        auto it = sessions_.find(id);
        if (it == sessions_.end()) return false;
        session = std::move(it->second);
        sessions_.erase(it);
    }
    session->release();
    return true;
}

void SessionManager::releaseAll() {
    std::map<std::string, std::shared_ptr<Session>> all;
    {
        std::lock_guard lock(mutex_);
        all.swap(sessions_);
    }
    for (auto& [id, session] : all)
        session->release();
}

size_t SessionManager::count() const {
    std::lock_guard lock(mutex_);
    return sessions_.size();
}

size_t SessionManager::reapIdle() {
    std::vector<std::shared_ptr<Session>> idle;
    auto now = Clock::now();
    {
        std::lock_guard lock(mutex_);
        for (auto it = sessions_.begin(); it != sessions_.end();) {
            Session& s = *it->second;
            if (s.events().readers() == 0 && now - s.lastActivity() > options_.idleTimeout) {
                idle.push_back(std::move(it->second));
                it = sessions_.erase(it);
            } else {
                ++it;
            }
        }
    }
    for (auto& s : idle) {
        logLine("session " + s->id().substr(0, 8) + " idle: released");
        s->release();
    }
    return idle.size();
}

void SessionManager::reaper() {
    std::unique_lock lock(mutex_);
    while (!stopping_) {
        stopReaper_.wait_for(lock, options_.reapInterval);
        if (stopping_) break;
        lock.unlock();
        reapIdle();
        lock.lock();
    }
}

}  // namespace pelta::shell
