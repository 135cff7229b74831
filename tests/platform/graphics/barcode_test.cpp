// Barcodes as drawn: the bars of EAN/UPC codes module by module against the
// published encoding tables, check digits, the codes each symbology refuses
// and why, and what the options change.
#include <gtest/gtest.h>

#include <string>

#include "platform/graphics/barcode.h"

namespace gr = pelta::graphics;

namespace {

// The left-hand (odd parity) patterns of the digits; the right-hand ones are
// their complements, the even-parity ones the right-hand ones mirrored.
const char* const kOdd[] = {"0001101", "0011001", "0010011", "0111101", "0100011",
                            "0110001", "0101111", "0111011", "0110111", "0001011"};
// Which of the six left digits of an EAN-13 are even parity, by its first digit.
const char* const kParity[] = {"OOOOOO", "OOEOEE", "OOEEOE", "OOEEEO", "OEOOEE",
                               "OEEOOE", "OEEEOO", "OEOEOE", "OEOEEO", "OEEOEO"};

std::string complement(std::string s) {
    for (char& c : s)
        c = c == '1' ? '0' : '1';
    return s;
}
std::string left(char d, bool even) {
    const std::string odd = kOdd[d - '0'];
    if (!even) return odd;
    const std::string r = complement(odd);
    return std::string(r.rbegin(), r.rend());
}
std::string right(char d) {
    return complement(kOdd[d - '0']);
}

// The modules of a full EAN-13 or UPC-A (12 digits as a leading 0) code.
std::string ean13Modules(const std::string& code) {
    std::string m = "101";
    for (int i = 1; i <= 6; ++i)
        m += left(code[i], kParity[code[0] - '0'][i - 1] == 'E');
    m += "01010";
    for (int i = 7; i <= 12; ++i)
        m += right(code[i]);
    return m + "101";
}
std::string ean8Modules(const std::string& code) {
    std::string m = "101";
    for (int i = 0; i < 4; ++i)
        m += left(code[i], false);
    m += "01010";
    for (int i = 4; i < 8; ++i)
        m += right(code[i]);
    return m + "101";
}

// The modules the drawing shows, from its first bar on, `count` of them.
std::string drawnModules(const gr::Drawing& d, int count) {
    double first = 1e9;
    for (const auto& r : d.rects)
        first = std::min(first, r.x);
    std::string m;
    for (int i = 0; i < count; ++i) {
        const double x = first + i + 0.5;
        bool dark = false;
        for (const auto& r : d.rects)
            dark = dark || (r.x <= x && x < r.x + r.width);
        m += dark ? '1' : '0';
    }
    return m;
}

gr::Barcode draw(const std::string& code, gr::Symbology s, bool text = true, bool guards = true,
                 double height = 50) {
    gr::BarcodeOptions o;
    o.symbology = s;
    o.humanReadable = text;
    o.extendedGuards = guards;
    o.barHeight = height;
    return gr::drawBarcode(code, o);
}

}  // namespace

TEST(Barcode, CheckDigitsFollowTheGs1Rule) {
    EXPECT_EQ(gr::gs1CheckDigit("400638133393"), '1');  // EAN-13 4006381333931
    EXPECT_EQ(gr::gs1CheckDigit("9638507"), '4');       // EAN-8 96385074
    EXPECT_EQ(gr::gs1CheckDigit("03600029145"), '2');   // UPC-A 036000291452
    EXPECT_EQ(gr::gs1CheckDigit("0000000000000"), '0');
    EXPECT_EQ(gr::gs1CheckDigit("12a"), 0);
    EXPECT_EQ(gr::gs1CheckDigit(""), 0);
    // UPC-E stands for a UPC-A code with zeros left out; each last digit
    // says where.
    EXPECT_EQ(gr::expandUpcE("0123450"), "01200000345");
    EXPECT_EQ(gr::expandUpcE("0123453"), "01230000045");
    EXPECT_EQ(gr::expandUpcE("0123454"), "01234000005");
    EXPECT_EQ(gr::expandUpcE("1123457"), "11234500007");
    EXPECT_EQ(gr::expandUpcE("012345"), "");
    EXPECT_EQ(gr::gs1CheckDigit(gr::expandUpcE("0123456")), '5');
}

TEST(Barcode, Ean13BarsAreTheStandardPatternOf95Modules) {
    const auto b = draw("4006381333931", gr::Symbology::Ean13);
    ASSERT_TRUE(b.ok()) << b.detail;
    EXPECT_EQ(b.modules, 95);
    EXPECT_EQ(b.humanReadable, "4006381333931");
    EXPECT_EQ(drawnModules(b.drawing, 95), ean13Modules("4006381333931"));
    // The check digit may be left to the drawing.
    const auto without = draw("400638133393", gr::Symbology::Ean13);
    ASSERT_TRUE(without.ok());
    EXPECT_EQ(without.humanReadable, "4006381333931");
    EXPECT_EQ(drawnModules(without.drawing, 95), ean13Modules("4006381333931"));
    // Quiet zones on both sides, and the digits under the bars.
    EXPECT_GT(b.drawing.width, 95 + 14);
    ASSERT_EQ(b.drawing.texts.size(), 3u);
    EXPECT_EQ(b.drawing.texts[0].text, "4");
    EXPECT_EQ(b.drawing.texts[1].text + b.drawing.texts[2].text, "006381333931");
}

TEST(Barcode, Ean8AndUpcBarsAreTheirStandardPatterns) {
    const auto ean8 = draw("96385074", gr::Symbology::Ean8);
    ASSERT_TRUE(ean8.ok()) << ean8.detail;
    EXPECT_EQ(ean8.modules, 67);
    EXPECT_EQ(drawnModules(ean8.drawing, 67), ean8Modules("96385074"));

    const auto upcA = draw("036000291452", gr::Symbology::UpcA);
    ASSERT_TRUE(upcA.ok()) << upcA.detail;
    EXPECT_EQ(upcA.modules, 95);
    EXPECT_EQ(drawnModules(upcA.drawing, 95), ean13Modules("0036000291452"));

    const auto upcE = draw("01234565", gr::Symbology::UpcE);
    ASSERT_TRUE(upcE.ok()) << upcE.detail;
    EXPECT_EQ(upcE.modules, 51);
    EXPECT_EQ(upcE.humanReadable, "01234565");
}

TEST(Barcode, CodesASymbologyCannotTakeAreRefusedWithTheReason) {
    auto problem = [](const std::string& code, gr::Symbology s) { return draw(code, s).problem; };
    using P = gr::BarcodeProblem;
    const auto wrong = draw("4006381333932", gr::Symbology::Ean13);
    EXPECT_EQ(wrong.problem, P::CheckDigit);
    EXPECT_EQ(wrong.expectedCheckDigit, '1');
    EXPECT_TRUE(wrong.drawing.rects.empty()) << "a wrong check digit is never drawn";
    EXPECT_EQ(problem("96385075", gr::Symbology::Ean8), P::CheckDigit);
    EXPECT_EQ(problem("036000291453", gr::Symbology::UpcA), P::CheckDigit);
    EXPECT_EQ(problem("01234566", gr::Symbology::UpcE), P::CheckDigit);

    EXPECT_EQ(problem("40063813339", gr::Symbology::Ean13), P::Length);
    EXPECT_EQ(problem("96385074", gr::Symbology::Ean13), P::Length);
    EXPECT_EQ(problem("4006381333931", gr::Symbology::Ean8), P::Length);
    EXPECT_EQ(problem("12345", gr::Symbology::UpcE), P::Length);
    EXPECT_EQ(problem("400638133393X", gr::Symbology::Ean13), P::NotDigits);
    EXPECT_EQ(problem(" 96385074", gr::Symbology::Ean8), P::NotDigits);
    EXPECT_EQ(problem("2123456", gr::Symbology::UpcE), P::NumberSystem);

    EXPECT_EQ(problem("Мляко-1", gr::Symbology::Code128), P::Characters);
    EXPECT_EQ(problem("12345", gr::Symbology::Gs1_128), P::Format);
    EXPECT_EQ(problem("(01)123", gr::Symbology::Gs1_128), P::Format);
    EXPECT_EQ(problem("", gr::Symbology::Code128), P::Empty);
    EXPECT_EQ(problem(std::string(300, 'A'), gr::Symbology::Code128), P::TooLong);

    EXPECT_TRUE(draw("(01)03800000000072", gr::Symbology::Gs1_128).ok());
    EXPECT_TRUE(draw("[01]03800000000072[10]A1", gr::Symbology::Gs1_128).ok());
    const auto latin = draw("Café <&> 12", gr::Symbology::Code128);
    ASSERT_TRUE(latin.ok()) << latin.detail;
    ASSERT_EQ(latin.drawing.texts.size(), 1u);
    EXPECT_EQ(latin.drawing.texts[0].text, "Café <&> 12");
}

TEST(Barcode, OptionsChangeHeightDigitsAndGuards) {
    auto tallest = [](const gr::Drawing& d) {
        double h = 0;
        for (const auto& r : d.rects)
            h = std::max(h, r.height);
        return h;
    };
    auto shortest = [](const gr::Drawing& d) {
        double h = 1e9;
        for (const auto& r : d.rects)
            h = std::min(h, r.height);
        return h;
    };
    const auto plain = draw("4006381333931", gr::Symbology::Ean13, false, false, 50);
    ASSERT_TRUE(plain.ok());
    EXPECT_TRUE(plain.drawing.texts.empty());
    EXPECT_DOUBLE_EQ(tallest(plain.drawing), 50);
    EXPECT_DOUBLE_EQ(shortest(plain.drawing), 50) << "no guard reaches below the others";
    EXPECT_DOUBLE_EQ(plain.drawing.height, 50);

    const auto guarded = draw("4006381333931", gr::Symbology::Ean13, false, true, 50);
    EXPECT_DOUBLE_EQ(shortest(guarded.drawing), 50);
    EXPECT_GT(tallest(guarded.drawing), 50);

    const auto doubled = draw("4006381333931", gr::Symbology::Ean13, true, true, 100);
    EXPECT_DOUBLE_EQ(shortest(doubled.drawing), 100);
    EXPECT_GT(doubled.drawing.height, 100) << "the digits stand under the bars";
    for (const auto& t : doubled.drawing.texts)
        EXPECT_GT(t.baseline, tallest(doubled.drawing));
    EXPECT_EQ(drawnModules(doubled.drawing, 95), drawnModules(plain.drawing, 95));
}
