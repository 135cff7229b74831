// Properties checked over many generated values: conversions of arbitrary
// text fail only with the runtime's own errors, and Decimal arithmetic agrees
// with exact integer arithmetic.
#include <gtest/gtest.h>

#include <random>

#include "platform/automation/error.h"
#include "platform/automation/variant.h"

namespace pelta {
namespace {

__extension__ typedef __int128 i128;

std::string randomText(std::mt19937_64& rng) {
    static const std::string kAlphabet = "0123456789+-.,eEdDhHoO&: \tTtrueFals\xD0\xB3\xFF";
    std::uniform_int_distribution<size_t> len(0, 24), pick(0, kAlphabet.size() - 1);
    std::string s(len(rng), ' ');
    for (char& c : s)
        c = kAlphabet[pick(rng)];
    return s;
}

TEST(ConversionProperties, ArbitraryTextFailsOnlyWithRuntimeErrors) {
    std::mt19937_64 rng(20240305);
    int numeric = 0;
    for (int i = 0; i < 20000; ++i) {
        std::string text = randomText(rng);
        if (i % 4 == 0) text = std::to_string(rng() % 100000) + (i % 8 ? "." : ",") + text;
        Variant v(text);
        bool isNum = v.isNumeric();
        bool doubleOk = true;
        auto check = [&](auto&& convert, bool* ok = nullptr) {
            try {
                convert();
            } catch (const Error& e) {
                EXPECT_TRUE(e.number() == errc::TypeMismatch || e.number() == errc::Overflow)
                    << e.number() << " for \"" << text << "\"";
                if (ok) *ok = false;
            }
        };
        check([&] { v.toDouble(); }, &doubleOk);
        check([&] { v.toLong(); });
        check([&] { v.toInt64(); });
        check([&] { v.toDecimal(); });
        check([&] { v.toCurrency(); });
        check([&] { v.toBool(); });
        check([&] { v.toDate(); });
        check([&] { compareValues(v, Variant(1.5)); });
        EXPECT_EQ(isNum, doubleOk) << text;
        numeric += isNum;
        Date d;
        if (parseDate(text, d) && splitDate(d).millisecond == 0) {
            EXPECT_EQ(Variant(Variant(d).toString()).toDate(), d) << text;
        }
    }
    EXPECT_GT(numeric, 100);  // the generator does reach numbers
}

Decimal randomDecimal(std::mt19937_64& rng, int64_t& mantissa, int& scale) {
    std::uniform_int_distribution<int64_t> m(-999999999999, 999999999999);
    std::uniform_int_distribution<int> s(0, 12);
    mantissa = m(rng);
    scale = s(rng);
    uint64_t mag =
        mantissa < 0 ? 0 - static_cast<uint64_t>(mantissa) : static_cast<uint64_t>(mantissa);
    return Decimal::fromParts(mag, 0, scale, mantissa < 0);
}

i128 pow10(int n) {
    i128 r = 1;
    while (n-- > 0)
        r *= 10;
    return r;
}

// The value of d scaled to `scale` decimals, when that is exact.
i128 scaled(const Decimal& d, int scale) {
    EXPECT_LE(d.scale(), scale);
    i128 m = (static_cast<i128>(d.hi()) << 64) | d.lo();
    m *= pow10(scale - d.scale());
    return d.negative() ? -m : m;
}

TEST(ConversionProperties, DecimalArithmeticIsExact) {
    std::mt19937_64 rng(7);
    for (int i = 0; i < 5000; ++i) {
        int64_t ma, mb;
        int sa, sb;
        Decimal a = randomDecimal(rng, ma, sa);
        Decimal b = randomDecimal(rng, mb, sb);
        int s = std::max(sa, sb);
        i128 ia = static_cast<i128>(ma) * pow10(s - sa), ib = static_cast<i128>(mb) * pow10(s - sb);

        EXPECT_TRUE(scaled(a + b, s) == ia + ib) << a.toString() << " + " << b.toString();
        EXPECT_TRUE(scaled(a - b, s) == ia - ib) << a.toString() << " - " << b.toString();
        EXPECT_TRUE(scaled(a * b, sa + sb) == static_cast<i128>(ma) * mb)
            << a.toString() << " * " << b.toString();
        auto c = a <=> b;
        EXPECT_EQ(c < 0, ia < ib);
        EXPECT_EQ(c == 0, ia == ib);
        if (!b.isZero()) {
            EXPECT_EQ(a * b / b, a) << a.toString() << " * / " << b.toString();
        }
        EXPECT_EQ(*Decimal::parse(a.toString()), a);
        EXPECT_EQ(Variant(a).toString(), a.toString());
    }
}

TEST(ConversionProperties, RoundingAgreesWithIntegerRounding) {
    std::mt19937_64 rng(11);
    for (int i = 0; i < 5000; ++i) {
        int64_t m;
        int s;
        Decimal a = randomDecimal(rng, m, s);
        int places = static_cast<int>(rng() % 13);
        Decimal r = a.round(places);
        if (places >= s) {
            EXPECT_EQ(r, a);
            continue;
        }
        i128 p = pow10(s - places);
        i128 mag = m < 0 ? -static_cast<i128>(m) : m;
        i128 q = mag / p + (2 * (mag % p) >= p ? 1 : 0);  // half away from zero
        EXPECT_TRUE(scaled(r, places) == (m < 0 ? -q : q)) << a.toString() << " @" << places;
    }
}

}  // namespace
}  // namespace pelta
