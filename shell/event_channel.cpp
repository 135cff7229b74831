#include "shell/event_channel.h"

namespace pelta::shell {

EventChannel::EventChannel(size_t backlog) : backlog_(backlog == 0 ? 1 : backlog) {}

void EventChannel::publish(std::string type, std::string data) {
    {
        std::lock_guard lock(mutex_);
        if (closed_) return;
        events_.push_back(Event{++last_, std::move(type), std::move(data)});
        while (events_.size() > backlog_)
            events_.pop_front();
    }
    changed_.notify_all();
}

std::vector<Event> EventChannel::waitAfter(uint64_t after, std::chrono::milliseconds timeout) {
    std::unique_lock lock(mutex_);
    changed_.wait_for(lock, timeout, [&] { return closed_ || last_ > after; });
    std::vector<Event> out;
    for (const Event& e : events_)
        if (e.sequence > after) out.push_back(e);
    return out;
}

void EventChannel::close() {
    {
        std::lock_guard lock(mutex_);
        closed_ = true;
    }
    changed_.notify_all();
}

bool EventChannel::closed() const {
    std::lock_guard lock(mutex_);
    return closed_;
}

uint64_t EventChannel::lastSequence() const {
    std::lock_guard lock(mutex_);
    return last_;
}

void EventChannel::attach() {
    std::lock_guard lock(mutex_);
    ++readers_;
}

void EventChannel::detach() {
    std::lock_guard lock(mutex_);
    if (readers_ > 0) --readers_;
}

int EventChannel::readers() const {
    std::lock_guard lock(mutex_);
    return readers_;
}

std::string formatServerSentEvent(const Event& event) {
    std::string out = "id: " + std::to_string(event.sequence) + "\nevent: " + event.type + "\n";
    size_t start = 0;
    for (;;) {
        size_t end = event.data.find('\n', start);
        out += "data: ";
        out.append(event.data, start, end == std::string::npos ? std::string::npos : end - start);
        out += '\n';
        if (end == std::string::npos) break;
        start = end + 1;
    }
    out += '\n';
    return out;
}

}  // namespace pelta::shell
