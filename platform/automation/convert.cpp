// Every conversion between Variant kinds, in one place, with the rules of the
// automation language (CBool, CByte, CInt, CLng, CDbl, CCur, CDec, CDate, CStr,
// IsNumeric and the relational operators):
//
// * Empty is 0, "" or False; Null raises 94 (invalid use of Null).
// * True is -1 as a number; numbers are True when not zero.
// * Conversions to integers round half to even (CLng(2.5) = 2, CLng(3.5) = 4).
// * Text is a number when it reads as one after trimming spaces: a sign,
//   digits with "," as thousands separator, "." as decimal point, an exponent
//   ("1E5", "1D5"), or "&H" hex and "&O" octal of up to 32 bits ("&HFFFFFFFF"
//   is -1). "True" and "False" are booleans, not numbers: CLng("True") fails.
// * Numbers are written as the language writes them: Double with up to 15
//   significant digits and an exponent from 1E+15 and below 1E-04 ("1E+20",
//   "1E-05"), Currency and Decimal without trailing zeros ("1.5").
// * Dates are written in fixed forms rather than the user's locale, so that a
//   text written here reads back on any machine: "dd.mm.yyyy" for a date
//   without time, "hh:nn:ss" for a time without date (day 0, 1899-12-30) and
//   "dd.mm.yyyy hh:nn:ss" for both. These are the Bulgarian short forms the
//   system's users know.
// * Impossible conversions raise 13 (type mismatch), out of range ones 6
//   (overflow).
#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdlib>
#include <limits>

#include <unicode/uchar.h>
#include <unicode/unistr.h>
#include <unicode/ustring.h>

#include "platform/automation/ascii.h"
#include "platform/automation/error.h"
#include "platform/automation/variant.h"

namespace pelta {

namespace {

[[noreturn]] void mismatch() {
    raise(errc::TypeMismatch, {});
}
[[noreturn]] void overflow() {
    raise(errc::Overflow, {});
}
[[noreturn]] void invalidNull() {
    raise(kInvalidUseOfNull, "Invalid use of Null");
}

bool isSpace(char c) noexcept {
    return c == ' ' || c == '\t' || c == '\r' || c == '\n';
}

std::string_view trim(std::string_view s) noexcept {
    while (!s.empty() && isSpace(s.front()))
        s.remove_prefix(1);
    while (!s.empty() && isSpace(s.back()))
        s.remove_suffix(1);
    return s;
}

bool equalsNoCase(std::string_view a, std::string_view b) noexcept {
    return equalsNoCaseAscii(a, b);
}

// --- numeric text ------------------------------------------------------------

// Numeric text, read: either a radix literal ("&HFF") or plain decimal text
// without separators ("-1234.5E3").
struct NumberText {
    bool radix = false;
    int64_t value = 0;  // of a radix literal
    std::string plain;
};

bool scanNumber(std::string_view text, NumberText& out) {
    std::string_view s = trim(text);
    if (s.size() >= 2 && s[0] == '&') {
        char kind = s[1];
        unsigned bits = kind == 'H' || kind == 'h' ? 4 : kind == 'O' || kind == 'o' ? 3 : 0;
        if (bits == 0 || s.size() == 2) return false;
        uint64_t v = 0;
        for (char c : s.substr(2)) {
            unsigned digit;
            if (c >= '0' && c <= '9')
                digit = static_cast<unsigned>(c - '0');
            else if (bits == 4 && c >= 'a' && c <= 'f')
                digit = static_cast<unsigned>(c - 'a' + 10);
            else if (bits == 4 && c >= 'A' && c <= 'F')
                digit = static_cast<unsigned>(c - 'A' + 10);
            else
                return false;
            if (digit >= (1u << bits)) return false;
            v = (v << bits) | digit;
            if (v > 0xFFFFFFFFu) overflow();
        }
        out.radix = true;
        // 32 bits, two's complement: "&HFFFFFFFF" is -1.
        out.value = static_cast<int32_t>(static_cast<uint32_t>(v));
        return true;
    }
    std::string& p = out.plain;
    p.clear();
    size_t i = 0, n = s.size();
    if (i < n && (s[i] == '+' || s[i] == '-')) {
        if (s[i] == '-') p += '-';
        ++i;
    }
    int digits = 0;
    for (; i < n; ++i) {
        if (s[i] >= '0' && s[i] <= '9') {
            p += s[i];
            ++digits;
        } else if (s[i] == ',' && digits > 0) {
            continue;  // thousands separator
        } else {
            break;
        }
    }
    if (i < n && s[i] == '.') {
        p += '.';
        for (++i; i < n && s[i] >= '0' && s[i] <= '9'; ++i) {
            p += s[i];
            ++digits;
        }
    }
    if (digits == 0) return false;
    if (i < n && (s[i] == 'e' || s[i] == 'E' || s[i] == 'd' || s[i] == 'D')) {
        p += 'e';
        ++i;
        if (i < n && (s[i] == '+' || s[i] == '-')) p += s[i++];
        size_t start = i;
        for (; i < n && s[i] >= '0' && s[i] <= '9'; ++i)
            p += s[i];
        if (i == start) return false;
    }
    return i == n;
}

double plainToDouble(const std::string& p) {
    double v = 0;
    auto res = std::from_chars(p.data(), p.data() + p.size(), v);
    if (res.ec == std::errc()) return v;
    // Out of range: strtod tells an overflow (infinite) from an underflow.
    v = std::strtod(p.c_str(), nullptr);
    if (std::isinf(v)) overflow();
    return v;
}

double textToDouble(std::string_view text) {
    NumberText n;
    if (!scanNumber(text, n)) mismatch();
    return n.radix ? static_cast<double>(n.value) : plainToDouble(n.plain);
}

Decimal textToDecimal(std::string_view text) {
    NumberText n;
    if (!scanNumber(text, n)) mismatch();
    if (n.radix) return Decimal(n.value);
    auto d = Decimal::parse(n.plain);
    if (!d) overflow();
    return *d;
}

// --- rounding to integers ------------------------------------------------------

double roundHalfEven(double d) noexcept {
    double r = std::round(d);
    if (std::fabs(d - std::trunc(d)) == 0.5) r = 2.0 * std::round(d / 2.0);
    return r;
}

int64_t doubleToInt64(double d) {
    double r = roundHalfEven(d);
    if (!(r >= -9223372036854775808.0 && r < 9223372036854775808.0)) overflow();
    return static_cast<int64_t>(r);
}

int64_t currencyToInt64(int64_t scaled) noexcept {
    int64_t q = scaled / Currency::kScale, r = scaled % Currency::kScale;
    int64_t half = Currency::kScale / 2;
    if (r > half || (r == half && (q & 1))) ++q;
    if (r < -half || (r == -half && (q & 1))) --q;
    return q;
}

int64_t toIntegral(const Variant& v, int64_t min, int64_t max) {
    int64_t r = 0;
    switch (v.type()) {
        case VarType::Empty:
            r = 0;
            break;
        case VarType::Null:
            invalidNull();
        case VarType::Boolean:
            r = v.rawBool() ? -1 : 0;
            break;
        case VarType::Byte:
        case VarType::Integer:
        case VarType::Long:
            r = v.toInt64();
            break;
        case VarType::Double:
        case VarType::Date:
            r = doubleToInt64(v.rawDouble());
            break;
        case VarType::Currency:
            r = currencyToInt64(v.rawCurrency());
            break;
        case VarType::Decimal:
            r = v.rawDecimal().toInt64();
            break;
        case VarType::String: {
            NumberText n;
            if (!scanNumber(v.str(), n)) mismatch();
            if (n.radix) {
                r = n.value;
            } else {
                auto d = Decimal::parse(n.plain);
                if (!d) overflow();
                r = d->toInt64();
            }
            break;
        }
        default:
            mismatch();
    }
    if (r < min || r > max) overflow();
    return r;
}

Currency currencyFromDecimal(const Decimal& d) {
    // Rounded half to even at the fourth decimal, as CCur.
    return Currency{(d * Decimal(Currency::kScale)).toInt64()};
}

Decimal currencyToDecimal(Currency c) {
    uint64_t mag =
        c.scaled < 0 ? 0 - static_cast<uint64_t>(c.scaled) : static_cast<uint64_t>(c.scaled);
    return Decimal::fromParts(mag, 0, 4, c.scaled < 0);
}

// --- writing numbers -----------------------------------------------------------

std::string doubleToString(double d) {
    if (std::isnan(d)) return "1.#QNAN";
    if (std::isinf(d)) return d > 0 ? "1.#INF" : "-1.#INF";
    if (d == 0) return "0";  // and not "-0"
    char buf[64];
    auto res = std::to_chars(buf, buf + sizeof buf, d, std::chars_format::general, 15);
    std::string s(buf, res.ptr);
    for (char& c : s)
        if (c == 'e') c = 'E';
    return s;
}

std::string currencyToString(Currency c) {
    return currencyToDecimal(c).toString();
}

std::string dateToString(Date d) {
    double whole = std::trunc(d.oa);
    bool hasTime = d.oa != whole;
    if (whole == 0) return formatDate(d, "hh:nn:ss");
    return formatDate(d, hasTime ? "dd.mm.yyyy hh:nn:ss" : "dd.mm.yyyy");
}

// --- comparison ----------------------------------------------------------------

enum class Kind { Empty, Integral, Double, Exact, Text, Other };

Kind kindOf(const Variant& v) noexcept {
    switch (v.type()) {
        case VarType::Empty:
            return Kind::Empty;
        case VarType::Boolean:
        case VarType::Byte:
        case VarType::Integer:
        case VarType::Long:
            return Kind::Integral;
        case VarType::Double:
        case VarType::Date:
            return Kind::Double;
        case VarType::Currency:
        case VarType::Decimal:
            return Kind::Exact;
        case VarType::String:
            return Kind::Text;
        default:
            return Kind::Other;
    }
}

int sign(int c) noexcept {
    return c < 0 ? -1 : c > 0 ? 1 : 0;
}

template <class T>
int order(const T& a, const T& b) noexcept {
    return a < b ? -1 : b < a ? 1 : 0;
}

bool isAscii(std::string_view s) noexcept {
    for (char c : s)
        if (static_cast<unsigned char>(c) >= 0x80) return false;
    return true;
}

int compareText(std::string_view a, std::string_view b, bool ignoreCase) {
    if (!ignoreCase) return sign(a.compare(b));  // UTF-8 bytes sort as code points
    if (isAscii(a) && isAscii(b)) {
        size_t n = std::min(a.size(), b.size());
        for (size_t i = 0; i < n; ++i) {
            const char x = lowerAscii(a[i]), y = lowerAscii(b[i]);
            if (x != y) return x < y ? -1 : 1;
        }
        return order(a.size(), b.size());
    }
    auto ua =
        icu::UnicodeString::fromUTF8(icu::StringPiece(a.data(), static_cast<int32_t>(a.size())));
    auto ub =
        icu::UnicodeString::fromUTF8(icu::StringPiece(b.data(), static_cast<int32_t>(b.size())));
    return sign(ua.caseCompare(ub, U_FOLD_CASE_DEFAULT | U_COMPARE_CODE_POINT_ORDER));
}

int compareNumbers(const Variant& a, const Variant& b) {
    Kind ka = kindOf(a), kb = kindOf(b);
    auto integral = [](Kind k) { return k == Kind::Empty || k == Kind::Integral; };
    if (integral(ka) && integral(kb)) return order(a.toInt64(), b.toInt64());
    if (ka == Kind::Exact || kb == Kind::Exact) {
        try {
            auto c = a.toDecimal() <=> b.toDecimal();
            return c < 0 ? -1 : c > 0 ? 1 : 0;
        } catch (const Error&) {
            // A double beyond the Decimal range: compare as doubles.
        }
    }
    return order(a.toDouble(), b.toDouble());
}

// A number (or date) against text: numerically when the text reads as a
// number (or as a date against a date), otherwise the number sorts first.
int compareNumberWithText(const Variant& number, const std::string& text) {
    if (number.type() == VarType::Date) {
        Date d;
        if (parseDate(text, d)) return order(number.rawDouble(), d.oa);
    }
    NumberText n;
    if (!scanNumber(text, n)) return -1;
    Variant t;
    if (n.radix) {
        t = Variant::fromInt64(n.value);
    } else if (kindOf(number) == Kind::Exact) {
        auto d = Decimal::parse(n.plain);
        t = d ? Variant(*d) : Variant(plainToDouble(n.plain));
    } else {
        t = Variant(plainToDouble(n.plain));
    }
    return compareNumbers(number, t);
}

}  // namespace

// --- conversions -----------------------------------------------------------------

bool Variant::isNumeric() const noexcept {
    switch (kindOf(*this)) {
        case Kind::Empty:
        case Kind::Integral:
        case Kind::Exact:
            return true;
        case Kind::Double:
            return type_ == VarType::Double;  // a Date is not numeric
        case Kind::Text:
            try {
                textToDouble(u_.s);
                return true;
            } catch (const Error&) {
                return false;
            }
        default:
            return false;
    }
}

bool Variant::toBool() const {
    switch (type_) {
        case VarType::Empty:
            return false;
        case VarType::Null:
            invalidNull();
        case VarType::Boolean:
            return u_.b;
        case VarType::Byte:
            return u_.by != 0;
        case VarType::Integer:
            return u_.i16 != 0;
        case VarType::Long:
            return u_.i32 != 0;
        case VarType::Double:
        case VarType::Date:
            return u_.d != 0;
        case VarType::Currency:
            return u_.i64 != 0;
        case VarType::Decimal:
            return !u_.dec.isZero();
        case VarType::String: {
            std::string_view s = trim(u_.s);
            if (equalsNoCase(s, "true")) return true;
            if (equalsNoCase(s, "false")) return false;
            return textToDouble(s) != 0;
        }
        default:
            mismatch();
    }
}

uint8_t Variant::toByte() const {
    if (type_ == VarType::Byte) return u_.by;
    return static_cast<uint8_t>(toIntegral(*this, 0, 255));
}

int16_t Variant::toInteger() const {
    if (type_ == VarType::Integer) return u_.i16;
    return static_cast<int16_t>(toIntegral(*this, -32768, 32767));
}

int32_t Variant::toLong() const {
    if (type_ == VarType::Long) return u_.i32;
    return static_cast<int32_t>(toIntegral(*this, std::numeric_limits<int32_t>::min(),
                                           std::numeric_limits<int32_t>::max()));
}

int64_t Variant::toInt64() const {
    switch (type_) {
        case VarType::Byte:
            return u_.by;
        case VarType::Integer:
            return u_.i16;
        case VarType::Long:
            return u_.i32;
        default:
            return toIntegral(*this, std::numeric_limits<int64_t>::min(),
                              std::numeric_limits<int64_t>::max());
    }
}

double Variant::toDouble() const {
    switch (type_) {
        case VarType::Empty:
            return 0;
        case VarType::Null:
            invalidNull();
        case VarType::Boolean:
            return u_.b ? -1 : 0;
        case VarType::Byte:
            return u_.by;
        case VarType::Integer:
            return u_.i16;
        case VarType::Long:
            return u_.i32;
        case VarType::Double:
        case VarType::Date:
            return u_.d;
        case VarType::Currency:
            return static_cast<double>(u_.i64) / static_cast<double>(Currency::kScale);
        case VarType::Decimal:
            return u_.dec.toDouble();
        case VarType::String:
            return textToDouble(u_.s);
        default:
            mismatch();
    }
}

Currency Variant::toCurrency() const {
    switch (type_) {
        case VarType::Empty:
            return {};
        case VarType::Null:
            invalidNull();
        case VarType::Boolean:
        case VarType::Byte:
        case VarType::Integer:
        case VarType::Long:
            return Currency{toInt64() * Currency::kScale};
        case VarType::Currency:
            return Currency{u_.i64};
        case VarType::Double:
        case VarType::Date:
            // Through the 15 digits of the double, so that CCur(0.1) is 0.1.
            if (!(std::fabs(u_.d) < 1e15)) overflow();
            return currencyFromDecimal(Decimal::fromDouble(u_.d));
        case VarType::Decimal:
            return currencyFromDecimal(u_.dec);
        case VarType::String:
            return currencyFromDecimal(textToDecimal(u_.s));
        default:
            mismatch();
    }
}

Decimal Variant::toDecimal() const {
    switch (type_) {
        case VarType::Empty:
            return {};
        case VarType::Null:
            invalidNull();
        case VarType::Boolean:
            return Decimal(u_.b ? -1 : 0);
        case VarType::Byte:
        case VarType::Integer:
        case VarType::Long:
            return Decimal(toInt64());
        case VarType::Double:
        case VarType::Date:
            return Decimal::fromDouble(u_.d);
        case VarType::Currency:
            return currencyToDecimal(Currency{u_.i64});
        case VarType::Decimal:
            return u_.dec;
        case VarType::String:
            return textToDecimal(u_.s);
        default:
            mismatch();
    }
}

Date Variant::toDate() const {
    switch (type_) {
        case VarType::Date:
            return Date{u_.d};
        case VarType::Null:
            invalidNull();
        case VarType::String: {
            Date d;
            if (!parseDate(u_.s, d)) mismatch();
            return d;
        }
        case VarType::Empty:
        case VarType::Boolean:
        case VarType::Byte:
        case VarType::Integer:
        case VarType::Long:
        case VarType::Double:
        case VarType::Currency:
        case VarType::Decimal: {
            // 0100-01-01 to 9999-12-31 23:59:59.
            double d = toDouble();
            if (!(d > -657435.0 && d < 2958466.0)) overflow();
            return Date{d};
        }
        default:
            mismatch();
    }
}

std::string Variant::toString() const {
    switch (type_) {
        case VarType::Empty:
            return {};
        case VarType::Null:
            invalidNull();
        case VarType::Boolean:
            return u_.b ? "True" : "False";
        case VarType::Byte:
            return std::to_string(u_.by);
        case VarType::Integer:
            return std::to_string(u_.i16);
        case VarType::Long:
            return std::to_string(u_.i32);
        case VarType::Double:
            return doubleToString(u_.d);
        case VarType::Currency:
            return currencyToString(Currency{u_.i64});
        case VarType::Decimal:
            return u_.dec.toString();
        case VarType::Date:
            return dateToString(Date{u_.d});
        case VarType::String:
            return u_.s;
        case VarType::Error:
            return "Error " + std::to_string(u_.i32);
        // A byte array read as text, as assigning one to a string does; here
        // the bytes are taken as UTF-8.
        case VarType::Bytes:
            return std::string(u_.bytes.begin(), u_.bytes.end());
        default:
            mismatch();
    }
}

ObjectRef Variant::toObject() const {
    if (type_ == VarType::Object) return u_.o;
    if (type_ == VarType::Empty) return {};
    mismatch();
}

int compareValues(const Variant& a, const Variant& b, bool ignoreCase) {
    if (a.isNull() || b.isNull()) invalidNull();
    Kind ka = kindOf(a), kb = kindOf(b);
    if (ka == Kind::Other || kb == Kind::Other) mismatch();
    if (ka == Kind::Text && kb == Kind::Text) return compareText(a.str(), b.str(), ignoreCase);
    // Empty is "" against text and 0 against a number.
    if (ka == Kind::Empty && kb == Kind::Text) return b.str().empty() ? 0 : -1;
    if (ka == Kind::Text && kb == Kind::Empty) return a.str().empty() ? 0 : 1;
    if (kb == Kind::Text) return compareNumberWithText(a, b.str());
    if (ka == Kind::Text) return -compareNumberWithText(b, a.str());
    return compareNumbers(a, b);
}

}  // namespace pelta
