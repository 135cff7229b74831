// The identification number checks: personal and company numbers with their
// check digits, and the number as typed (the leading-space opt-out, nines,
// trimming).
#include <gtest/gtest.h>

#include <string>

#include "library/frame/mdFilter.h"
#include "library/partners/mdCgChecks.h"

using namespace PeltaNom15;

namespace {

constexpr const char* kLength = "Невалидна дължина";
constexpr const char* kDigits = "Съдържанието не е само цифри";
constexpr const char* kCheck = "Невалидна контролна цифра";

// The nine first digits of a personal number whose weighted sum leaves the
// remainder `remainder` modulo 11 (searched from a start).
std::string PersonalWithRemainder(int remainder) {
    static const int w[] = {2, 4, 8, 5, 10, 9, 7, 3, 6};
    for (int serial = 0; serial < 1000; ++serial) {
        std::string nine = "850612" +
                           std::string(serial < 10    ? "00"
                                       : serial < 100 ? "0"
                                                      : "") +
                           std::to_string(serial);
        int sum = 0;
        for (int i = 0; i < 9; ++i)
            sum += (nine[i] - '0') * w[i];
        if (sum % 11 == remainder) return nine;
    }
    return {};
}

// Eight digits whose first sum leaves 10 and whose second leaves `second`.
std::string CompanyWithRemainders(int second) {
    for (int n = 0; n < 100000000; n += 7) {
        char buf[9];
        std::snprintf(buf, sizeof buf, "%08d", n % 100000000);
        std::string eight(buf, 8);
        int a = 0, b = 0;
        for (int i = 0; i < 8; ++i) {
            a += (eight[i] - '0') * (i + 1);
            b += (eight[i] - '0') * (i + 3);
        }
        if (a % 11 == 10 && b % 11 == second) return eight;
    }
    return {};
}

}  // namespace

TEST(CgChecks, PersonalNumberCheckDigit) {
    EXPECT_EQ(CheckPersonalNumber("7501010010"), "");  // weighted sum 54: remainder 10, so 0
    const std::string nine = PersonalWithRemainder(3);
    ASSERT_FALSE(nine.empty());
    EXPECT_EQ(CheckPersonalNumber(nine + "3"), "");
    EXPECT_EQ(CheckPersonalNumber(nine + "4"), kCheck);
    // A remainder of 10 asks for 0.
    const std::string ten = PersonalWithRemainder(10);
    ASSERT_FALSE(ten.empty());
    EXPECT_EQ(CheckPersonalNumber(ten + "0"), "");
    EXPECT_EQ(CheckPersonalNumber(ten + "1"), kCheck);
    EXPECT_EQ(CheckPersonalNumber("75010100a0"), kDigits);
    EXPECT_EQ(CheckPersonalNumber("750101001"), kLength);
}

TEST(CgChecks, CompanyNumberCheckDigits) {
    // 8 digits with a first sum below 10 modulo 11: that remainder.
    EXPECT_EQ(CheckCompanyNumber("000000018"), "");
    EXPECT_EQ(CheckCompanyNumber("000000017"), kCheck);
    // A first sum of 10 falls back to the second; 10 again asks for 0.
    const std::string second = CompanyWithRemainders(4);
    ASSERT_FALSE(second.empty());
    EXPECT_EQ(CheckCompanyNumber(second + "4"), "");
    EXPECT_EQ(CheckCompanyNumber(second + "0"), kCheck);
    const std::string both = CompanyWithRemainders(10);
    ASSERT_FALSE(both.empty());
    EXPECT_EQ(CheckCompanyNumber(both + "0"), "");
    EXPECT_EQ(CheckCompanyNumber(both + "1"), kCheck);
    // Thirteen digits: the last four checked again with their weights.
    // Digits 9 to 12 are 8, 0, 0, 0: 8 * 2 = 16, remainder 5.
    EXPECT_EQ(CheckCompanyNumber("0000000180005"), "");
    EXPECT_EQ(CheckCompanyNumber("0000000180006"), kCheck)
        << "nine valid digits, a wrong thirteenth";
    EXPECT_EQ(CheckCompanyNumber("0000000170005"), kCheck);
    EXPECT_EQ(CheckCompanyNumber("12345678"), kLength);
    EXPECT_EQ(CheckCompanyNumber("12345678901"), kLength);
    EXPECT_EQ(CheckCompanyNumber("12345678X"), kDigits);
}

TEST(CgChecks, TheNumberAsTyped) {
    EXPECT_EQ(CheckIdentNumber(""), "");
    EXPECT_EQ(CheckIdentNumber("   "), "");
    EXPECT_EQ(CheckIdentNumber(" 123"), "") << "a leading space turns the check off";
    EXPECT_EQ(CheckIdentNumber("999999999"), "") << "nines only";
    EXPECT_EQ(CheckIdentNumber("9999999999999"), "");
    EXPECT_EQ(CheckIdentNumber("123 "), kLength) << "trailing spaces do not";
    EXPECT_EQ(CheckIdentNumber("000000018  "), "") << "the trimmed number is checked";
    EXPECT_EQ(CheckIdentNumber("\t000000018"), "") << "a tab is no opt-out, only trimmed";
    EXPECT_EQ(CheckIdentNumber("7501010010"), "") << "ten characters: a personal number";
    EXPECT_EQ(CheckIdentNumber("750101001a"), kDigits);
    EXPECT_EQ(CheckIdentNumber("75010100100"), kLength) << "eleven digits";
    EXPECT_EQ(CheckIdentNumber("000000017"), kCheck);
}

TEST(FilterText, TypedTextIsQuotedAndItsWildcardsLiteral) {
    EXPECT_EQ(FilterLiteral("Д'Артанян"), "'Д''Артанян'");
    EXPECT_EQ(LikeEscape("50% *off* [x]'"), "50[%] [*]off[*] [[]x]''");
    EXPECT_EQ(FilterLike("Name", "a*"), "[Name] LIKE '*a[*]*'");
    EXPECT_EQ(FilterLike("Code", "a", false), "[Code] LIKE 'a*'");
    EXPECT_EQ(FilterEquals("Code", "'"), "[Code] = ''''");
    EXPECT_EQ(CharCount("яx"), 2u);
}
