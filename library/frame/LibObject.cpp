#include "library/frame/LibObject.h"

#include <atomic>

namespace PeltaNom15 {

namespace {
std::atomic<int64_t> g_live{0};
}

LibObject::LibObject() noexcept {
    g_live.fetch_add(1, std::memory_order_relaxed);
}

LibObject::~LibObject() {
    g_live.fetch_sub(1, std::memory_order_relaxed);
}

int64_t LibObject::liveObjects() noexcept {
    return g_live.load(std::memory_order_relaxed);
}

}  // namespace PeltaNom15
