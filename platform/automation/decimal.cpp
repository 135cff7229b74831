// Exact decimal arithmetic of the automation Decimal kind.
//
// The mantissa has 96 bits, so it fits a 128-bit integer; products and
// operands aligned to a common scale need more, and go through Wide, a small
// fixed-size unsigned integer of 256 bits. Every result is brought back into
// range by one routine (normalize) that drops decimal digits from the right,
// rounding half away from zero on the most significant dropped digit.
#include "platform/automation/decimal.h"

#include <array>
#include <charconv>
#include <cmath>
#include <limits>

#include "platform/automation/error.h"

namespace pelta {

namespace {

__extension__ typedef unsigned __int128 u128;

u128 pow10(int n) noexcept {
    u128 r = 1;
    for (int i = 0; i < n; ++i)
        r *= 10;
    return r;
}

// Unsigned integer of 256 bits in 32-bit limbs, least significant first.
struct Wide {
    static constexpr int kLimbs = 8;
    std::array<uint32_t, kLimbs> limb{};

    Wide() = default;
    explicit Wide(u128 v) noexcept {
        for (int i = 0; i < 4; ++i)
            limb[i] = static_cast<uint32_t>(v >> (32 * i));
    }

    bool isZero() const noexcept {
        for (uint32_t l : limb)
            if (l) return false;
        return true;
    }
    bool fits96() const noexcept {
        for (int i = 3; i < kLimbs; ++i)
            if (limb[i]) return false;
        return true;
    }
    bool fits128() const noexcept {
        for (int i = 4; i < kLimbs; ++i)
            if (limb[i]) return false;
        return true;
    }
    u128 low128() const noexcept {
        u128 r = 0;
        for (int i = 3; i >= 0; --i)
            r = (r << 32) | limb[i];
        return r;
    }

    // this = this * m + add; false on overflow of 256 bits.
    bool mulAdd(uint32_t m, uint32_t add = 0) noexcept {
        uint64_t carry = add;
        for (uint32_t& l : limb) {
            uint64_t t = static_cast<uint64_t>(l) * m + carry;
            l = static_cast<uint32_t>(t);
            carry = t >> 32;
        }
        return carry == 0;
    }
    // this = this / d; returns the remainder.
    uint32_t divSmall(uint32_t d) noexcept {
        uint64_t rem = 0;
        for (int i = kLimbs - 1; i >= 0; --i) {
            uint64_t cur = (rem << 32) | limb[i];
            limb[i] = static_cast<uint32_t>(cur / d);
            rem = cur % d;
        }
        return static_cast<uint32_t>(rem);
    }
    bool mulPow10(int n) noexcept {
        while (n >= 9) {
            if (!mulAdd(1000000000u)) return false;
            n -= 9;
        }
        return n == 0 || mulAdd(static_cast<uint32_t>(pow10(n)));
    }
    bool addSmall(uint32_t v) noexcept { return mulAdd(1, v); }

    friend int compare(const Wide& a, const Wide& b) noexcept {
        for (int i = kLimbs - 1; i >= 0; --i)
            if (a.limb[i] != b.limb[i]) return a.limb[i] < b.limb[i] ? -1 : 1;
        return 0;
    }
    // a + b; both operands are far below 2^255 wherever this is used.
    friend Wide add(const Wide& a, const Wide& b) noexcept {
        Wide r;
        uint64_t carry = 0;
        for (int i = 0; i < kLimbs; ++i) {
            uint64_t t = static_cast<uint64_t>(a.limb[i]) + b.limb[i] + carry;
            r.limb[i] = static_cast<uint32_t>(t);
            carry = t >> 32;
        }
        return r;
    }
    // a - b for a >= b.
    friend Wide sub(const Wide& a, const Wide& b) noexcept {
        Wide r;
        int64_t borrow = 0;
        for (int i = 0; i < kLimbs; ++i) {
            int64_t t = static_cast<int64_t>(a.limb[i]) - b.limb[i] - borrow;
            borrow = t < 0;
            r.limb[i] = static_cast<uint32_t>(t + (borrow << 32));
        }
        return r;
    }
    // a * b for operands of at most 128 bits each.
    friend Wide mul(const Wide& a, const Wide& b) noexcept {
        Wide r;
        for (int i = 0; i < 4; ++i) {
            uint64_t carry = 0;
            for (int j = 0; j < 4; ++j) {
                uint64_t t = static_cast<uint64_t>(a.limb[i]) * b.limb[j] + r.limb[i + j] + carry;
                r.limb[i + j] = static_cast<uint32_t>(t);
                carry = t >> 32;
            }
            r.limb[i + 4] = static_cast<uint32_t>(carry);
        }
        return r;
    }
};

u128 mantissa(const Decimal& d) noexcept {
    return (static_cast<u128>(d.hi()) << 64) | d.lo();
}

Decimal make(u128 m, int scale, bool negative) {
    return Decimal::fromParts(static_cast<uint64_t>(m), static_cast<uint32_t>(m >> 64), scale,
                              negative && m != 0);
}

// Brings w / 10^scale into the Decimal range: a scale of 0..28 and a 96-bit
// mantissa. Digits are dropped from the right and the result rounded half away
// from zero; raises Overflow when the integral part itself does not fit.
Decimal normalize(Wide w, int scale, bool negative) {
    if (w.isZero()) return Decimal();
    if (scale < 0) {
        if (!w.mulPow10(-scale) || !w.fits96()) raise(errc::Overflow, {});
        scale = 0;
    }
    for (;;) {
        uint32_t dropped = 0;
        while (scale > Decimal::kMaxScale || !w.fits96()) {
            if (scale == 0) raise(errc::Overflow, {});
            dropped = w.divSmall(10);
            --scale;
        }
        if (dropped < 5) break;
        w.addSmall(1);
        if (w.fits96()) break;
        // Rounding carried out of 96 bits: drop one more digit.
    }
    return make(w.low128(), scale, negative);
}

// Both magnitudes at the larger of the two scales.
int align(const Decimal& a, const Decimal& b, Wide& wa, Wide& wb) noexcept {
    wa = Wide(mantissa(a));
    wb = Wide(mantissa(b));
    int scale = a.scale();
    if (a.scale() < b.scale()) {
        wa.mulPow10(b.scale() - a.scale());
        scale = b.scale();
    } else if (b.scale() < a.scale()) {
        wb.mulPow10(a.scale() - b.scale());
    }
    return scale;
}

Decimal addSigned(const Decimal& a, const Decimal& b, bool negateB) {
    bool nb = b.negative() != negateB;
    Wide wa, wb;
    int scale = align(a, b, wa, wb);
    if (a.negative() == nb) return normalize(add(wa, wb), scale, nb);
    int c = compare(wa, wb);
    if (c == 0) return Decimal();
    return c > 0 ? normalize(sub(wa, wb), scale, a.negative()) : normalize(sub(wb, wa), scale, nb);
}

}  // namespace

Decimal::Decimal(int64_t v) noexcept
    : lo_(v < 0 ? 0 - static_cast<uint64_t>(v) : static_cast<uint64_t>(v)), neg_(v < 0) {}

Decimal Decimal::fromParts(uint64_t lo, uint32_t hi, int scale, bool negative) {
    if (scale < 0 || scale > kMaxScale) raise(errc::Overflow, {});
    Decimal d;
    d.lo_ = lo;
    d.hi_ = hi;
    d.scale_ = static_cast<uint8_t>(scale);
    d.neg_ = negative;
    return d;
}

Decimal Decimal::fromDouble(double v) {
    if (!std::isfinite(v)) raise(errc::Overflow, {});
    if (v == 0) return Decimal();
    // 15 significant digits, as the automation conversion keeps them.
    char buf[64];
    auto res = std::to_chars(buf, buf + sizeof buf, v, std::chars_format::scientific, 14);
    auto d = parse(std::string_view(buf, static_cast<size_t>(res.ptr - buf)));
    if (!d) raise(errc::Overflow, {});
    // Drop the trailing zeros the fixed digit count brought in: CDec(1.5) is 1.5.
    u128 m = mantissa(*d);
    int scale = d->scale();
    while (scale > 0 && m % 10 == 0) {
        m /= 10;
        --scale;
    }
    return make(m, scale, d->negative());
}

std::optional<Decimal> Decimal::parse(std::string_view text) noexcept {
    size_t i = 0, n = text.size();
    bool negative = false;
    if (i < n && (text[i] == '+' || text[i] == '-')) negative = text[i++] == '-';
    // Up to 40 significant digits are kept; 96 bits hold at most 29, so the
    // digit that decides the rounding is always among the kept ones.
    constexpr int kKeep = 40;
    Wide w;
    int kept = 0, digits = 0;
    int64_t scale = 0;  // of the kept digits
    bool point = false;
    for (; i < n; ++i) {
        char c = text[i];
        if (c == '.' && !point) {
            point = true;
            continue;
        }
        if (c < '0' || c > '9') break;
        ++digits;
        if (kept == 0 && c == '0') {
            if (point) ++scale;
            continue;
        }
        if (kept < kKeep) {
            w.mulAdd(10, static_cast<uint32_t>(c - '0'));
            ++kept;
            if (point) ++scale;
        } else if (!point) {
            --scale;  // an integral digit beyond the kept ones
        }
    }
    if (digits == 0) return std::nullopt;
    if (i < n && (text[i] == 'e' || text[i] == 'E')) {
        ++i;
        bool expNeg = false;
        if (i < n && (text[i] == '+' || text[i] == '-')) expNeg = text[i++] == '-';
        if (i >= n) return std::nullopt;
        int64_t exp = 0;
        for (; i < n; ++i) {
            if (text[i] < '0' || text[i] > '9') return std::nullopt;
            if (exp < 100000) exp = exp * 10 + (text[i] - '0');
        }
        scale += expNeg ? exp : -exp;
    }
    if (i != n) return std::nullopt;
    if (w.isZero()) return Decimal();
    if (scale > kMaxScale + kKeep + 1) return Decimal();  // rounds to zero
    if (scale < -kMaxScale - 1) return std::nullopt;      // certainly too big
    try {
        return normalize(w, static_cast<int>(scale), negative);
    } catch (const Error&) {
        return std::nullopt;
    }
}

double Decimal::toDouble() const noexcept {
    std::string s = toString();
    double v = 0;
    std::from_chars(s.data(), s.data() + s.size(), v);
    return v;
}

int64_t Decimal::toInt64() const {
    u128 p = pow10(scale_);
    u128 m = mantissa(*this);
    u128 q = m / p, r = m % p;
    if (2 * r > p || (2 * r == p && (q & 1))) ++q;  // half to even, as CLng
    constexpr u128 kMaxPos = static_cast<u128>(std::numeric_limits<int64_t>::max());
    if (q > kMaxPos + (neg_ ? 1 : 0)) raise(errc::Overflow, {});
    uint64_t u = static_cast<uint64_t>(q);
    return neg_ ? static_cast<int64_t>(0 - u) : static_cast<int64_t>(u);
}

std::string Decimal::toString() const {
    u128 m = mantissa(*this);
    int scale = scale_;
    while (scale > 0 && m % 10 == 0) {
        m /= 10;
        --scale;
    }
    char buf[64];
    char* p = buf + sizeof buf;
    int written = 0;
    do {
        *--p = static_cast<char>('0' + static_cast<int>(m % 10));
        m /= 10;
        if (++written == scale) *--p = '.';
    } while (m != 0 || written < scale);
    if (written == scale) *--p = '0';  // "0.001"
    if (neg_ && !isZero()) *--p = '-';
    return std::string(p, buf + sizeof buf);
}

Decimal Decimal::round(int places) const {
    if (places < 0 || places > kMaxScale) raise(errc::InvalidProcedureCall, {});
    if (places >= scale_) return *this;
    u128 p = pow10(scale_ - places);
    u128 m = mantissa(*this);
    u128 q = m / p, r = m % p;
    if (2 * r >= p) ++q;  // half away from zero: the sign is applied afterwards
    return make(q, places, neg_);
}

Decimal Decimal::truncate() const {
    return make(mantissa(*this) / pow10(scale_), 0, neg_);
}

Decimal Decimal::abs() const noexcept {
    Decimal d = *this;
    d.neg_ = false;
    return d;
}

Decimal Decimal::operator-() const noexcept {
    Decimal d = *this;
    d.neg_ = !neg_ && !isZero();
    return d;
}

Decimal operator+(const Decimal& a, const Decimal& b) {
    return addSigned(a, b, false);
}

Decimal operator-(const Decimal& a, const Decimal& b) {
    return addSigned(a, b, true);
}

Decimal operator*(const Decimal& a, const Decimal& b) {
    Wide p = mul(Wide(mantissa(a)), Wide(mantissa(b)));
    return normalize(p, a.scale() + b.scale(), a.negative() != b.negative());
}

Decimal operator/(const Decimal& a, const Decimal& b) {
    u128 nb = mantissa(b);
    if (nb == 0) raise(errc::DivisionByZero, {});
    u128 na = mantissa(a);
    if (na == 0) return Decimal();
    // Long division, one decimal digit at a time, until the quotient has more
    // digits than 96 bits can hold or more decimals than the largest scale;
    // normalize then rounds on the first digit it drops. The remainder stays
    // below the divisor, so ten times it fits 128 bits.
    Wide q(na / nb);
    u128 r = na % nb;
    int scale = a.scale() - b.scale();
    Wide limit(pow10(29));
    while (r != 0 && scale <= Decimal::kMaxScale && compare(q, limit) < 0) {
        r *= 10;
        q.mulAdd(10, static_cast<uint32_t>(r / nb));
        r %= nb;
        ++scale;
    }
    return normalize(q, scale, a.negative() != b.negative());
}

std::strong_ordering operator<=>(const Decimal& a, const Decimal& b) noexcept {
    bool za = a.isZero(), zb = b.isZero();
    bool na = a.negative() && !za, nb = b.negative() && !zb;
    if (na != nb) return na ? std::strong_ordering::less : std::strong_ordering::greater;
    Wide wa, wb;
    align(a, b, wa, wb);
    int c = compare(wa, wb);
    if (na) c = -c;
    return c < 0   ? std::strong_ordering::less
           : c > 0 ? std::strong_ordering::greater
                   : std::strong_ordering::equal;
}

}  // namespace pelta
