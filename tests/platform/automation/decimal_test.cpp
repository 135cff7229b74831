#include "platform/automation/decimal.h"

#include <gtest/gtest.h>

#include "platform/automation/error.h"

namespace pelta {
namespace {

Decimal dec(const char* text) {
    auto d = Decimal::parse(text);
    EXPECT_TRUE(d.has_value()) << text;
    return d.value_or(Decimal());
}

int errorOf(auto&& f) {
    try {
        f();
    } catch (const Error& e) {
        return e.number();
    }
    return 0;
}

TEST(Decimal, ParseAndWriteText) {
    EXPECT_EQ(dec("1.50").toString(), "1.5");
    EXPECT_EQ(dec("1.50").scale(), 2);
    EXPECT_EQ(dec("-0.001").toString(), "-0.001");
    EXPECT_EQ(dec("12").toString(), "12");
    EXPECT_EQ(dec("+12.000").toString(), "12");
    EXPECT_EQ(dec("-0.00").toString(), "0");
    EXPECT_EQ(dec(".5").toString(), "0.5");
    EXPECT_EQ(dec("1.5e3").toString(), "1500");
    EXPECT_EQ(dec("15E-4").toString(), "0.0015");
    EXPECT_EQ(dec("79228162514264337593543950335").toString(), "79228162514264337593543950335");
    EXPECT_EQ(dec("-7.9228162514264337593543950335").toString(), "-7.9228162514264337593543950335");
    // More digits than fit are rounded away; tiny values become zero.
    EXPECT_EQ(dec("0.12345678901234567890123456789").toString(), "0.1234567890123456789012345679");
    EXPECT_EQ(dec("1e-40").toString(), "0");

    for (const char* bad : {"", "-", ".", "1..2", "1e", "1e+", "abc", "1 ", " 1", "1,000", "0x10"})
        EXPECT_FALSE(Decimal::parse(bad).has_value()) << bad;
    EXPECT_FALSE(Decimal::parse("79228162514264337593543950336").has_value());
    EXPECT_FALSE(Decimal::parse("1e29").has_value());
}

TEST(Decimal, RoundsHalfAwayFromZeroExactly) {
    // Values a double cannot hold exactly still round the decimal way.
    EXPECT_EQ(dec("1.005").round(2).toString(), "1.01");
    EXPECT_EQ(dec("2.675").round(2).toString(), "2.68");
    EXPECT_EQ(dec("-2.5").round(0).toString(), "-3");
    EXPECT_EQ(dec("2.5").round(0).toString(), "3");
    EXPECT_EQ(dec("-1.005").round(2).toString(), "-1.01");
    EXPECT_EQ(dec("1.0049999").round(2).toString(), "1");
    EXPECT_EQ(dec("0.4").round(0).toString(), "0");
    EXPECT_EQ(dec("9.995").round(2).toString(), "10");
    EXPECT_EQ(dec("1.5").round(3).toString(), "1.5");  // fewer places than asked: unchanged
    EXPECT_EQ(dec("-2.7").truncate().toString(), "-2");
    EXPECT_EQ(dec("2.7").truncate().toString(), "2");
    EXPECT_EQ(errorOf([] { dec("1").round(29); }), errc::InvalidProcedureCall);
}

TEST(Decimal, AddsAndSubtractsAcrossScales) {
    EXPECT_EQ(dec("0.1") + dec("0.2"), dec("0.3"));
    EXPECT_EQ((dec("0.1") + dec("0.2")).toString(), "0.3");
    EXPECT_EQ((dec("1") - dec("0.001")).toString(), "0.999");
    EXPECT_EQ((dec("0.001") - dec("1")).toString(), "-0.999");
    EXPECT_EQ((dec("-5.5") + dec("5.5")).toString(), "0");
    EXPECT_EQ((dec("-1.25") - dec("1.75")).toString(), "-3");
    // A sum wider than 96 bits gives up decimals instead of failing.
    EXPECT_EQ((dec("79228162514264337593543950335") - dec("0.5")).toString(),
              "79228162514264337593543950335");
    EXPECT_EQ((dec("7922816251426433759354395033.5") + dec("0.04")).toString(),
              "7922816251426433759354395033.5");
    EXPECT_EQ(errorOf([] { return dec("79228162514264337593543950335") + Decimal(1); }),
              errc::Overflow);
}

TEST(Decimal, MultipliesWithRounding) {
    EXPECT_EQ((dec("1.5") * dec("-2")).toString(), "-3");
    EXPECT_EQ((dec("0.0001") * dec("0.0001")).toString(), "0.00000001");
    // The exact product 121932631140070110862978.2057750190521 has 37 digits;
    // it keeps the 29 that fit in 96 bits, rounded on the first one dropped.
    EXPECT_EQ((dec("123456789012345.6789") * dec("987654321.123456789")).toString(),
              "121932631140070110862978.20578");
    // Decimals beyond scale 28 are rounded off.
    EXPECT_EQ((dec("0.00000000000001") * dec("0.000000000000015")).toString(),
              "0.0000000000000000000000000002");
    EXPECT_EQ(errorOf([] { return dec("1e20") * dec("1e9"); }), errc::Overflow);
}

TEST(Decimal, DividesTo28Digits) {
    EXPECT_EQ((Decimal(1) / Decimal(3)).toString(), "0.3333333333333333333333333333");
    EXPECT_EQ((Decimal(2) / Decimal(3)).toString(), "0.6666666666666666666666666667");
    EXPECT_EQ((Decimal(10) / Decimal(3)).toString(), "3.3333333333333333333333333333");
    EXPECT_EQ((Decimal(-1) / Decimal(8)).toString(), "-0.125");
    EXPECT_EQ((dec("1.5") / dec("0.05")).toString(), "30");
    EXPECT_EQ((Decimal(1) / dec("0.0000000000000000000000000001")).toString(),
              "10000000000000000000000000000");
    EXPECT_EQ(errorOf([] { return Decimal(10) / dec("0.0000000000000000000000000001"); }),
              errc::Overflow);
    EXPECT_EQ(errorOf([] { return Decimal(1) / Decimal(); }), errc::DivisionByZero);
    EXPECT_EQ(errorOf([] { return Decimal() / dec("0.000"); }), errc::DivisionByZero);
}

TEST(Decimal, ComparesNumerically) {
    EXPECT_EQ(dec("1.50"), dec("1.5"));
    EXPECT_EQ(dec("-0"), dec("0.000"));
    EXPECT_LT(dec("-2"), dec("-1.999"));
    EXPECT_LT(dec("0.0000000000000000000000000001"), dec("0.000000000000000000000000001"));
    EXPECT_GT(dec("79228162514264337593543950335"), dec("7922816251426433759354395033.5"));
    EXPECT_LT(dec("-79228162514264337593543950335"), dec("0.1"));
}

TEST(Decimal, ConvertsToAndFromBinaryNumbers) {
    EXPECT_EQ(Decimal::fromDouble(0.1).toString(), "0.1");
    EXPECT_EQ(Decimal::fromDouble(1.005).toString(), "1.005");
    EXPECT_EQ(Decimal::fromDouble(1.0 / 3).toString(), "0.333333333333333");
    EXPECT_EQ(Decimal::fromDouble(-1234567.5).toString(), "-1234567.5");
    EXPECT_EQ(Decimal::fromDouble(1e25).toString(), "10000000000000000000000000");
    EXPECT_EQ(Decimal::fromDouble(1e-30).toString(), "0");
    EXPECT_EQ(errorOf([] { Decimal::fromDouble(1e30); }), errc::Overflow);
    EXPECT_EQ(dec("0.1").toDouble(), 0.1);
    EXPECT_EQ(dec("-1234.5").toDouble(), -1234.5);

    EXPECT_EQ(Decimal(INT64_MIN).toString(), "-9223372036854775808");
    EXPECT_EQ(Decimal(INT64_MIN).toInt64(), INT64_MIN);
    EXPECT_EQ(dec("2.5").toInt64(), 2);  // half to even, as CLng
    EXPECT_EQ(dec("3.5").toInt64(), 4);
    EXPECT_EQ(dec("-2.5").toInt64(), -2);
    EXPECT_EQ(dec("2.5000001").toInt64(), 3);
    EXPECT_EQ(errorOf([] { dec("9223372036854775808").toInt64(); }), errc::Overflow);
    EXPECT_EQ(errorOf([] { Decimal::fromParts(1, 0, 29, false); }), errc::Overflow);
}

}  // namespace
}  // namespace pelta
