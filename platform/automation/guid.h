// GUIDs: class identifiers and record keys, written in braces.
#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace pelta {

struct Guid {
    std::array<uint8_t, 16> bytes{};

    // Parses "{xxxxxxxx-xxxx-xxxx-xxxx-xxxxxxxxxxxx}" (braces optional), any case.
    static std::optional<Guid> parse(std::string_view text) noexcept;
    // A new random (version 4) GUID.
    static Guid generate();
    // "{XXXXXXXX-XXXX-XXXX-XXXX-XXXXXXXXXXXX}" in upper case.
    std::string toString() const;
    bool isNull() const noexcept;

    friend bool operator==(const Guid&, const Guid&) = default;
    friend auto operator<=>(const Guid&, const Guid&) = default;
};

// A new key as a braced upper-case GUID text.
std::string newGuidString();

}  // namespace pelta
