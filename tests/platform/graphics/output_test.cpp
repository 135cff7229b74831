// Drawings written out: the SVG a page shows as an image, and the Windows
// metafile read back record by record — placeable key, header checksum,
// sizes that add up, the end-of-file record — with its bars and texts.
#include <gtest/gtest.h>

#include <cmath>
#include <string>

#include "platform/graphics/barcode.h"
#include "platform/graphics/metafile.h"
#include "platform/graphics/svg.h"
#include "wmf_reader.h"

namespace gr = pelta::graphics;
using graphicstest::readWmf;

namespace {

gr::Drawing ean13(bool text = true) {
    gr::BarcodeOptions o;
    o.symbology = gr::Symbology::Ean13;
    o.humanReadable = text;
    auto b = gr::drawBarcode("4006381333931", o);
    EXPECT_TRUE(b.ok()) << b.detail;
    return b.drawing;
}

size_t count(const std::string& text, const std::string& what) {
    size_t n = 0;
    for (size_t at = text.find(what); at != std::string::npos; at = text.find(what, at + 1))
        ++n;
    return n;
}

}  // namespace

TEST(Svg, IsAnImageOfTheBarsAndTexts) {
    const gr::Drawing d = ean13();
    const std::string svg = gr::toSvg(d, 2);
    EXPECT_EQ(svg.rfind("<svg xmlns=\"http://www.w3.org/2000/svg\"", 0), 0u);
    EXPECT_EQ(svg.substr(svg.size() - 6), "</svg>");
    EXPECT_NE(svg.find("width=\"226\""), std::string::npos) << svg.substr(0, 200);
    EXPECT_EQ(count(svg, "M"), d.rects.size()) << "one sub-path per bar";
    EXPECT_EQ(count(svg, "<text "), 3u);
    EXPECT_NE(svg.find(">006381</text>"), std::string::npos);
}

TEST(Svg, TextIsEscapedAndNothingActiveIsWritten) {
    gr::Drawing d;
    d.width = 10;
    d.height = 10;
    d.texts.push_back(
        gr::TextRun{5, 9, 2, gr::TextAlign::Centre, "<script>alert('x')</script> & \"q\"\x01"});
    const std::string svg = gr::toSvg(d);
    EXPECT_EQ(svg.find("<script"), std::string::npos);
    EXPECT_NE(svg.find("&lt;script&gt;alert(&apos;x&apos;)&lt;/script&gt; &amp; &quot;q&quot;?"),
              std::string::npos)
        << svg;
    EXPECT_EQ(svg.find("href"), std::string::npos);
}

TEST(Metafile, IsAWellFormedPlaceableMetafile) {
    const gr::Drawing d = ean13();
    const auto bytes = gr::toWindowsMetafile(d);
    const auto w = readWmf(bytes);
    ASSERT_EQ(w.error, "");
    EXPECT_EQ(w.left, 0);
    EXPECT_EQ(w.top, 0);
    EXPECT_EQ(w.right, std::lround(d.width * 20));
    EXPECT_EQ(w.bottom, std::lround(d.height * 20));
    EXPECT_EQ(w.inch, 1524);
    EXPECT_EQ(w.objects, 3 + 1) << "pen, two brushes and a font: the digits are of one size";
    // The white ground, then every bar.
    ASSERT_EQ(w.rects.size(), d.rects.size() + 1);
    EXPECT_EQ(w.rects[0].right, w.right);
    EXPECT_EQ(w.rects[0].bottom, w.bottom);
    for (size_t i = 0; i < d.rects.size(); ++i) {
        EXPECT_EQ(w.rects[i + 1].left, std::lround(d.rects[i].x * 20));
        EXPECT_EQ(w.rects[i + 1].right - w.rects[i + 1].left, std::lround(d.rects[i].width * 20));
        EXPECT_EQ(w.rects[i + 1].bottom, std::lround((d.rects[i].y + d.rects[i].height) * 20));
    }
    ASSERT_EQ(w.texts.size(), 3u);
    EXPECT_EQ(w.texts[0].text, "4");
    EXPECT_EQ(w.texts[1].text, "006381");
    EXPECT_EQ(w.texts[2].text, "333931");
    EXPECT_EQ(w.texts[1].y, std::lround(d.texts[1].baseline * 20));
}

TEST(Metafile, TakesAFontPerTextSize) {
    gr::BarcodeOptions o;
    o.symbology = gr::Symbology::UpcA;
    const auto b = gr::drawBarcode("036000291452", o);
    ASSERT_TRUE(b.ok()) << b.detail;
    const auto w = readWmf(gr::toWindowsMetafile(b.drawing));
    ASSERT_EQ(w.error, "");
    EXPECT_EQ(w.objects, 3 + 2) << "the outer digits of UPC-A are smaller";
    ASSERT_EQ(w.texts.size(), 4u);
    EXPECT_EQ(w.texts[0].text + w.texts[1].text + w.texts[2].text + w.texts[3].text,
              "036000291452");
}

TEST(Metafile, WithoutTextsHasNoFontAndKeepsItsSizesRight) {
    const auto w = readWmf(gr::toWindowsMetafile(ean13(false)));
    ASSERT_EQ(w.error, "");
    EXPECT_EQ(w.objects, 3);
    EXPECT_TRUE(w.texts.empty());
    for (const auto& r : w.records)
        EXPECT_NE(r.function, gr::wmf::kCreateFontIndirect);
}

TEST(Metafile, TextsAreLatin1AndOddLengthsArePadded) {
    gr::Drawing d;
    d.width = 40;
    d.height = 10;
    d.texts.push_back(gr::TextRun{1, 9, 3, gr::TextAlign::Left, "Café"});
    d.texts.push_back(gr::TextRun{20, 9, 3, gr::TextAlign::Right, "Кафе 1"});
    const auto w = readWmf(gr::toWindowsMetafile(d));
    ASSERT_EQ(w.error, "");
    ASSERT_EQ(w.texts.size(), 2u);
    EXPECT_EQ(w.texts[0].text, "Caf\xE9");
    EXPECT_EQ(w.texts[1].text, "???? 1");
    EXPECT_EQ(w.objects, 4) << "one font for one size";
}

TEST(Metafile, LargeDrawingsStayWithinSixteenBitCoordinates) {
    gr::Drawing d;
    d.width = 2000;  // modules: 40,000 units at 20 a module
    d.height = 60;
    d.rects.push_back(gr::Rect{10, 0, 1980, 50});
    const auto w = readWmf(gr::toWindowsMetafile(d));
    ASSERT_EQ(w.error, "");
    EXPECT_GT(w.right, 30000);
    EXPECT_LE(w.right, 32767);
    ASSERT_EQ(w.rects.size(), 2u);
    EXPECT_EQ(w.rects[1].right - w.rects[1].left, 1980 * (w.right / 2000));
    // The size on paper stays: fewer units a module, as many fewer an inch.
    const double inches = 2000 * 20 / 1524.0;
    EXPECT_NEAR(static_cast<double>(w.right) / w.inch, inches, inches * 0.01);
}
