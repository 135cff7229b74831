#include "platform/graphics/metafile.h"

#include <algorithm>
#include <cmath>
#include <map>

namespace pelta::graphics {

namespace {

using namespace wmf;

constexpr uint16_t kMapModeAnisotropic = 8;
constexpr uint16_t kTransparent = 1;
constexpr uint16_t kPenNull = 5;
constexpr uint16_t kBrushSolid = 0;
constexpr uint16_t kAlignBaseline = 0x0018;
constexpr uint16_t kAlignCentre = 0x0006;
constexpr uint16_t kAlignRight = 0x0002;
constexpr uint16_t kAlignLeft = 0x0000;
constexpr int32_t kMaxCoordinate = 32767;

// A record's parameters, as 16-bit words.
class Params {
public:
    Params& word(uint16_t w) {
        words_.push_back(w);
        return *this;
    }
    Params& coordinate(int16_t v) { return word(static_cast<uint16_t>(v)); }
    // A colour reference: red, green, blue, zero.
    Params& colour(uint8_t r, uint8_t g, uint8_t b) {
        return word(static_cast<uint16_t>(r | (g << 8))).word(b);
    }
    // Bytes, padded with a zero to a whole word.
    Params& bytes(const std::string& b) {
        for (size_t i = 0; i < b.size(); i += 2) {
            const auto lo = static_cast<uint8_t>(b[i]);
            const auto hi = i + 1 < b.size() ? static_cast<uint8_t>(b[i + 1]) : uint8_t{0};
            word(static_cast<uint16_t>(lo | (hi << 8)));
        }
        return *this;
    }
    const std::vector<uint16_t>& words() const noexcept { return words_; }

private:
    std::vector<uint16_t> words_;
};

class Writer {
public:
    void record(uint16_t function, const Params& params = {}) {
        const uint32_t size = 3 + static_cast<uint32_t>(params.words().size());
        maxRecord_ = std::max(maxRecord_, size);
        words_ += size;
        put32(records_, size);
        put16(records_, function);
        for (uint16_t w : params.words())
            put16(records_, w);
    }

    std::vector<uint8_t> finish(int16_t width, int16_t height, uint16_t inch, uint16_t objects) {
        record(kEof);
        std::vector<uint8_t> out;
        out.reserve(22 + 18 + records_.size());
        // The placeable header; its checksum is the XOR of its first ten words.
        const uint16_t header[10] = {static_cast<uint16_t>(kPlaceableKey & 0xFFFF),
                                     static_cast<uint16_t>(kPlaceableKey >> 16),
                                     0,
                                     0,
                                     0,
                                     static_cast<uint16_t>(width),
                                     static_cast<uint16_t>(height),
                                     inch,
                                     0,
                                     0};
        uint16_t checksum = 0;
        for (uint16_t w : header) {
            put16(out, w);
            checksum ^= w;
        }
        put16(out, checksum);
        // The metafile header: in memory, 9 words, version 3.0.
        put16(out, 1);
        put16(out, 9);
        put16(out, 0x0300);
        put32(out, 9 + words_);
        put16(out, objects);
        put32(out, maxRecord_);
        put16(out, 0);
        out.insert(out.end(), records_.begin(), records_.end());
        return out;
    }

private:
    static void put16(std::vector<uint8_t>& b, uint16_t v) {
        b.push_back(static_cast<uint8_t>(v));
        b.push_back(static_cast<uint8_t>(v >> 8));
    }
    static void put32(std::vector<uint8_t>& b, uint32_t v) {
        put16(b, static_cast<uint16_t>(v));
        put16(b, static_cast<uint16_t>(v >> 16));
    }

    std::vector<uint8_t> records_;
    uint32_t words_ = 0;
    uint32_t maxRecord_ = 0;
};

// UTF-8 to ISO 8859-1; what it cannot hold (or malformed bytes) becomes "?".
std::string latin1(const std::string& utf8) {
    std::string out;
    for (size_t i = 0; i < utf8.size();) {
        const auto c = static_cast<uint8_t>(utf8[i]);
        if (c < 0x80) {
            out += static_cast<char>(c);
            ++i;
            continue;
        }
        size_t len = c >= 0xF0 ? 4 : c >= 0xE0 ? 3 : c >= 0xC0 ? 2 : 1;
        uint32_t cp = len == 2 ? c & 0x1F : len == 3 ? c & 0x0F : c & 0x07;
        bool good = len > 1 && i + len <= utf8.size();
        for (size_t k = 1; good && k < len; ++k) {
            const auto cc = static_cast<uint8_t>(utf8[i + k]);
            good = (cc & 0xC0) == 0x80;
            cp = (cp << 6) | (cc & 0x3F);
        }
        out += good && cp >= 0xA0 && cp <= 0xFF ? static_cast<char>(cp) : '?';
        i += good ? len : 1;
    }
    return out;
}

}  // namespace

std::vector<uint8_t> toWindowsMetafile(const Drawing& d, const MetafileOptions& options) {
    // Units that keep every coordinate within 16 bits.
    const double extent = std::max({d.width, d.height, 1.0});
    int32_t units = std::max<int32_t>(1, options.unitsPerUnit);
    if (extent * units > kMaxCoordinate)
        units = std::max<int32_t>(1, static_cast<int32_t>(kMaxCoordinate / extent));
    const double inchScaled = std::round(static_cast<double>(options.unitsPerInch) * units /
                                         std::max<int32_t>(1, options.unitsPerUnit));
    const auto inch = static_cast<uint16_t>(std::clamp(inchScaled, 1.0, 65535.0));
    auto at = [&](double v) {
        if (!std::isfinite(v)) v = 0;
        return static_cast<int16_t>(std::clamp(std::lround(v * units), 0L, long{kMaxCoordinate}));
    };
    const int16_t width = std::max<int16_t>(1, at(d.width));
    const int16_t height = std::max<int16_t>(1, at(d.height));

    Writer w;
    w.record(kSetMapMode, Params().word(kMapModeAnisotropic));
    w.record(kSetWindowOrg, Params().coordinate(0).coordinate(0));
    w.record(kSetWindowExt, Params().coordinate(height).coordinate(width));
    w.record(kSetBkMode, Params().word(kTransparent));
    // Objects take the lowest free index: 0 the pen, 1 and 2 the brushes,
    // then a font per text size.
    w.record(kCreatePenIndirect, Params().word(kPenNull).word(0).word(0).colour(0, 0, 0));
    w.record(kCreateBrushIndirect, Params().word(kBrushSolid).colour(255, 255, 255).word(0));
    w.record(kCreateBrushIndirect, Params().word(kBrushSolid).colour(0, 0, 0).word(0));
    w.record(kSelectObject, Params().word(0));
    w.record(kSelectObject, Params().word(1));
    // Rectangle takes bottom, right, top, left.
    w.record(kRectangle, Params().coordinate(height).coordinate(width).coordinate(0).coordinate(0));
    w.record(kSelectObject, Params().word(2));
    for (const Rect& r : d.rects)
        w.record(kRectangle, Params()
                                 .coordinate(at(r.y + r.height))
                                 .coordinate(at(r.x + r.width))
                                 .coordinate(at(r.y))
                                 .coordinate(at(r.x)));

    std::map<int16_t, uint16_t> fonts;  // em height in units -> object index
    if (!d.texts.empty()) {
        w.record(kSetTextColor, Params().colour(0, 0, 0));
        std::string face = options.fontName.substr(0, 31);
        face.resize(32, '\0');  // NUL-terminated in a field of 32 bytes
        for (const TextRun& t : d.texts) {
            const int16_t em = std::max<int16_t>(1, at(t.size));
            if (fonts.count(em)) continue;
            const auto index = static_cast<uint16_t>(3 + fonts.size());
            fonts[em] = index;
            Params font;
            font.coordinate(static_cast<int16_t>(-em))  // negative: the character height
                .word(0)                                // width: as the face has it
                .word(0)                                // escapement
                .word(0)                                // orientation
                .word(400)                              // normal weight
                .word(0)                                // italic, underline
                .word(0)                                // strike-out, ANSI character set
                .word(0)                                // output and clip precision
                .word(0)                                // quality, pitch and family
                .bytes(face);
            w.record(kCreateFontIndirect, font);
        }
        uint16_t align = 0xFFFF;
        uint16_t selected = 0xFFFF;
        for (const TextRun& t : d.texts) {
            const uint16_t a = kAlignBaseline | (t.align == TextAlign::Left    ? kAlignLeft
                                                 : t.align == TextAlign::Right ? kAlignRight
                                                                               : kAlignCentre);
            if (a != align) w.record(kSetTextAlign, Params().word(align = a));
            const uint16_t font = fonts[std::max<int16_t>(1, at(t.size))];
            if (font != selected) w.record(kSelectObject, Params().word(selected = font));
            std::string text = latin1(t.text);
            if (text.size() > 1024) text.resize(1024);
            w.record(kTextOut, Params()
                                   .word(static_cast<uint16_t>(text.size()))
                                   .bytes(text)
                                   .coordinate(at(t.baseline))
                                   .coordinate(at(t.x)));
        }
    }
    const auto objects = static_cast<uint16_t>(3 + fonts.size());
    for (uint16_t i = 0; i < objects; ++i)
        w.record(kDeleteObject, Params().word(i));
    return w.finish(width, height, inch, objects);
}

}  // namespace pelta::graphics
