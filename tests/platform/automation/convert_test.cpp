#include <gtest/gtest.h>

#include "platform/automation/error.h"
#include "platform/automation/variant.h"

namespace pelta {
namespace {

int errorOf(auto&& f) {
    try {
        f();
    } catch (const Error& e) {
        return e.number();
    }
    return 0;
}

Variant dec(const char* text) {
    return Variant(*Decimal::parse(text));
}

TEST(Convert, TextToNumberAcceptsWhatTheLanguageAccepts) {
    EXPECT_EQ(Variant(" 12 ").toLong(), 12);
    EXPECT_EQ(Variant("-12").toLong(), -12);
    EXPECT_EQ(Variant("+7").toInteger(), 7);
    EXPECT_EQ(Variant("1,234.5").toDouble(), 1234.5);
    EXPECT_EQ(Variant("1,234,567").toLong(), 1234567);
    EXPECT_EQ(Variant("&HFF").toLong(), 255);
    EXPECT_EQ(Variant("&hff").toLong(), 255);
    EXPECT_EQ(Variant("&HFFFFFFFF").toLong(), -1);  // 32 bits, two's complement
    EXPECT_EQ(Variant("&O17").toLong(), 15);
    EXPECT_EQ(Variant("1.5E3").toLong(), 1500);
    EXPECT_EQ(Variant("2.5e-1").toDouble(), 0.25);
    EXPECT_EQ(Variant(".5").toDouble(), 0.5);
    EXPECT_EQ(Variant("1e-400").toDouble(), 0.0);

    for (const char* bad : {"abc", "", "  ", "12abc", "1.2.3", ",12", "&H", "&HG1", "&O8", "1e",
                            "True", "- 1", "1 2"}) {
        EXPECT_EQ(errorOf([&] { Variant(bad).toLong(); }), errc::TypeMismatch) << bad;
        EXPECT_EQ(errorOf([&] { Variant(bad).toDouble(); }), errc::TypeMismatch) << bad;
        EXPECT_FALSE(Variant(bad).isNumeric()) << bad;
    }
    EXPECT_EQ(errorOf([] { Variant("1e400").toDouble(); }), errc::Overflow);
    EXPECT_EQ(errorOf([] { Variant("&H100000000").toLong(); }), errc::Overflow);
    EXPECT_TRUE(Variant(" -1,000.5e2 ").isNumeric());
    EXPECT_TRUE(Variant("&H10").isNumeric());
    EXPECT_TRUE(Variant().isNumeric());
    EXPECT_TRUE(Variant(true).isNumeric());
    EXPECT_FALSE(Variant::null().isNumeric());
    EXPECT_FALSE(Variant(makeDate(2024, 1, 1)).isNumeric());
}

TEST(Convert, IntegersRoundHalfToEvenAndCheckTheirRange) {
    EXPECT_EQ(Variant(2.5).toLong(), 2);
    EXPECT_EQ(Variant(3.5).toLong(), 4);
    EXPECT_EQ(Variant(-2.5).toLong(), -2);
    EXPECT_EQ(Variant(-3.5).toLong(), -4);
    EXPECT_EQ(Variant(2.5000001).toLong(), 3);
    EXPECT_EQ(Variant("2.5").toLong(), 2);
    EXPECT_EQ(Variant(Currency{25000}).toLong(), 2);
    EXPECT_EQ(Variant(Currency{-35000}).toLong(), -4);
    EXPECT_EQ(dec("4.5").toLong(), 4);
    EXPECT_EQ(Variant(0.5).toInteger(), 0);
    EXPECT_EQ(Variant(1.5).toByte(), 2);

    EXPECT_EQ(Variant(true).toLong(), -1);
    EXPECT_EQ(Variant(false).toLong(), 0);
    EXPECT_EQ(Variant().toLong(), 0);
    EXPECT_EQ(errorOf([] { Variant::null().toLong(); }), kInvalidUseOfNull);

    EXPECT_EQ(Variant(2147483647.4).toLong(), 2147483647);
    EXPECT_EQ(errorOf([] { Variant(2147483647.5).toLong(); }), errc::Overflow);
    EXPECT_EQ(Variant(-2147483648.0).toLong(), INT32_MIN);
    EXPECT_EQ(errorOf([] { Variant(32768).toInteger(); }), errc::Overflow);
    EXPECT_EQ(errorOf([] { Variant(-1).toByte(); }), errc::Overflow);
    EXPECT_EQ(errorOf([] { Variant(true).toByte(); }), errc::Overflow);  // True is -1
    EXPECT_EQ(errorOf([] { Variant(1e19).toInt64(); }), errc::Overflow);
    EXPECT_EQ(Variant::fromInt64(INT64_MAX).toInt64(), INT64_MAX);
    EXPECT_EQ(Variant("9223372036854775807").toInt64(), INT64_MAX);
    EXPECT_EQ(errorOf([] { Variant("9223372036854775808").toInt64(); }), errc::Overflow);
    EXPECT_EQ(errorOf([] { Variant(std::vector<Variant>{}).toLong(); }), errc::TypeMismatch);
    EXPECT_EQ(errorOf([] { Variant::missing().toLong(); }), errc::TypeMismatch);
}

TEST(Convert, NumbersAreWrittenAsTheLanguageWritesThem) {
    EXPECT_EQ(Variant(0.1).toString(), "0.1");
    EXPECT_EQ(Variant(0.5).toString(), "0.5");
    EXPECT_EQ(Variant(-0.5).toString(), "-0.5");
    EXPECT_EQ(Variant(-0.0).toString(), "0");
    EXPECT_EQ(Variant(1e20).toString(), "1E+20");
    EXPECT_EQ(Variant(1e-5).toString(), "1E-05");
    EXPECT_EQ(Variant(0.0001).toString(), "0.0001");
    EXPECT_EQ(Variant(123456789012345.0).toString(), "123456789012345");
    EXPECT_EQ(Variant(1234567890123456.0).toString(), "1.23456789012346E+15");
    EXPECT_EQ(Variant(0.1 + 0.2).toString(), "0.3");  // 15 digits hide the binary error
    EXPECT_EQ(Variant(1.0 / 3).toString(), "0.333333333333333");
    EXPECT_EQ(Variant(-1.5e-300).toString(), "-1.5E-300");

    EXPECT_EQ(Variant(Currency{15000}).toString(), "1.5");
    EXPECT_EQ(Variant(Currency{-5}).toString(), "-0.0005");
    EXPECT_EQ(Variant(Currency{INT64_MIN}).toString(), "-922337203685477.5808");
    EXPECT_EQ(dec("1.50").toString(), "1.5");
    EXPECT_EQ(Variant::integer(-32768).toString(), "-32768");
    EXPECT_EQ(Variant::byte(255).toString(), "255");
    EXPECT_EQ(Variant().toString(), "");
    EXPECT_EQ(errorOf([] { Variant::null().toString(); }), kInvalidUseOfNull);
    EXPECT_EQ(Variant::error(5).toString(), "Error 5");
}

TEST(Convert, CurrencyAndDecimal) {
    EXPECT_EQ(Variant(1.5).toCurrency().scaled, 15000);
    EXPECT_EQ(Variant(0.1).toCurrency().scaled, 1000);
    EXPECT_EQ(Variant("1.23456").toCurrency().scaled, 12346);
    EXPECT_EQ(Variant("1.00005").toCurrency().scaled, 10000);  // half to even
    EXPECT_EQ(Variant("1.00015").toCurrency().scaled, 10002);
    EXPECT_EQ(Variant(true).toCurrency().scaled, -10000);
    EXPECT_EQ(errorOf([] { Variant(1e16).toCurrency(); }), errc::Overflow);
    EXPECT_EQ(errorOf([] { Variant("922337203685478").toCurrency(); }), errc::Overflow);

    EXPECT_EQ(Variant(0.1).toDecimal().toString(), "0.1");
    EXPECT_EQ(Variant(Currency{-12345}).toDecimal().toString(), "-1.2345");
    EXPECT_EQ(Variant("1,000.25").toDecimal().toString(), "1000.25");
    EXPECT_EQ(Variant("&H10").toDecimal().toString(), "16");
    EXPECT_EQ(Variant(true).toDecimal().toString(), "-1");
    EXPECT_EQ(dec("0.5").toDouble(), 0.5);
    EXPECT_EQ(errorOf([] { Variant("1e30").toDecimal(); }), errc::Overflow);
    EXPECT_EQ(errorOf([] { Variant("x").toDecimal(); }), errc::TypeMismatch);
}

TEST(Convert, Booleans) {
    EXPECT_TRUE(Variant("True").toBool());
    EXPECT_TRUE(Variant(" tRUE ").toBool());
    EXPECT_FALSE(Variant("FALSE").toBool());
    EXPECT_TRUE(Variant("-1").toBool());
    EXPECT_TRUE(Variant("0.5").toBool());
    EXPECT_FALSE(Variant("0").toBool());
    EXPECT_FALSE(Variant().toBool());
    EXPECT_TRUE(Variant(0.001).toBool());
    EXPECT_TRUE(dec("0.0001").toBool());
    EXPECT_FALSE(Variant(Currency{0}).toBool());
    EXPECT_EQ(errorOf([] { Variant("yes").toBool(); }), errc::TypeMismatch);
    EXPECT_EQ(errorOf([] { Variant::null().toBool(); }), kInvalidUseOfNull);
    EXPECT_EQ(Variant(true).toString(), "True");
    EXPECT_EQ(Variant(false).toString(), "False");
    EXPECT_EQ(Variant(true).toDouble(), -1.0);
}

TEST(Convert, DatesAsTextAndNumbers) {
    EXPECT_EQ(Variant(makeDate(2024, 3, 5)).toString(), "05.03.2024");
    EXPECT_EQ(Variant(makeDate(2024, 3, 5, 14, 7, 9)).toString(), "05.03.2024 14:07:09");
    EXPECT_EQ(Variant(makeDate(1899, 12, 30, 8, 30)).toString(), "08:30:00");
    EXPECT_EQ(Variant(Date{0}).toString(), "00:00:00");
    EXPECT_EQ(Variant(Date{-1.25}).toString(), "29.12.1899 06:00:00");

    EXPECT_EQ(Variant("05.03.2024 14:07:09").toDate(), makeDate(2024, 3, 5, 14, 7, 9));
    EXPECT_EQ(Variant(45000).toDate().oa, 45000.0);
    EXPECT_EQ(Variant(makeDate(2024, 3, 5)).toDouble(), 45356.0);
    EXPECT_EQ(Variant().toDate().oa, 0.0);
    EXPECT_EQ(errorOf([] { Variant("31.02.2024").toDate(); }), errc::TypeMismatch);
    EXPECT_EQ(errorOf([] { Variant("45000").toDate(); }), errc::TypeMismatch);
    EXPECT_EQ(errorOf([] { Variant(1e7).toDate(); }), errc::Overflow);
    EXPECT_EQ(errorOf([] { Variant::null().toDate(); }), kInvalidUseOfNull);
}

TEST(Convert, Objects) {
    EXPECT_FALSE(Variant().toObject());
    EXPECT_FALSE(Variant::nothing().toObject());
    EXPECT_EQ(errorOf([] { Variant(1).toObject(); }), errc::TypeMismatch);
    EXPECT_EQ(errorOf([] { Variant::nothing().toLong(); }), errc::TypeMismatch);
    EXPECT_EQ(errorOf([] { Variant::nothing().toString(); }), errc::TypeMismatch);
}

TEST(Compare, NumbersOfDifferentKindsCompareByValue) {
    EXPECT_EQ(compareValues(Variant(1), Variant(1.0)), 0);
    EXPECT_EQ(compareValues(Variant(true), Variant(-1)), 0);
    EXPECT_LT(compareValues(Variant(true), Variant(false)), 0);  // True is -1
    EXPECT_EQ(compareValues(Variant(), Variant(0.0)), 0);
    EXPECT_EQ(compareValues(dec("1.50"), Variant(Currency{15000})), 0);
    EXPECT_EQ(compareValues(dec("0.3"), Variant(0.1 + 0.2)), 0);  // the double is read to 15 digits
    EXPECT_LT(compareValues(dec("0.1"), Variant(0.11)), 0);
    EXPECT_GT(compareValues(Variant(1e30), dec("79228162514264337593543950335")), 0);
    EXPECT_GT(compareValues(Variant::fromInt64(INT64_MAX), Variant::fromInt64(INT64_MAX - 1)), 0);
    EXPECT_LT(compareValues(Variant(makeDate(2024, 1, 1)), Variant(makeDate(2024, 1, 2))), 0);
    EXPECT_EQ(compareValues(Variant(makeDate(2024, 3, 5)), Variant(45356)), 0);
}

TEST(Compare, TextAgainstTextAndNumbers) {
    EXPECT_LT(compareValues(Variant("abc"), Variant("abd")), 0);
    EXPECT_LT(compareValues(Variant("ABC"), Variant("abc")), 0);
    EXPECT_EQ(compareValues(Variant("ABC"), Variant("abc"), true), 0);
    EXPECT_EQ(compareValues(Variant("Ябълка"), Variant("яБЪЛКА"), true), 0);
    EXPECT_NE(compareValues(Variant("Ябълка"), Variant("яБЪЛКА")), 0);
    EXPECT_LT(compareValues(Variant("ab"), Variant("abc"), true), 0);
    EXPECT_LT(compareValues(Variant("Z"), Variant("а")), 0);  // code point order
    EXPECT_EQ(compareValues(Variant(), Variant("")), 0);
    EXPECT_LT(compareValues(Variant(), Variant("a")), 0);

    // Numeric text against a number compares numerically: "10" > 9 but "10" < "9".
    EXPECT_GT(compareValues(Variant("10"), Variant(9)), 0);
    EXPECT_LT(compareValues(Variant("10"), Variant("9")), 0);
    EXPECT_EQ(compareValues(Variant(1234.5), Variant("1,234.5")), 0);
    EXPECT_EQ(compareValues(dec("0.3"), Variant(" 0.30 ")), 0);
    // Other text sorts after every number.
    EXPECT_LT(compareValues(Variant(5), Variant("abc")), 0);
    EXPECT_GT(compareValues(Variant("abc"), Variant(5)), 0);
    // A date against date text compares as dates.
    EXPECT_EQ(compareValues(Variant(makeDate(2024, 3, 5)), Variant("05.03.2024")), 0);
    EXPECT_LT(compareValues(Variant("2024-03-04"), Variant(makeDate(2024, 3, 5))), 0);
}

TEST(Compare, ValuesThatCannotBeCompared) {
    EXPECT_EQ(errorOf([] { compareValues(Variant::null(), Variant(1)); }), kInvalidUseOfNull);
    EXPECT_EQ(errorOf([] { compareValues(Variant(1), Variant::nothing()); }), errc::TypeMismatch);
    EXPECT_EQ(errorOf([] { compareValues(Variant(Bytes{1}), Variant(Bytes{1})); }),
              errc::TypeMismatch);
    EXPECT_EQ(errorOf([] { compareValues(Variant::error(5), Variant(5)); }), errc::TypeMismatch);
}

}  // namespace
}  // namespace pelta
