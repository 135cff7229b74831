// Storage of the Variant: construction, copying, access. Conversions between
// kinds live in convert.cpp.
#include "platform/automation/variant.h"

#include <limits>

#include "platform/automation/error.h"

namespace pelta {

Variant::Variant(const Variant& o) : type_(VarType::Empty) {
    u_.i64 = 0;
    copyFrom(o);
}

Variant::Variant(Variant&& o) noexcept : type_(VarType::Empty) {
    u_.i64 = 0;
    moveFrom(o);
}

Variant& Variant::operator=(const Variant& o) {
    if (this != &o) {
        Variant tmp(o);
        clear();
        moveFrom(tmp);
    }
    return *this;
}

Variant& Variant::operator=(Variant&& o) noexcept {
    if (this != &o) {
        clear();
        moveFrom(o);
    }
    return *this;
}

void Variant::copyFrom(const Variant& o) {
    switch (o.type_) {
        case VarType::Decimal:
            new (&u_.dec) Decimal(o.u_.dec);
            break;
        case VarType::String:
            new (&u_.s) std::string(o.u_.s);
            break;
        case VarType::Object:
            new (&u_.o) ObjectRef(o.u_.o);
            break;
        case VarType::Array:
            new (&u_.arr) std::vector<Variant>(o.u_.arr);
            break;
        case VarType::Bytes:
            new (&u_.bytes) Bytes(o.u_.bytes);
            break;
        default:
            u_.i64 = o.u_.i64;
            break;
    }
    type_ = o.type_;
}

void Variant::moveFrom(Variant& o) noexcept {
    switch (o.type_) {
        case VarType::Decimal:
            new (&u_.dec) Decimal(o.u_.dec);
            break;
        case VarType::String:
            new (&u_.s) std::string(std::move(o.u_.s));
            break;
        case VarType::Object:
            new (&u_.o) ObjectRef(std::move(o.u_.o));
            break;
        case VarType::Array:
            new (&u_.arr) std::vector<Variant>(std::move(o.u_.arr));
            break;
        case VarType::Bytes:
            new (&u_.bytes) Bytes(std::move(o.u_.bytes));
            break;
        default:
            u_.i64 = o.u_.i64;
            break;
    }
    type_ = o.type_;
    o.clear();
}

void Variant::clear() noexcept {
    switch (type_) {
        case VarType::Decimal:
            u_.dec.~Decimal();
            break;
        case VarType::String:
            u_.s.~basic_string();
            break;
        case VarType::Object:
            u_.o.~Ref();
            break;
        case VarType::Array:
            u_.arr.~vector();
            break;
        case VarType::Bytes:
            u_.bytes.~vector();
            break;
        default:
            break;
    }
    type_ = VarType::Empty;
    u_.i64 = 0;
}

void Variant::swap(Variant& o) noexcept {
    Variant tmp(std::move(o));
    o = std::move(*this);
    *this = std::move(tmp);
}

Variant Variant::byte(uint8_t v) noexcept {
    Variant r(VarType::Byte);
    r.u_.by = v;
    return r;
}

Variant Variant::integer(int16_t v) noexcept {
    Variant r(VarType::Integer);
    r.u_.i16 = v;
    return r;
}

Variant Variant::error(int32_t code) noexcept {
    Variant r(VarType::Error);
    r.u_.i32 = code;
    return r;
}

Variant Variant::fromInt64(int64_t v) {
    if (v >= std::numeric_limits<int32_t>::min() && v <= std::numeric_limits<int32_t>::max())
        return Variant(static_cast<int32_t>(v));
    return Variant(Decimal(v));
}

bool Variant::isNumber() const noexcept {
    switch (type_) {
        case VarType::Boolean:
        case VarType::Byte:
        case VarType::Integer:
        case VarType::Long:
        case VarType::Double:
        case VarType::Currency:
        case VarType::Decimal:
            return true;
        default:
            return false;
    }
}

const std::string& Variant::str() const {
    if (type_ != VarType::String) raise(errc::TypeMismatch, {});
    return u_.s;
}

const std::vector<Variant>& Variant::array() const {
    if (type_ != VarType::Array) raise(errc::TypeMismatch, {});
    return u_.arr;
}

std::vector<Variant>& Variant::array() {
    if (type_ != VarType::Array) raise(errc::TypeMismatch, {});
    return u_.arr;
}

const Bytes& Variant::bytes() const {
    if (type_ != VarType::Bytes) raise(errc::TypeMismatch, {});
    return u_.bytes;
}

Bytes& Variant::bytes() {
    if (type_ != VarType::Bytes) raise(errc::TypeMismatch, {});
    return u_.bytes;
}

int32_t Variant::errorCode() const {
    if (type_ != VarType::Error) raise(errc::TypeMismatch, {});
    return u_.i32;
}

bool operator==(const Variant& a, const Variant& b) {
    if (a.type_ != b.type_) return false;
    switch (a.type_) {
        case VarType::Empty:
        case VarType::Null:
        case VarType::Missing:
            return true;
        case VarType::Boolean:
            return a.u_.b == b.u_.b;
        case VarType::Byte:
            return a.u_.by == b.u_.by;
        case VarType::Integer:
            return a.u_.i16 == b.u_.i16;
        case VarType::Long:
        case VarType::Error:
            return a.u_.i32 == b.u_.i32;
        case VarType::Double:
        case VarType::Date:
            return a.u_.d == b.u_.d;
        case VarType::Currency:
            return a.u_.i64 == b.u_.i64;
        case VarType::Decimal:
            return a.u_.dec == b.u_.dec && a.u_.dec.scale() == b.u_.dec.scale();
        case VarType::String:
            return a.u_.s == b.u_.s;
        case VarType::Object:
            return a.u_.o == b.u_.o;
        case VarType::Array:
            return a.u_.arr == b.u_.arr;
        case VarType::Bytes:
            return a.u_.bytes == b.u_.bytes;
    }
    return false;
}

std::string typeName(const Variant& v) {
    switch (v.type()) {
        case VarType::Empty:
            return "Empty";
        case VarType::Null:
            return "Null";
        case VarType::Missing:
            return "Error";
        case VarType::Boolean:
            return "Boolean";
        case VarType::Byte:
            return "Byte";
        case VarType::Integer:
            return "Integer";
        case VarType::Long:
            return "Long";
        case VarType::Double:
            return "Double";
        case VarType::Currency:
            return "Currency";
        case VarType::Decimal:
            return "Decimal";
        case VarType::Date:
            return "Date";
        case VarType::String:
            return "String";
        case VarType::Object:
            return v.object() ? v.object()->typeName() : "Nothing";
        case VarType::Error:
            return "Error";
        case VarType::Array:
            return "Variant()";
        case VarType::Bytes:
            return "Byte()";
    }
    return "Unknown";
}

}  // namespace pelta
