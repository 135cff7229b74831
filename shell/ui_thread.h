// The user-interface thread of one browser session: a single thread that runs
// posted tasks in order. Every screen of the session lives on it, as on the
// original platform, so a task may block (in a message box) without locks.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <deque>
#include <functional>
#include <future>
#include <mutex>
#include <stdexcept>
#include <thread>
#include <type_traits>

namespace pelta::shell {

// Raised to callers whose task can no longer run because the thread stopped.
class ThreadStopped : public std::runtime_error {
public:
    ThreadStopped() : std::runtime_error("the session's user-interface thread has stopped") {}
};

class UiThread {
public:
    UiThread();
    ~UiThread();
    UiThread(const UiThread&) = delete;
    UiThread& operator=(const UiThread&) = delete;

    // Queues a task; false when the thread has stopped (the task is dropped).
    // The task carries the tag of the posting thread (see UiTaskTag).
    bool post(std::function<void()> task);

    // Runs `f` on the thread and waits for its result; its exceptions reach the
    // caller. Raises ThreadStopped when the thread stopped before running it.
    // Must not be called on the thread itself (it would wait for itself).
    template <class F>
    auto call(F f) -> std::invoke_result_t<F&> {
        using R = std::invoke_result_t<F&>;
        if (isCurrent()) return f();
        auto task = std::make_shared<std::packaged_task<R()>>(std::move(f));
        auto result = task->get_future();
        if (!post([task] { (*task)(); })) throw ThreadStopped();
        try {
            return result.get();
        } catch (const std::future_error&) {
            throw ThreadStopped();  // dropped unrun by stop(): its promise broke
        }
    }

    // Finishes the task in progress, drops the queued ones (their callers get
    // ThreadStopped) and joins. Idempotent; must not run on the thread itself.
    void stop();

    bool isCurrent() const noexcept { return std::this_thread::get_id() == id_; }
    bool stopped() const;

    // A modal wait, on the thread itself within a task: until `done` holds
    // (asked again at each wake()) runs the queued tasks whose tag `admit`
    // takes, in their order, and leaves the others queued for later. The
    // apartment is given up while it waits and held while a task runs.
    // False when the thread is stopping.
    bool serveUntil(const std::function<bool()>& done,
                    const std::function<bool(int64_t tag)>& admit);
    // Makes a modal wait ask its `done` again.
    void wake();

private:
    struct Task {
        int64_t tag = 0;
        std::function<void()> run;
    };
    void run();

    mutable std::mutex mutex_;
    std::condition_variable wake_;
    std::deque<Task> tasks_;
    bool stopping_ = false;
    std::thread thread_;
    std::thread::id id_;
};

// Tags the tasks the calling thread posts, for its lifetime, with the screen
// they serve (an HTTP thread handling a request about screen 7), so that a
// modal wait over that screen runs them. Untagged tasks carry 0.
class UiTaskTag {
public:
    explicit UiTaskTag(int64_t tag);
    ~UiTaskTag();
    UiTaskTag(const UiTaskTag&) = delete;
    UiTaskTag& operator=(const UiTaskTag&) = delete;

    static int64_t current() noexcept;

private:
    int64_t previous_;
};

}  // namespace pelta::shell
