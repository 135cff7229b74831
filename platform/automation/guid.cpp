#include "platform/automation/guid.h"

#include <random>

namespace pelta {

namespace {
int hexValue(char c) noexcept {
    if (c >= '0' && c <= '9') return c - '0';
    if (c >= 'a' && c <= 'f') return c - 'a' + 10;
    if (c >= 'A' && c <= 'F') return c - 'A' + 10;
    return -1;
}
}  // namespace

std::optional<Guid> Guid::parse(std::string_view t) noexcept {
    if (t.size() == 38) {
        if (t.front() != '{' || t.back() != '}') return std::nullopt;
        t = t.substr(1, 36);
    }
    if (t.size() != 36) return std::nullopt;
    Guid g;
    size_t b = 0;
    for (size_t i = 0; i < 36;) {
        if (i == 8 || i == 13 || i == 18 || i == 23) {
            if (t[i] != '-') return std::nullopt;
            ++i;
            continue;
        }
        int hi = hexValue(t[i]), lo = hexValue(t[i + 1]);
        if (hi < 0 || lo < 0) return std::nullopt;
        g.bytes[b++] = static_cast<uint8_t>(hi << 4 | lo);
        i += 2;
    }
    return g;
}

Guid Guid::generate() {
    thread_local std::mt19937_64 rng{std::random_device{}()};
    Guid g;
    for (size_t i = 0; i < 16; i += 8) {
        uint64_t r = rng();
        for (size_t k = 0; k < 8; ++k)
            g.bytes[i + k] = static_cast<uint8_t>(r >> (8 * k));
    }
    g.bytes[6] = static_cast<uint8_t>((g.bytes[6] & 0x0F) | 0x40);
    g.bytes[8] = static_cast<uint8_t>((g.bytes[8] & 0x3F) | 0x80);
    return g;
}

std::string Guid::toString() const {
    static constexpr char hex[] = "0123456789ABCDEF";
    std::string s;
    s.reserve(38);
    s.push_back('{');
    for (size_t i = 0; i < 16; ++i) {
        if (i == 4 || i == 6 || i == 8 || i == 10) s.push_back('-');
        s.push_back(hex[bytes[i] >> 4]);
        s.push_back(hex[bytes[i] & 15]);
    }
    s.push_back('}');
    return s;
}

bool Guid::isNull() const noexcept {
    for (auto b : bytes)
        if (b) return false;
    return true;
}

std::string newGuidString() {
    return Guid::generate().toString();
}

}  // namespace pelta
