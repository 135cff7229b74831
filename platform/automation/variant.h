// The automation Variant: one value of any kind the system passes around.
// Conversions between kinds follow the rules of the automation language
// (CBool, CLng, CDbl, CCur, CDec, CDate, CStr) and are defined in convert.cpp.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "platform/automation/decimal.h"
#include "platform/automation/object.h"

namespace pelta {

using Bytes = std::vector<uint8_t>;

enum class VarType : uint8_t {
    Empty,
    Null,
    Missing,  // an optional argument that was not given
    Boolean,
    Byte,
    Integer,  // 16-bit
    Long,     // 32-bit
    Double,
    Currency,
    Decimal,
    Date,
    String,  // UTF-8
    Object,  // reference, possibly Nothing
    Error,   // an error code value (CVErr)
    Array,   // array of variants
    Bytes,   // byte array
};

class Variant {
public:
    Variant() noexcept : type_(VarType::Empty) { u_.i64 = 0; }
    Variant(const Variant& o);
    Variant(Variant&& o) noexcept;
    Variant& operator=(const Variant& o);
    Variant& operator=(Variant&& o) noexcept;
    ~Variant() { clear(); }

    Variant(bool v) noexcept : type_(VarType::Boolean) { u_.i64 = 0, u_.b = v; }
    Variant(int32_t v) noexcept : type_(VarType::Long) { u_.i64 = 0, u_.i32 = v; }
    Variant(double v) noexcept : type_(VarType::Double) { u_.d = v; }
    Variant(Currency v) noexcept : type_(VarType::Currency) { u_.i64 = v.scaled; }
    Variant(const Decimal& v) noexcept : type_(VarType::Decimal) { new (&u_.dec) Decimal(v); }
    Variant(Date v) noexcept : type_(VarType::Date) { u_.d = v.oa; }
    Variant(std::string v) : type_(VarType::String) { new (&u_.s) std::string(std::move(v)); }
    Variant(std::string_view v) : Variant(std::string(v)) {}
    Variant(const char* v) : Variant(std::string(v)) {}
    Variant(ObjectRef v) noexcept : type_(VarType::Object) { new (&u_.o) ObjectRef(std::move(v)); }
    template <class T>
    Variant(const Ref<T>& v) noexcept : Variant(ObjectRef(v)) {}
    Variant(std::vector<Variant> v) : type_(VarType::Array) {
        new (&u_.arr) std::vector<Variant>(std::move(v));
    }
    Variant(Bytes v) : type_(VarType::Bytes) { new (&u_.bytes) Bytes(std::move(v)); }

    // Integers wider than Long would be ambiguous: use fromInt64.
    Variant(int64_t) = delete;
    Variant(uint64_t) = delete;
    Variant(uint32_t) = delete;
    Variant(long long) = delete;
    Variant(unsigned long long) = delete;

    static Variant null() noexcept { return Variant(VarType::Null); }
    static Variant missing() noexcept { return Variant(VarType::Missing); }
    static Variant nothing() noexcept { return Variant(ObjectRef()); }
    static Variant byte(uint8_t v) noexcept;
    static Variant integer(int16_t v) noexcept;
    static Variant error(int32_t code) noexcept;
    // Long when the value fits, else Decimal.
    static Variant fromInt64(int64_t v);

    VarType type() const noexcept { return type_; }
    bool isEmpty() const noexcept { return type_ == VarType::Empty; }
    bool isNull() const noexcept { return type_ == VarType::Null; }
    bool isMissing() const noexcept { return type_ == VarType::Missing; }
    bool isString() const noexcept { return type_ == VarType::String; }
    bool isObject() const noexcept { return type_ == VarType::Object; }
    bool isNothing() const noexcept { return type_ == VarType::Object && !u_.o; }
    bool isArray() const noexcept { return type_ == VarType::Array; }
    bool isBytes() const noexcept { return type_ == VarType::Bytes; }
    bool isError() const noexcept { return type_ == VarType::Error; }
    // Boolean, Byte, Integer, Long, Double, Currency, Decimal.
    bool isNumber() const noexcept;
    // Numeric as the IsNumeric function sees it: numbers, Empty, and text that converts.
    bool isNumeric() const noexcept;

    // Conversions (VB rules). Raise TypeMismatch (13) when impossible, Overflow
    // (6) when out of range of the target; Null raises InvalidUseOfNull (94).
    bool toBool() const;
    uint8_t toByte() const;
    int16_t toInteger() const;
    int32_t toLong() const;   // rounds half to even, as CLng
    int64_t toInt64() const;  // rounds half to even
    double toDouble() const;
    Currency toCurrency() const;
    Decimal toDecimal() const;
    Date toDate() const;
    std::string toString() const;  // CStr: Empty gives "", Null raises 94
    ObjectRef toObject() const;    // Nothing for Empty; raises 13 for non-objects

    // Direct access to the held value; raises TypeMismatch when the kind differs.
    const std::string& str() const;
    Object* object() const noexcept { return type_ == VarType::Object ? u_.o.get() : nullptr; }
    const std::vector<Variant>& array() const;
    std::vector<Variant>& array();
    const Bytes& bytes() const;
    Bytes& bytes();
    int32_t errorCode() const;

    // Raw numeric payloads, valid for the matching kind only.
    bool rawBool() const noexcept { return u_.b; }
    int32_t rawLong() const noexcept { return u_.i32; }
    double rawDouble() const noexcept { return u_.d; }
    int64_t rawCurrency() const noexcept { return u_.i64; }
    const Decimal& rawDecimal() const noexcept { return u_.dec; }

    void clear() noexcept;  // back to Empty
    void swap(Variant& o) noexcept;

    // Exact identity of kind and value (not VB's "=" with its coercions).
    friend bool operator==(const Variant& a, const Variant& b);

private:
    explicit Variant(VarType t) noexcept : type_(t) { u_.i64 = 0; }
    void copyFrom(const Variant& o);
    void moveFrom(Variant& o) noexcept;

    VarType type_;
    union U {
        U() noexcept {}
        ~U() {}
        bool b;
        uint8_t by;
        int16_t i16;
        int32_t i32;
        int64_t i64;
        double d;
        Decimal dec;
        std::string s;
        ObjectRef o;
        std::vector<Variant> arr;
        Bytes bytes;
    } u_;
};

inline constexpr int32_t kInvalidUseOfNull = 94;

// The automation TypeName of a value: "Empty", "Null", "Boolean", "Long",
// "String", "Date", "Variant()", "Byte()", or the object's type name.
std::string typeName(const Variant& v);

// Comparison as the language's relational operators do it for two non-Null
// values: numbers numerically, texts by code point (or without regard to case
// when `ignoreCase`), a number against numeric text numerically (a date
// against date text as dates), any other text after every number; Empty is 0
// or "". Raises TypeMismatch for values that cannot be compared (objects,
// arrays, errors) and InvalidUseOfNull for Null. Returns <0, 0, >0.
int compareValues(const Variant& a, const Variant& b, bool ignoreCase = false);

// Date parts. Parts out of their range roll over as DateSerial does (month 13
// is January of the next year, day 0 the last day of the month before); a
// result outside 0100-01-01..9999-12-31 raises Overflow (6).
Date makeDate(int year, int month, int day, int hour = 0, int minute = 0, int second = 0,
              int millisecond = 0);
struct DateParts {
    int year, month, day, hour, minute, second, millisecond;
    int weekday;  // 1 = Sunday, as the language counts
};
DateParts splitDate(Date d);
// Now, in local time.
Date now();
// Parses a date text: "dd.mm.yyyy[ hh:nn[:ss]]" (also d.m.yy, and the year
// mark "г."), ISO "yyyy-mm-dd[Thh:nn:ss[.fff]]" and a time "hh:nn[:ss]" (on
// day 0). False when the text is not a valid date.
bool parseDate(std::string_view text, Date& out) noexcept;
// Formats with a pattern of the Format function: yyyy, yy, mm, m, dd, d, hh, h,
// nn, n, ss, s ("mm" is always the month, "nn" the minutes), text in double
// quotes or after "\" literally, any other character as it is (e.g.
// "yyyy.mm.dd hh:nn:ss", "yyyy_mm_dd"). Seconds are rounded.
std::string formatDate(Date d, std::string_view pattern);

}  // namespace pelta
