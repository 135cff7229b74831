#include "platform/graphics/svg.h"

#include <charconv>
#include <cmath>

namespace pelta::graphics {

namespace {

// Locale-independent and short: "12", "0.5", "116.4".
void appendNumber(std::string& out, double v) {
    if (!std::isfinite(v)) v = 0;
    char buf[32];
    auto [end, ec] = std::to_chars(buf, buf + sizeof buf, v, std::chars_format::general, 7);
    if (ec != std::errc()) {
        out += '0';
        return;
    }
    out.append(buf, end);
}

// Text content and attribute values: markup characters escaped, control
// characters (not allowed in XML) replaced.
void appendEscaped(std::string& out, const std::string& text) {
    for (char ch : text) {
        switch (ch) {
            case '&':
                out += "&amp;";
                break;
            case '<':
                out += "&lt;";
                break;
            case '>':
                out += "&gt;";
                break;
            case '"':
                out += "&quot;";
                break;
            case '\'':
                out += "&apos;";
                break;
            default:
                out += static_cast<unsigned char>(ch) < 0x20 ? '?' : ch;
        }
    }
}

const char* anchorOf(TextAlign align) {
    switch (align) {
        case TextAlign::Left:
            return "start";
        case TextAlign::Right:
            return "end";
        case TextAlign::Centre:
            break;
    }
    return "middle";
}

}  // namespace

std::string toSvg(const Drawing& d, double pixelsPerUnit) {
    std::string out;
    out.reserve(256 + d.rects.size() * 24 + d.texts.size() * 128);
    out += "<svg xmlns=\"http://www.w3.org/2000/svg\" width=\"";
    appendNumber(out, d.width * pixelsPerUnit);
    out += "\" height=\"";
    appendNumber(out, d.height * pixelsPerUnit);
    out += "\" viewBox=\"0 0 ";
    appendNumber(out, d.width);
    out += ' ';
    appendNumber(out, d.height);
    out += "\" shape-rendering=\"crispEdges\"><rect width=\"100%\" height=\"100%\" fill=\"#fff\"/>";
    if (!d.rects.empty()) {
        out += "<path fill=\"#000\" d=\"";
        for (const Rect& r : d.rects) {
            out += 'M';
            appendNumber(out, r.x);
            out += ' ';
            appendNumber(out, r.y);
            out += 'h';
            appendNumber(out, r.width);
            out += 'v';
            appendNumber(out, r.height);
            out += 'h';
            appendNumber(out, -r.width);
            out += 'z';
        }
        out += "\"/>";
    }
    for (const TextRun& t : d.texts) {
        out += "<text x=\"";
        appendNumber(out, t.x);
        out += "\" y=\"";
        appendNumber(out, t.baseline);
        out += "\" font-size=\"";
        appendNumber(out, t.size);
        out += "\" text-anchor=\"";
        out += anchorOf(t.align);
        out += "\" font-family=\"monospace\" fill=\"#000\">";
        appendEscaped(out, t.text);
        out += "</text>";
    }
    out += "</svg>";
    return out;
}

}  // namespace pelta::graphics
