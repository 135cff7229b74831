// A drawing of black shapes on a white ground: filled rectangles and lines of
// text, laid out in modules (the width of the narrowest bar of a barcode),
// with y growing downwards. Barcodes are drawn into it; it is written out as
// SVG for screens and as a Windows metafile for other programs.
#pragma once

#include <string>
#include <vector>

namespace pelta::graphics {

struct Rect {
    double x = 0;  // left
    double y = 0;  // top
    double width = 0;
    double height = 0;
};

enum class TextAlign { Centre, Left, Right };

// A line of text: `x` is its centre, left or right end as `align` says,
// `baseline` the height its characters stand on, `size` the font's em height.
struct TextRun {
    double x = 0;
    double baseline = 0;
    double size = 0;
    TextAlign align = TextAlign::Centre;
    std::string text;  // UTF-8
};

struct Drawing {
    double width = 0;
    double height = 0;
    std::vector<Rect> rects;
    std::vector<TextRun> texts;
};

}  // namespace pelta::graphics
