#include "platform/graphics/barcode.h"

#include <zint.h>

#include <algorithm>
#include <memory>

namespace pelta::graphics {

namespace {

// What the engine is given: the data without a check digit (it adds its
// own), or why nothing is drawn.
struct Prepared {
    BarcodeProblem problem = BarcodeProblem::None;
    char expected = 0;
    std::string input;
    int symbology = 0;
    int inputMode = DATA_MODE;
};

Prepared refused(BarcodeProblem problem, char expected = 0) {
    Prepared p;
    p.problem = problem;
    p.expected = expected;
    return p;
}

// `n` digits, or `n` digits and their check digit.
Prepared digitsWithCheck(std::string_view data, size_t n, int symbology) {
    if (!allDigits(data)) return refused(BarcodeProblem::NotDigits);
    if (data.size() != n && data.size() != n + 1) return refused(BarcodeProblem::Length);
    if (data.size() == n + 1) {
        const char expected = gs1CheckDigit(data.substr(0, n));
        if (data[n] != expected) return refused(BarcodeProblem::CheckDigit, expected);
    }
    Prepared p;
    p.input = std::string(data.substr(0, n));
    p.symbology = symbology;
    return p;
}

// Six digits (number system 0), the number system and six digits, or those
// and the check digit, which is the one of the UPC-A code they stand for.
Prepared upcE(std::string_view data) {
    if (!allDigits(data)) return refused(BarcodeProblem::NotDigits);
    if (data.size() < 6 || data.size() > 8) return refused(BarcodeProblem::Length);
    std::string seven = data.size() == 6 ? "0" + std::string(data) : std::string(data.substr(0, 7));
    if (seven[0] != '0' && seven[0] != '1') return refused(BarcodeProblem::NumberSystem);
    if (data.size() == 8) {
        const char expected = gs1CheckDigit(expandUpcE(seven));
        if (data[7] != expected) return refused(BarcodeProblem::CheckDigit, expected);
    }
    Prepared p;
    p.input = std::move(seven);
    p.symbology = BARCODE_UPCE;
    return p;
}

Prepared prepare(std::string_view data, Symbology symbology) {
    switch (symbology) {
        case Symbology::Ean13:
            return digitsWithCheck(data, 12, BARCODE_EANX);
        case Symbology::Ean8:
            // Seven digits make the engine's EAN symbol an EAN-8.
            return digitsWithCheck(data, 7, BARCODE_EANX);
        case Symbology::UpcA:
            return digitsWithCheck(data, 11, BARCODE_UPCA);
        case Symbology::UpcE:
            return upcE(data);
        case Symbology::Gs1_128: {
            // Application identifiers in parentheses, "(01)...", or brackets.
            if (data.front() != '(' && data.front() != '[') return refused(BarcodeProblem::Format);
            Prepared p;
            p.input = std::string(data);
            p.symbology = BARCODE_GS1_128;
            p.inputMode = GS1_MODE | (data.front() == '(' ? GS1PARENS_MODE : 0);
            return p;
        }
        case Symbology::Code128:
            break;
    }
    Prepared p;
    p.input = std::string(data);
    p.symbology = BARCODE_CODE128;
    p.inputMode = UNICODE_MODE;  // UTF-8 in; ISO 8859-1 characters are encodable
    return p;
}

BarcodeProblem problemOf(int code, Symbology symbology) {
    switch (code) {
        case ZINT_ERROR_TOO_LONG:
            return BarcodeProblem::TooLong;
        case ZINT_ERROR_INVALID_DATA:
            return symbology == Symbology::Gs1_128 ? BarcodeProblem::Format
                                                   : BarcodeProblem::Characters;
        case ZINT_ERROR_INVALID_CHECK:
            return BarcodeProblem::CheckDigit;
        default:
            return BarcodeProblem::Failed;
    }
}

struct SymbolDeleter {
    void operator()(zint_symbol* s) const noexcept { ZBarcode_Delete(s); }
};

// Longer data than any linear symbol holds is refused before the engine.
constexpr size_t kMaxData = 256;

}  // namespace

bool allDigits(std::string_view text) {
    return !text.empty() &&
           std::all_of(text.begin(), text.end(), [](char c) { return c >= '0' && c <= '9'; });
}

char gs1CheckDigit(std::string_view digits) {
    if (!allDigits(digits)) return 0;
    int sum = 0;
    int weight = 3;
    for (auto it = digits.rbegin(); it != digits.rend(); ++it) {
        sum += (*it - '0') * weight;
        weight = 4 - weight;
    }
    return static_cast<char>('0' + (10 - sum % 10) % 10);
}

std::string expandUpcE(std::string_view s) {
    if (s.size() != 7 || !allDigits(s)) return {};
    const std::string_view d = s.substr(1);
    std::string out(1, s[0]);
    switch (d[5]) {
        case '0':
        case '1':
        case '2':
            out.append(d.substr(0, 2)).append(1, d[5]).append("0000").append(d.substr(2, 3));
            break;
        case '3':
            out.append(d.substr(0, 3)).append("00000").append(d.substr(3, 2));
            break;
        case '4':
            out.append(d.substr(0, 4)).append("00000").append(1, d[4]);
            break;
        default:
            out.append(d.substr(0, 5)).append("0000").append(1, d[5]);
    }
    return out;
}

Barcode drawBarcode(std::string_view data, const BarcodeOptions& options) {
    Barcode out;
    if (data.empty()) {
        out.problem = BarcodeProblem::Empty;
        return out;
    }
    if (data.size() > kMaxData) {
        out.problem = BarcodeProblem::TooLong;
        return out;
    }
    Prepared p = prepare(data, options.symbology);
    if (p.problem != BarcodeProblem::None) {
        out.problem = p.problem;
        out.expectedCheckDigit = p.expected;
        return out;
    }

    std::unique_ptr<zint_symbol, SymbolDeleter> symbol(ZBarcode_Create());
    if (!symbol) {
        out.problem = BarcodeProblem::Failed;
        out.detail = "out of memory";
        return out;
    }
    zint_symbol& s = *symbol;
    s.symbology = p.symbology;
    s.input_mode = p.inputMode;
    s.height = static_cast<float>(std::clamp(options.barHeight, 1.0, 1000.0));
    s.scale = 0.5f;  // vectors are laid out in modules at half scale
    s.show_hrt = options.humanReadable ? 1 : 0;
    s.guard_descent = options.extendedGuards ? 5.0f : 0.0f;
    s.output_options = BARCODE_QUIET_ZONES;
    const int rc = ZBarcode_Encode_and_Buffer_Vector(
        &s, reinterpret_cast<const unsigned char*>(p.input.data()),
        static_cast<int>(p.input.size()), 0);
    if (rc >= ZINT_ERROR || !s.vector) {
        out.problem = rc >= ZINT_ERROR ? problemOf(rc, options.symbology) : BarcodeProblem::Failed;
        out.detail = s.errtxt;
        return out;
    }

    Drawing& d = out.drawing;
    d.width = s.vector->width;
    d.height = s.vector->height;
    for (const zint_vector_rect* r = s.vector->rectangles; r; r = r->next)
        if (r->colour == -1 || r->colour == 7)  // the foreground, or black
            d.rects.push_back(Rect{r->x, r->y, r->width, r->height});
    for (const zint_vector_string* t = s.vector->strings; t; t = t->next) {
        TextRun run;
        run.x = t->x;
        run.baseline = t->y;
        run.size = t->fsize;
        run.align = t->halign == 1   ? TextAlign::Left
                    : t->halign == 2 ? TextAlign::Right
                                     : TextAlign::Centre;
        // NUL-terminated UTF-8 (its length counts characters, not bytes).
        if (t->text) run.text = reinterpret_cast<const char*>(t->text);
        d.texts.push_back(std::move(run));
    }
    out.modules = s.width;
    out.humanReadable = reinterpret_cast<const char*>(s.text);
    if (rc != 0) out.detail = s.errtxt;  // a warning: drawn all the same
    return out;
}

}  // namespace pelta::graphics
