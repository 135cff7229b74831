// The image of an item's barcode as the item editor previews and saves it:
// the barcode types of the item's barcodes by their numbers, the choice made
// for "(Auto)", and the messages that tell the person why a code cannot be
// drawn as its type.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace PeltaNom15 {

// `Type` of the item's barcodes.
enum BarCodeType : int32_t {
    bctWeight = -1,  // a weight-barcode template ("Тегловен")
    bctAuto = 0,
    bctEan13 = 1,
    bctEan8 = 2,
    bctEan128 = 3,
    bctUpcA = 4,
    bctUpcE = 5,
};

// "(Auto)", "EAN-13" ... "Тегловен"; empty for an unknown number.
std::string BarCodeTypeName(int32_t Type);

// Whether the check digit of `Code` is right for `Type` (always for types
// without one, and for codes that are not of the type's digits); `Corrected`
// is then the code with the right digit (the code itself when right). Under
// (Auto) a code of 8, 12 or 13 digits is taken as EAN-8, UPC-A or EAN-13.
bool BarCodeCheckDigit(int32_t Type, const std::string& Code, std::string& Corrected);

struct BarcodeImageOptions {
    int32_t Type = bctAuto;
    int32_t HeightPercent = 100;  // of the usual height
    bool Digits = true;           // the code printed under the bars
    bool Separators = true;       // the guard bars reach below the others
};

struct BarcodeImage {
    // Why nothing was drawn, for the person; empty when drawn or when there
    // was no code.
    std::string Message;
    std::string Svg;                // the preview
    std::vector<uint8_t> Metafile;  // when asked for
    // The symbology drawn: the type's own, or the one (Auto) chose.
    std::string Symbology;

    bool Drawn() const { return !Svg.empty(); }
};

// (Auto) draws a code of digits with a right check digit as EAN-13, EAN-8 or
// UPC-A by its length, anything else as Code 128; a weight template is drawn
// as (Auto) would draw it.
BarcodeImage DrawBarcodeImage(const std::string& Code, const BarcodeImageOptions& Options,
                              bool Metafile = false);

}  // namespace PeltaNom15
