// The item's barcode image: the types by their numbers, what (Auto) takes a
// code for, the check-digit routine with its correction, the person's
// messages for codes a type cannot take, and what the options change.
#include <gtest/gtest.h>

#include <string>

#include "library/items/mdBarcodeImage.h"
#include "tests/platform/graphics/wmf_reader.h"

using namespace PeltaNom15;

namespace {

BarcodeImage draw(const std::string& code, int32_t type, int32_t height = 100, bool digits = true,
                  bool separators = true, bool metafile = false) {
    BarcodeImageOptions o;
    o.Type = type;
    o.HeightPercent = height;
    o.Digits = digits;
    o.Separators = separators;
    return DrawBarcodeImage(code, o, metafile);
}

// The height the SVG asks for, in pixels.
double svgHeight(const std::string& svg) {
    const auto at = svg.find("height=\"");
    return at == std::string::npos ? 0 : std::stod(svg.substr(at + 8));
}

}  // namespace

TEST(BarcodeImage, TypeNamesFollowTheirNumbers) {
    EXPECT_EQ(BarCodeTypeName(bctAuto), "(Auto)");
    EXPECT_EQ(BarCodeTypeName(bctEan13), "EAN-13");
    EXPECT_EQ(BarCodeTypeName(bctEan8), "EAN-8");
    EXPECT_EQ(BarCodeTypeName(bctEan128), "EAN-128");
    EXPECT_EQ(BarCodeTypeName(bctUpcA), "UPC-A");
    EXPECT_EQ(BarCodeTypeName(bctUpcE), "UPC-E");
    EXPECT_EQ(BarCodeTypeName(bctWeight), "Тегловен");
    EXPECT_EQ(BarCodeTypeName(6), "");
}

TEST(BarcodeImage, CheckDigitsAreVerifiedAndCorrectedPerType) {
    std::string fixed;
    EXPECT_TRUE(BarCodeCheckDigit(bctEan13, "4006381333931", fixed));
    EXPECT_EQ(fixed, "4006381333931");
    EXPECT_FALSE(BarCodeCheckDigit(bctEan13, "4006381333937", fixed));
    EXPECT_EQ(fixed, "4006381333931");
    EXPECT_FALSE(BarCodeCheckDigit(bctEan8, "96385070", fixed));
    EXPECT_EQ(fixed, "96385074");
    EXPECT_FALSE(BarCodeCheckDigit(bctUpcA, "036000291450", fixed));
    EXPECT_EQ(fixed, "036000291452");
    EXPECT_FALSE(BarCodeCheckDigit(bctUpcE, "01234560", fixed));
    EXPECT_EQ(fixed, "01234565") << "UPC-E takes the digit of the UPC-A code it stands for";
    // (Auto) by the length; codes without a check digit of their type pass.
    EXPECT_FALSE(BarCodeCheckDigit(bctAuto, "4006381333930", fixed));
    EXPECT_EQ(fixed, "4006381333931");
    EXPECT_FALSE(BarCodeCheckDigit(bctAuto, "96385071", fixed));
    EXPECT_EQ(fixed, "96385074");
    EXPECT_TRUE(BarCodeCheckDigit(bctAuto, "12345", fixed));
    EXPECT_TRUE(BarCodeCheckDigit(bctEan128, "(01)03800000000079", fixed));
    EXPECT_TRUE(BarCodeCheckDigit(bctEan13, "ABC", fixed)) << "not digits: nothing to correct";
    EXPECT_EQ(fixed, "ABC");
    EXPECT_TRUE(BarCodeCheckDigit(bctWeight, "2900001ww.wwwc", fixed));
    EXPECT_TRUE(BarCodeCheckDigit(bctEan13, "400638133393", fixed))
        << "a code without its digit is not a wrong digit";
}

TEST(BarcodeImage, AutoTakesACodeForWhatItsDigitsSay) {
    EXPECT_EQ(draw("4006381333931", bctAuto).Symbology, "EAN-13");
    EXPECT_EQ(draw("96385074", bctAuto).Symbology, "EAN-8");
    EXPECT_EQ(draw("036000291452", bctAuto).Symbology, "UPC-A");
    // A wrong check digit is no EAN: the code is drawn as it is.
    const auto wrong = draw("4006381333932", bctAuto);
    EXPECT_EQ(wrong.Symbology, "Code 128");
    EXPECT_TRUE(wrong.Drawn());
    EXPECT_EQ(draw("SUP-0000007", bctAuto).Symbology, "Code 128");
    EXPECT_TRUE(draw("2900001ww.wwwc", bctWeight).Drawn()) << "a weight template as (Auto)";
    const auto none = draw("", bctEan13);
    EXPECT_FALSE(none.Drawn());
    EXPECT_EQ(none.Message, "") << "no code, nothing to say";
}

TEST(BarcodeImage, CodesATypeCannotTakeAreToldInBulgarian) {
    struct Case {
        const char* code;
        int32_t type;
        const char* message;
    };
    const Case cases[] = {
        {"4006381333932", bctEan13,
         "Баркодът '4006381333932' не може да бъде изобразен като EAN-13: некоректна контролна "
         "цифра (очаква се 1)."},
        {"4006381333931", bctEan8,
         "Баркодът '4006381333931' не може да бъде изобразен като EAN-8: очакват се 7 или 8 "
         "цифри."},
        {"03600029145X", bctUpcA,
         "Баркодът '03600029145X' не може да бъде изобразен като UPC-A: допустими са само цифри."},
        {"21234565", bctUpcE,
         "Баркодът '21234565' не може да бъде изобразен като UPC-E: кодът трябва да започва с 0 "
         "или 1."},
        {"3800000000072", bctEan128,
         "Баркодът '3800000000072' не може да бъде изобразен като EAN-128: очакват се "
         "идентификатори на приложение в скоби с данните им, например (01)03800000000072."},
        {"Мляко", bctAuto,
         "Баркодът 'Мляко' не може да бъде изобразен като Code 128: съдържа знаци, които не могат "
         "да бъдат кодирани."},
    };
    for (const Case& c : cases) {
        const auto image = draw(c.code, c.type);
        EXPECT_FALSE(image.Drawn()) << c.code;
        EXPECT_EQ(image.Message, c.message);
    }
    EXPECT_TRUE(draw("(01)03800000000072", bctEan128).Drawn());
}

TEST(BarcodeImage, OptionsChangeTheImage) {
    const auto usual = draw("4006381333931", bctEan13);
    ASSERT_TRUE(usual.Drawn()) << usual.Message;
    EXPECT_NE(usual.Svg.find("<text"), std::string::npos);
    EXPECT_TRUE(usual.Metafile.empty()) << "a metafile only when asked";
    EXPECT_EQ(draw("4006381333931", bctEan13, 100, false).Svg.find("<text"), std::string::npos);
    EXPECT_GT(svgHeight(draw("4006381333931", bctEan13, 200).Svg), svgHeight(usual.Svg) * 1.5);
    EXPECT_LT(svgHeight(draw("4006381333931", bctEan13, 20).Svg), svgHeight(usual.Svg) / 2);
    EXPECT_NE(draw("4006381333931", bctEan13, 100, true, false).Svg, usual.Svg);

    const auto saved = draw("4006381333931", bctEan13, 100, true, true, true);
    const auto w = graphicstest::readWmf(saved.Metafile);
    ASSERT_EQ(w.error, "");
    EXPECT_EQ(w.texts.size(), 3u);
}
