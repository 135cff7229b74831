#include "shell/ui_thread.h"

#include "shell/apartment.h"

namespace pelta::shell {

UiThread::UiThread() : thread_([this] { run(); }) {
    id_ = thread_.get_id();
}

UiThread::~UiThread() {
    stop();  // never destroyed on its own thread: owners release from outside
}

bool UiThread::post(std::function<void()> task) {
    {
        std::lock_guard lock(mutex_);
        if (stopping_) return false;
        tasks_.push_back(std::move(task));
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
            task = std::move(tasks_.front());
            tasks_.pop_front();
        }
        ApartmentScope apartment;
        task();
    }
}

}  // namespace pelta::shell
