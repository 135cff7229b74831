// Linear barcodes drawn from their data: the symbologies of retail goods
// (EAN-13, EAN-8, UPC-A, UPC-E), GS1-128 and Code 128. The check digits of the
// EAN/UPC family are the GS1 ones; a code may be given with or without its
// check digit, and a wrong one is reported, never drawn.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "platform/graphics/drawing.h"

namespace pelta::graphics {

enum class Symbology { Ean13, Ean8, UpcA, UpcE, Gs1_128, Code128 };

struct BarcodeOptions {
    Symbology symbology = Symbology::Code128;
    double barHeight = 50;       // in modules
    bool humanReadable = true;   // the digits (or text) under the bars
    bool extendedGuards = true;  // EAN/UPC guard bars reach below the others
};

// Why a code could not be drawn.
enum class BarcodeProblem {
    None,
    Empty,
    NotDigits,     // EAN/UPC take digits only
    Length,        // EAN/UPC: not a length of the symbology
    CheckDigit,    // the check digit given is not the right one
    NumberSystem,  // UPC-E starts with 0 or 1
    Characters,    // Code 128 cannot encode a character (beyond ISO 8859-1)
    Format,        // GS1-128: not application identifiers with their data
    TooLong,
    Failed,  // anything else the engine refused
};

struct Barcode {
    BarcodeProblem problem = BarcodeProblem::None;
    // The barcode engine's own description of a problem (English, for logs).
    std::string detail;
    // For a check-digit problem, the digit expected.
    char expectedCheckDigit = 0;
    Drawing drawing;
    int32_t modules = 0;        // width of the symbol without quiet zones
    std::string humanReadable;  // the text as printed, check digit included

    bool ok() const noexcept { return problem == BarcodeProblem::None; }
};

Barcode drawBarcode(std::string_view data, const BarcodeOptions& options);

// The GS1 check digit ('0'..'9') of `digits` (without it): weights 3 and 1
// alternating from the right, modulo 10. Zero for an empty text or one that
// is not all digits.
char gs1CheckDigit(std::string_view digits);

// A UPC-E code's number system and six digits (seven digits) as the eleven
// digits of the UPC-A code it stands for (without its check digit); empty
// when `sevenDigits` is not that.
std::string expandUpcE(std::string_view sevenDigits);

// Whether every character is an ASCII digit (and there is one).
bool allDigits(std::string_view text);

}  // namespace pelta::graphics
