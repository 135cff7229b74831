// Case rules for names — field, member and class names, programmatic
// identifiers — which are ASCII: compared and lowered without regard to case,
// leaving every other byte as it is.
#pragma once

#include <string>
#include <string_view>

namespace pelta {

constexpr char lowerAscii(char c) noexcept {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

inline std::string lowerAscii(std::string_view s) {
    std::string r(s);
    for (char& c : r)
        c = lowerAscii(c);
    return r;
}

constexpr bool equalsNoCaseAscii(std::string_view a, std::string_view b) noexcept {
    if (a.size() != b.size()) return false;
    for (size_t i = 0; i < a.size(); ++i)
        if (lowerAscii(a[i]) != lowerAscii(b[i])) return false;
    return true;
}

}  // namespace pelta
