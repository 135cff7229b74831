#include "shell/apartment.h"

namespace pelta::shell {

namespace {
std::mutex& apartment() {
    static std::mutex m;
    return m;
}
// The apartment's lock of the calling thread while it runs a task.
thread_local std::unique_lock<std::mutex>* t_lock = nullptr;
}  // namespace

ApartmentScope::ApartmentScope() : lock_(apartment()) {
    t_lock = &lock_;
}

ApartmentScope::~ApartmentScope() {
    t_lock = nullptr;
}

ApartmentRelease::ApartmentRelease() : held_(t_lock && t_lock->owns_lock() ? t_lock : nullptr) {
    if (held_) held_->unlock();
}

ApartmentRelease::~ApartmentRelease() {
    if (held_) held_->lock();
}

}  // namespace pelta::shell
