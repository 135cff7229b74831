#include <gtest/gtest.h>

#include "platform/automation/error.h"
#include "platform/automation/variant.h"

namespace pelta {
namespace {

Date parsed(const char* text) {
    Date d{-999999};
    EXPECT_TRUE(parseDate(text, d)) << text;
    return d;
}

TEST(Date, SerialNumbersAroundTheEpoch) {
    EXPECT_EQ(makeDate(1899, 12, 30).oa, 0.0);
    EXPECT_EQ(makeDate(1899, 12, 31).oa, 1.0);
    EXPECT_EQ(makeDate(1900, 3, 1).oa, 61.0);
    EXPECT_EQ(makeDate(2024, 3, 5).oa, 45356.0);
    EXPECT_EQ(makeDate(2024, 3, 5, 18).oa, 45356.75);
    // Before the epoch the fraction still counts forward from midnight.
    EXPECT_EQ(makeDate(1899, 12, 29).oa, -1.0);
    EXPECT_EQ(makeDate(1899, 12, 29, 6).oa, -1.25);
    EXPECT_EQ(makeDate(1899, 12, 28, 18).oa, -2.75);
    EXPECT_EQ(makeDate(100, 1, 1).oa, -657434.0);
    EXPECT_EQ(makeDate(9999, 12, 31).oa, 2958465.0);
}

TEST(Date, SplitsWhatItMakes) {
    struct Case {
        int y, m, d, h, n, s, ms;
    };
    for (Case c : {Case{1899, 12, 29, 6, 0, 0, 0}, Case{1850, 7, 14, 23, 59, 59, 999},
                   Case{1600, 2, 29, 0, 0, 1, 0}, Case{100, 1, 1, 12, 30, 0, 0},
                   Case{2024, 2, 29, 13, 45, 30, 250}, Case{9999, 12, 31, 23, 59, 59, 0}}) {
        DateParts p = splitDate(makeDate(c.y, c.m, c.d, c.h, c.n, c.s, c.ms));
        EXPECT_EQ(p.year, c.y);
        EXPECT_EQ(p.month, c.m);
        EXPECT_EQ(p.day, c.d);
        EXPECT_EQ(p.hour, c.h);
        EXPECT_EQ(p.minute, c.n);
        EXPECT_EQ(p.second, c.s);
        EXPECT_EQ(p.millisecond, c.ms) << c.y;
    }
    EXPECT_EQ(splitDate(makeDate(1899, 12, 30)).weekday, 7);  // a Saturday
    EXPECT_EQ(splitDate(makeDate(2024, 3, 5)).weekday, 3);    // a Tuesday
    EXPECT_EQ(splitDate(makeDate(1899, 12, 24, 12)).weekday, 1);
    // -0.5 and 0.5 are the same moment.
    EXPECT_EQ(splitDate(Date{-0.5}).hour, 12);
    EXPECT_EQ(splitDate(Date{-0.5}).day, 30);
}

TEST(Date, PartsOutOfRangeRollOver) {
    EXPECT_EQ(makeDate(2023, 13, 1), makeDate(2024, 1, 1));
    EXPECT_EQ(makeDate(2024, 3, 0), makeDate(2024, 2, 29));
    EXPECT_EQ(makeDate(2024, 0, 1), makeDate(2023, 12, 1));
    EXPECT_EQ(makeDate(2024, 1, 1, 24), makeDate(2024, 1, 2));
    EXPECT_EQ(makeDate(2024, 1, 1, 0, -1), makeDate(2023, 12, 31, 23, 59));
    EXPECT_THROW(makeDate(10000, 1, 1), Error);
    EXPECT_THROW(makeDate(99, 12, 31), Error);
}

TEST(Date, Formats) {
    Date d = makeDate(2024, 3, 5, 9, 7, 3);
    EXPECT_EQ(formatDate(d, "yyyy.mm.dd hh:nn:ss"), "2024.03.05 09:07:03");
    EXPECT_EQ(formatDate(d, "yyyy_mm_dd"), "2024_03_05");
    EXPECT_EQ(formatDate(d, "d.m.yy h:n:s"), "5.3.24 9:7:3");
    EXPECT_EQ(formatDate(d, "\"at\" hh\\h"), "at 09h");
    EXPECT_EQ(formatDate(makeDate(1850, 7, 14, 6), "dd.mm.yyyy hh:nn"), "14.07.1850 06:00");
    // Shown to the second, rounded.
    EXPECT_EQ(formatDate(makeDate(2024, 12, 31, 23, 59, 59, 600), "yyyy-mm-dd hh:nn:ss"),
              "2025-01-01 00:00:00");
    EXPECT_EQ(formatDate(makeDate(2024, 1, 1, 0, 0, 0, 499), "ss"), "00");
}

TEST(Date, ParsesTheAcceptedForms) {
    EXPECT_EQ(parsed("05.03.2024"), makeDate(2024, 3, 5));
    EXPECT_EQ(parsed("5.3.2024"), makeDate(2024, 3, 5));
    EXPECT_EQ(parsed(" 05.03.2024 14:07 "), makeDate(2024, 3, 5, 14, 7));
    EXPECT_EQ(parsed("05.03.2024 14:07:09"), makeDate(2024, 3, 5, 14, 7, 9));
    EXPECT_EQ(parsed("05.03.2024 \xD0\xB3."), makeDate(2024, 3, 5));  // with the year mark
    EXPECT_EQ(parsed("05.03.24"), makeDate(2024, 3, 5));
    EXPECT_EQ(parsed("05.03.45"), makeDate(1945, 3, 5));
    EXPECT_EQ(parsed("2024-03-05"), makeDate(2024, 3, 5));
    EXPECT_EQ(parsed("2024-03-05T14:07:09"), makeDate(2024, 3, 5, 14, 7, 9));
    EXPECT_EQ(parsed("2024-03-05 14:07:09.250"), makeDate(2024, 3, 5, 14, 7, 9, 250));
    EXPECT_EQ(parsed("1850-07-14T06:00:00"), makeDate(1850, 7, 14, 6));
    EXPECT_EQ(parsed("14:07"), makeDate(1899, 12, 30, 14, 7));
    EXPECT_EQ(parsed("8:30:15"), makeDate(1899, 12, 30, 8, 30, 15));
    EXPECT_EQ(parsed("29.02.2024"), makeDate(2024, 2, 29));

    Date d;
    for (const char* bad : {"31.02.2024",
                            "29.02.2023",
                            "00.01.2024",
                            "01.13.2024",
                            "2024-02-30",
                            "24:00",
                            "12:60",
                            "12:30:60",
                            "05.03.2024 25:00",
                            "05.03.2024x",
                            "05.03.202414:00",
                            "2024/03/05",
                            "12",
                            "12.5",
                            "1,5",
                            "",
                            "   ",
                            "05.03.",
                            "2024-3-5",
                            "05.03.0099",
                            "abc",
                            "05.03.2024 14"})
        EXPECT_FALSE(parseDate(bad, d)) << bad;
}

TEST(Date, TextRoundTrip) {
    for (Date d :
         {makeDate(2024, 3, 5), makeDate(2024, 3, 5, 14, 7, 9), makeDate(1899, 12, 30, 8),
          makeDate(1850, 7, 14, 6, 30), makeDate(100, 1, 1), makeDate(9999, 12, 31, 23, 59, 59)})
        EXPECT_EQ(Variant(Variant(d).toString()).toDate(), d) << Variant(d).toString();
}

TEST(Date, NowIsToday) {
    Date a = now();
    DateParts p = splitDate(a);
    EXPECT_GE(p.year, 2024);
    EXPECT_NE(a.oa, 0.0);
}

}  // namespace
}  // namespace pelta
