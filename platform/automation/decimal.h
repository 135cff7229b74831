// Exact decimal numbers: a 96-bit unsigned mantissa, a sign and a scale of 0
// to 28 (value = mantissa / 10^scale), as the automation Decimal kind.
// Arithmetic is exact where the result fits; otherwise it is rounded half away
// from zero to the largest scale that fits, and raises Overflow (6) when the
// integral part does not fit.
#pragma once

#include <compare>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace pelta {

class Decimal {
public:
    static constexpr int kMaxScale = 28;

    constexpr Decimal() noexcept = default;
    Decimal(int64_t v) noexcept;  // NOLINT: implicit from integers is intended
    // From a double, keeping up to 15 significant digits as automation does.
    static Decimal fromDouble(double v);
    // Parses plain decimal text ("-12.345", "1e-3"); nullopt when not a number
    // or out of range. Locale-free: "." is the decimal separator.
    static std::optional<Decimal> parse(std::string_view text) noexcept;
    // From raw parts; raises Overflow when scale > 28.
    static Decimal fromParts(uint64_t lo, uint32_t hi, int scale, bool negative);

    uint64_t lo() const noexcept { return lo_; }
    uint32_t hi() const noexcept { return hi_; }
    int scale() const noexcept { return scale_; }
    bool negative() const noexcept { return neg_; }
    bool isZero() const noexcept { return lo_ == 0 && hi_ == 0; }

    double toDouble() const noexcept;
    // Rounded half to even, as the language's integer conversions; raises
    // Overflow (6) when out of range of int64.
    int64_t toInt64() const;
    // Plain text without exponent and without trailing zeros beyond the
    // scale's significance ("1.5", "-0.001", "12").
    std::string toString() const;

    // Rounded half away from zero to `places` decimal places (0 to 28; others
    // raise InvalidProcedureCall, 5).
    Decimal round(int places) const;
    Decimal truncate() const;  // towards zero
    Decimal abs() const noexcept;
    Decimal operator-() const noexcept;

    friend Decimal operator+(const Decimal& a, const Decimal& b);
    friend Decimal operator-(const Decimal& a, const Decimal& b);
    friend Decimal operator*(const Decimal& a, const Decimal& b);
    friend Decimal operator/(const Decimal& a, const Decimal& b);  // raises 11 on zero
    Decimal& operator+=(const Decimal& b) { return *this = *this + b; }
    Decimal& operator-=(const Decimal& b) { return *this = *this - b; }
    Decimal& operator*=(const Decimal& b) { return *this = *this * b; }
    Decimal& operator/=(const Decimal& b) { return *this = *this / b; }

    // Numeric comparison: 1.50 == 1.5.
    friend std::strong_ordering operator<=>(const Decimal& a, const Decimal& b) noexcept;
    friend bool operator==(const Decimal& a, const Decimal& b) noexcept {
        return (a <=> b) == std::strong_ordering::equal;
    }

private:
    uint64_t lo_ = 0;
    uint32_t hi_ = 0;
    uint8_t scale_ = 0;
    bool neg_ = false;
};

// The automation Currency kind: a 64-bit integer scaled by 10,000.
struct Currency {
    int64_t scaled = 0;
    static constexpr int64_t kScale = 10000;
    friend constexpr auto operator<=>(const Currency&, const Currency&) = default;
};

// The automation Date kind: days since 1899-12-30, the fraction is the time of
// day (for negative values the fraction still counts forward from midnight).
struct Date {
    double oa = 0.0;
    friend constexpr auto operator<=>(const Date&, const Date&) = default;
};

}  // namespace pelta
