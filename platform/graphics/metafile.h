// A drawing as a Windows metafile with a placeable header (".wmf"), as word
// processors and label designers read it: a white ground, the rectangles
// filled black without an outline, and each line of text in a font of its
// size. Everything is little-endian; sizes count 16-bit words.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "platform/graphics/drawing.h"

namespace pelta::graphics {

struct MetafileOptions {
    // Logical units per drawing unit, and per inch: 20 and 1524 make a
    // module a third of a millimetre. A drawing too large for the format's
    // 16-bit coordinates gets fewer units, its size on paper kept.
    int32_t unitsPerUnit = 20;
    int32_t unitsPerInch = 1524;
    std::string fontName = "Arial";
};

// Texts are written in Windows-1252's first 256 characters (ISO 8859-1);
// other characters become "?".
std::vector<uint8_t> toWindowsMetafile(const Drawing& drawing, const MetafileOptions& options = {});

// The record functions written, for readers of the format.
namespace wmf {
inline constexpr uint32_t kPlaceableKey = 0x9AC6CDD7;
inline constexpr uint16_t kEof = 0x0000;
inline constexpr uint16_t kSetBkMode = 0x0102;
inline constexpr uint16_t kSetMapMode = 0x0103;
inline constexpr uint16_t kSelectObject = 0x012D;
inline constexpr uint16_t kSetTextAlign = 0x012E;
inline constexpr uint16_t kDeleteObject = 0x01F0;
inline constexpr uint16_t kSetTextColor = 0x0209;
inline constexpr uint16_t kSetWindowOrg = 0x020B;
inline constexpr uint16_t kSetWindowExt = 0x020C;
inline constexpr uint16_t kCreatePenIndirect = 0x02FA;
inline constexpr uint16_t kCreateFontIndirect = 0x02FB;
inline constexpr uint16_t kCreateBrushIndirect = 0x02FC;
inline constexpr uint16_t kRectangle = 0x041B;
inline constexpr uint16_t kTextOut = 0x0521;
}  // namespace wmf

}  // namespace pelta::graphics
