#include "shell/ui_thread.h"

#include <algorithm>

#include "shell/apartment.h"

namespace pelta::shell {

UiThread::UiThread() : thread_([this] { run(); }) {
    id_ = thread_.get_id();
}

UiThread::~UiThread() {
    stop();  // never destroyed on its own thread: owners release from outside
}

namespace {
thread_local int64_t t_tag = 0;
}

UiTaskTag::UiTaskTag(int64_t tag) : previous_(t_tag) {
    t_tag = tag;
}

UiTaskTag::~UiTaskTag() {
    t_tag = previous_;
}

int64_t UiTaskTag::current() noexcept {
    return t_tag;
}

bool UiThread::post(std::function<void()> task) {
    {
        std::lock_guard lock(mutex_);
        if (stopping_) return false;
        tasks_.push_back(Task{t_tag, std::move(task)});
    }
    wake_.notify_one();
    return true;
}

bool UiThread::stopped() const {
    std::lock_guard lock(mutex_);
    return stopping_;
}

void UiThread::stop() {
    {
        std::lock_guard lock(mutex_);
        stopping_ = true;
    }
    wake_.notify_one();
    if (thread_.joinable() && !isCurrent()) thread_.join();
}

void UiThread::run() {
    for (;;) {
        std::function<void()> task;
        {
            std::unique_lock lock(mutex_);
            wake_.wait(lock, [this] { return stopping_ || !tasks_.empty(); });
            if (stopping_) {
                // Dropping a packaged task's wrapper breaks its promise, which
                // its caller sees as a broken_promise future_error.
                tasks_.clear();
                return;
            }
            task = std::move(tasks_.front().run);
            tasks_.pop_front();
        }
        ApartmentScope apartment;
        task();
    }
}

bool UiThread::serveUntil(const std::function<bool()>& done,
                          const std::function<bool(int64_t tag)>& admit) {
    for (;;) {
        std::function<void()> task;
        {
            // Released first and taken back last: never wait for the
            // apartment while holding the queue.
            ApartmentRelease letOthersRun;
            std::unique_lock lock(mutex_);
            auto admitted = [&] {
                return std::find_if(tasks_.begin(), tasks_.end(),
                                    [&](const Task& t) { return admit(t.tag); });
            };
            wake_.wait(lock, [&] { return stopping_ || done() || admitted() != tasks_.end(); });
            if (stopping_) return false;
            if (done()) return true;
            auto it = admitted();
            task = std::move(it->run);
            tasks_.erase(it);
        }
        task();
    }
}

void UiThread::wake() {
    { std::lock_guard lock(mutex_); }
    wake_.notify_all();
}

}  // namespace pelta::shell
