// A drawing as an SVG document: black shapes on a white ground, with no
// scripts, links or outside references, so that a page may show it as an
// image.
#pragma once

#include <string>

#include "platform/graphics/drawing.h"

namespace pelta::graphics {

// `pixelsPerUnit` gives the size the document asks for (its view box is the
// drawing's own units).
std::string toSvg(const Drawing& drawing, double pixelsPerUnit = 2);

}  // namespace pelta::graphics
