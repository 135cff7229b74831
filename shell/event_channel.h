// The events of one session on their way to its page: "dialog", "dialog-closed",
// "screen" (a screen opened, closed or changed), "refresh" (a grid's rows
// changed) and "closed" (the session ended). The page reads them as
// server-sent events; each carries a sequence number so that a reconnecting
// page resumes where it stopped.
#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <mutex>
#include <string>
#include <vector>

namespace pelta::shell {

struct Event {
    uint64_t sequence = 0;
    std::string type;
    std::string data;  // JSON text
};

class EventChannel {
public:
    // Keeps at most `backlog` events for readers that reconnect.
    explicit EventChannel(size_t backlog = 512);

    void publish(std::string type, std::string data);

    // The events after `after`, waiting up to `timeout` for one to come or
    // for the channel to close. Empty when none came.
    std::vector<Event> waitAfter(uint64_t after, std::chrono::milliseconds timeout);

    // Wakes every reader; later publications are dropped.
    void close();
    bool closed() const;
    uint64_t lastSequence() const;

    // Readers attached (open event streams).
    void attach();
    void detach();
    int readers() const;

private:
    mutable std::mutex mutex_;
    std::condition_variable changed_;
    std::deque<Event> events_;
    size_t backlog_;
    uint64_t last_ = 0;
    bool closed_ = false;
    int readers_ = 0;
};

// Text of one server-sent event: "id:", "event:" and "data:" lines (the data
// split at line breaks, as the format demands) and the blank line.
std::string formatServerSentEvent(const Event& event);

}  // namespace pelta::shell
