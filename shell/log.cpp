#include "shell/log.h"

#include <chrono>
#include <cstdio>
#include <ctime>
#include <mutex>

namespace pelta::shell {

void logLine(std::string_view line) {
    static std::mutex mutex;
    std::time_t t = std::chrono::system_clock::to_time_t(std::chrono::system_clock::now());
    std::tm tm{};
    localtime_r(&t, &tm);
    char stamp[32];
    std::strftime(stamp, sizeof stamp, "%Y-%m-%d %H:%M:%S", &tm);
    std::lock_guard lock(mutex);
    std::fprintf(stderr, "%s pelta: %.*s\n", stamp, static_cast<int>(line.size()), line.data());
}

}  // namespace pelta::shell
