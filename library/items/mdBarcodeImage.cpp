#include "library/items/mdBarcodeImage.h"

#include <algorithm>

#include "library/frame/mdGlobals.h"
#include "platform/graphics/barcode.h"
#include "platform/graphics/metafile.h"
#include "platform/graphics/svg.h"

namespace PeltaNom15 {

namespace gr = pelta::graphics;

namespace {

// The bars of 100% are 50 modules high (an EAN-13 about two thirds as high
// as wide).
constexpr double kBarHeight = 50;

struct Kind {
    gr::Symbology Symbology;
    const char* Name;
    const char* Lengths;  // the lengths of its digits, for messages
};

const Kind kEan13{gr::Symbology::Ean13, "EAN-13", "12 или 13"};
const Kind kEan8{gr::Symbology::Ean8, "EAN-8", "7 или 8"};
const Kind kUpcA{gr::Symbology::UpcA, "UPC-A", "11 или 12"};
const Kind kUpcE{gr::Symbology::UpcE, "UPC-E", "6, 7 или 8"};
const Kind kEan128{gr::Symbology::Gs1_128, "EAN-128", ""};
const Kind kCode128{gr::Symbology::Code128, "Code 128", ""};

// Digits whose last one is their GS1 check digit.
bool CheckedDigits(const std::string& Code) {
    return Code.size() > 1 && gr::allDigits(Code) &&
           gr::gs1CheckDigit(std::string_view(Code).substr(0, Code.size() - 1)) == Code.back();
}

// What (Auto) takes a code for.
const Kind& AutoKind(const std::string& Code) {
    if (CheckedDigits(Code)) {
        if (Code.size() == 13) return kEan13;
        if (Code.size() == 8) return kEan8;
        if (Code.size() == 12) return kUpcA;
    }
    return kCode128;
}

const Kind& KindOf(int32_t Type, const std::string& Code) {
    switch (Type) {
        case bctEan13:
            return kEan13;
        case bctEan8:
            return kEan8;
        case bctEan128:
            return kEan128;
        case bctUpcA:
            return kUpcA;
        case bctUpcE:
            return kUpcE;
        default:
            return AutoKind(Code);
    }
}

std::string Reason(const gr::Barcode& B, const Kind& K) {
    switch (B.problem) {
        case gr::BarcodeProblem::NotDigits:
            return "допустими са само цифри.";
        case gr::BarcodeProblem::Length:
            return Printf("очакват се %1 цифри.", std::string(K.Lengths));
        case gr::BarcodeProblem::CheckDigit:
            return B.expectedCheckDigit ? Printf("некоректна контролна цифра (очаква се %1).",
                                                 std::string(1, B.expectedCheckDigit))
                                        : std::string("некоректна контролна цифра.");
        case gr::BarcodeProblem::NumberSystem:
            return "кодът трябва да започва с 0 или 1.";
        case gr::BarcodeProblem::Characters:
            return "съдържа знаци, които не могат да бъдат кодирани.";
        case gr::BarcodeProblem::Format:
            return "очакват се идентификатори на приложение в скоби с данните им, например "
                   "(01)03800000000072.";
        case gr::BarcodeProblem::TooLong:
            return "кодът е твърде дълъг.";
        default:
            return "кодът не е допустим за този тип.";
    }
}

}  // namespace

std::string BarCodeTypeName(int32_t Type) {
    switch (Type) {
        case bctWeight:
            return "Тегловен";
        case bctAuto:
            return "(Auto)";
        case bctEan13:
            return "EAN-13";
        case bctEan8:
            return "EAN-8";
        case bctEan128:
            return "EAN-128";
        case bctUpcA:
            return "UPC-A";
        case bctUpcE:
            return "UPC-E";
        default:
            return {};
    }
}

bool BarCodeCheckDigit(int32_t Type, const std::string& Code, std::string& Corrected) {
    Corrected = Code;
    if (!gr::allDigits(Code)) return true;
    size_t length = 0;  // of the code with its check digit
    switch (Type) {
        case bctEan13:
            length = 13;
            break;
        case bctEan8:
            length = 8;
            break;
        case bctUpcA:
            length = 12;
            break;
        case bctUpcE:
            length = 8;
            break;
        case bctAuto:
            if (Code.size() == 8 || Code.size() == 12 || Code.size() == 13) length = Code.size();
            break;
        default:
            break;
    }
    if (length == 0 || Code.size() != length) return true;
    const std::string body = Code.substr(0, length - 1);
    char digit = 0;
    if (Type == bctUpcE) {
        const std::string upcA = gr::expandUpcE(body);
        if (upcA.empty()) return true;
        digit = gr::gs1CheckDigit(upcA);
    } else {
        digit = gr::gs1CheckDigit(body);
    }
    Corrected = body + digit;
    return Code.back() == digit;
}

BarcodeImage DrawBarcodeImage(const std::string& Code, const BarcodeImageOptions& Options,
                              bool Metafile) {
    BarcodeImage out;
    if (Code.empty()) return out;
    const Kind& kind = KindOf(Options.Type, Code);
    gr::BarcodeOptions o;
    o.symbology = kind.Symbology;
    o.barHeight = kBarHeight * std::clamp(Options.HeightPercent, 10, 400) / 100.0;
    o.humanReadable = Options.Digits;
    o.extendedGuards = Options.Separators;
    const gr::Barcode barcode = gr::drawBarcode(Code, o);
    out.Symbology = kind.Name;
    if (!barcode.ok()) {
        out.Message = Printf("Баркодът '%1' не може да бъде изобразен като %2: %3", Code,
                             std::string(kind.Name), Reason(barcode, kind));
        return out;
    }
    out.Svg = gr::toSvg(barcode.drawing);
    if (Metafile) out.Metafile = gr::toWindowsMetafile(barcode.drawing);
    return out;
}

}  // namespace PeltaNom15
