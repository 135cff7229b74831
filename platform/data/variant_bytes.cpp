// The byte encoding of a Variant. The layout is described at the top of
// propertybag.cpp; the kind bytes below are part of the format and never change
// meaning.
#include "platform/data/variant_bytes.h"

#include <cmath>
#include <cstring>
#include <string>

#include "platform/automation/error.h"

namespace pelta {

namespace {

enum Kind : uint8_t {
    kEmpty = 0,
    kNull = 1,
    kMissing = 2,
    kBoolean = 3,
    kByte = 4,
    kInteger = 5,
    kLong = 6,
    kDouble = 7,
    kCurrency = 8,
    kDecimal = 9,
    kDate = 10,
    kString = 11,
    kError = 12,
    kArray = 13,
    kBytes = 14,
    kNothing = 15,
    kObject = 16,
};

// The range of automation dates: 1 January 100 to 31 December 9999.
constexpr double kMinDate = -657435.0;
constexpr double kMaxDate = 2958466.0;
constexpr size_t kMaxTagLength = 64;

thread_local int t_persistDepth = 0;

bool dateInRange(double oa) noexcept {
    return std::isfinite(oa) && oa > kMinDate && oa < kMaxDate;
}

// Object tags are short ASCII names ("PropertyBag", "Recordset").
bool validTag(std::string_view tag) noexcept {
    if (tag.empty() || tag.size() > kMaxTagLength) return false;
    for (char c : tag) {
        bool ok = (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || (c >= '0' && c <= '9') ||
                  c == '_' || c == '.';
        if (!ok) return false;
    }
    return true;
}

[[noreturn]] void refuse(const std::string& what) {
    raise(errc::InvalidProcedureCall, "Cannot write the value: " + what, "PropertyBag");
}

void checkDepth(int depth) {
    if (depth > kMaxPersistDepth)
        refuse("nested deeper than " + std::to_string(kMaxPersistDepth) +
               " levels (does an object hold itself?)");
}

Persistable* persistableOf(const Variant& v) {
    auto* p = query<Persistable>(v.object());
    if (!p) refuse("an object of type " + v.object()->typeName() + " cannot be persisted");
    if (!validTag(p->persistTag()))
        refuse("an object of type " + v.object()->typeName() + " has an invalid persist tag");
    return p;
}

struct DepthScope {
    explicit DepthScope(int depth) noexcept : saved(t_persistDepth) { t_persistDepth = depth; }
    ~DepthScope() { t_persistDepth = saved; }
    DepthScope(const DepthScope&) = delete;
    DepthScope& operator=(const DepthScope&) = delete;
    int saved;
};

}  // namespace

bool isValidUtf8(std::string_view s) noexcept {
    auto* p = reinterpret_cast<const unsigned char*>(s.data());
    auto* end = p + s.size();
    while (p < end) {
        // Eight ASCII bytes at a time.
        if (end - p >= 8) {
            uint64_t chunk;
            std::memcpy(&chunk, p, sizeof chunk);
            if ((chunk & 0x8080808080808080ull) == 0) {
                p += 8;
                continue;
            }
        }
        unsigned char c = *p;
        if (c < 0x80) {
            ++p;
            continue;
        }
        // Two-byte forms (Cyrillic among them) are the common case.
        if (c >= 0xC2 && c <= 0xDF) {
            if (end - p < 2 || (p[1] & 0xC0) != 0x80) return false;
            p += 2;
            continue;
        }
        size_t n;
        uint32_t cp;
        if (c >= 0xE0 && c <= 0xEF) {
            n = 2, cp = c & 0x0F;
        } else if (c >= 0xF0 && c <= 0xF4) {
            n = 3, cp = c & 0x07;
        } else {
            return false;
        }
        if (static_cast<size_t>(end - p) <= n) return false;
        for (size_t i = 1; i <= n; ++i) {
            if ((p[i] & 0xC0) != 0x80) return false;
            cp = (cp << 6) | (p[i] & 0x3F);
        }
        if ((n == 2 && cp < 0x800) || (n == 3 && cp < 0x10000) || cp > 0x10FFFF ||
            (cp >= 0xD800 && cp <= 0xDFFF))
            return false;
        p += n + 1;
    }
    return true;
}

int persistDepth() noexcept {
    return t_persistDepth;
}

void checkWritable(const Variant& v, int depth) {
    checkDepth(depth);
    switch (v.type()) {
        case VarType::Date:
            if (!dateInRange(v.rawDouble())) refuse("a date out of range");
            break;
        case VarType::String:
            if (!isValidUtf8(v.str())) refuse("text that is not UTF-8");
            break;
        case VarType::Array:
            for (const auto& e : v.array())
                checkWritable(e, depth + 1);
            break;
        case VarType::Object:
            if (v.object()) persistableOf(v);
            break;
        default:
            break;
    }
}

void writeVariant(ByteWriter& w, const Variant& v, int depth, bool checked) {
    checkDepth(depth);
    switch (v.type()) {
        case VarType::Empty:
            w.u8(kEmpty);
            break;
        case VarType::Null:
            w.u8(kNull);
            break;
        case VarType::Missing:
            w.u8(kMissing);
            break;
        case VarType::Boolean:
            w.u8(kBoolean);
            w.u8(v.rawBool() ? 1 : 0);
            break;
        case VarType::Byte:
            w.u8(kByte);
            w.u8(v.toByte());
            break;
        case VarType::Integer: {
            w.u8(kInteger);
            int16_t i = v.toInteger();
            w.raw(&i, sizeof i);
            break;
        }
        case VarType::Long:
            w.u8(kLong);
            w.i32(v.rawLong());
            break;
        case VarType::Double:
            w.u8(kDouble);
            w.f64(v.rawDouble());
            break;
        case VarType::Currency:
            w.u8(kCurrency);
            w.i64(v.rawCurrency());
            break;
        case VarType::Decimal: {
            const Decimal& d = v.rawDecimal();
            w.u8(kDecimal);
            w.u64(d.lo());
            w.u32(d.hi());
            w.u8(static_cast<uint8_t>(d.scale()));
            w.u8(d.negative() ? 1 : 0);
            break;
        }
        case VarType::Date:
            if (!checked && !dateInRange(v.rawDouble())) refuse("a date out of range");
            w.u8(kDate);
            w.f64(v.rawDouble());
            break;
        case VarType::String:
            if (!checked && !isValidUtf8(v.str())) refuse("text that is not UTF-8");
            w.u8(kString);
            w.str(v.str());
            break;
        case VarType::Error:
            w.u8(kError);
            w.i32(v.errorCode());
            break;
        case VarType::Array: {
            const auto& a = v.array();
            w.u8(kArray);
            w.varint(a.size());
            for (const auto& e : a)
                writeVariant(w, e, depth + 1);
            break;
        }
        case VarType::Bytes:
            w.u8(kBytes);
            w.blob(v.bytes());
            break;
        case VarType::Object: {
            if (!v.object()) {
                w.u8(kNothing);
                break;
            }
            Persistable* p = persistableOf(v);
            w.u8(kObject);
            w.str(p->persistTag());
            // The length is patched in once the object has written itself.
            size_t lengthAt = w.size();
            w.u64(0);
            {
                DepthScope scope(depth);
                p->persist(w);
            }
            uint64_t length = w.size() - lengthAt - sizeof(uint64_t);
            std::memcpy(w.buffer().data() + lengthAt, &length, sizeof length);
            break;
        }
    }
}

Variant readVariant(ByteReader& r, int depth) {
    if (depth > kMaxPersistDepth)
        r.fail("nested deeper than " + std::to_string(kMaxPersistDepth) + " levels");
    switch (r.u8()) {
        case kEmpty:
            return {};
        case kNull:
            return Variant::null();
        case kMissing:
            return Variant::missing();
        case kBoolean: {
            uint8_t b = r.u8();
            if (b > 1) r.fail("a boolean must be 0 or 1");
            return Variant(b == 1);
        }
        case kByte:
            return Variant::byte(r.u8());
        case kInteger: {
            int16_t i;
            std::memcpy(&i, r.take(sizeof i).data(), sizeof i);
            return Variant::integer(i);
        }
        case kLong:
            return Variant(r.i32());
        case kDouble:
            return Variant(r.f64());
        case kCurrency:
            return Variant(Currency{r.i64()});
        case kDecimal: {
            uint64_t lo = r.u64();
            uint32_t hi = r.u32();
            uint8_t scale = r.u8();
            if (scale > Decimal::kMaxScale) r.fail("decimal scale above 28");
            uint8_t sign = r.u8();
            if (sign > 1) r.fail("decimal sign must be 0 or 1");
            return Variant(Decimal::fromParts(lo, hi, scale, sign == 1));
        }
        case kDate: {
            double oa = r.f64();
            if (!dateInRange(oa)) r.fail("date out of range");
            return Variant(Date{oa});
        }
        case kString: {
            auto s = r.str();
            if (!isValidUtf8(s)) r.fail("text is not UTF-8");
            return Variant(s);
        }
        case kError:
            return Variant::error(r.i32());
        case kArray: {
            size_t n = r.length(1);  // every element takes at least its kind byte
            std::vector<Variant> a;
            a.reserve(n);
            for (size_t i = 0; i < n; ++i)
                a.push_back(readVariant(r, depth + 1));
            return Variant(std::move(a));
        }
        case kBytes: {
            auto b = r.blob();
            return Variant(Bytes(b.begin(), b.end()));
        }
        case kNothing:
            return Variant::nothing();
        case kObject: {
            std::string tag(r.str());
            if (!validTag(tag)) r.fail("invalid object tag");
            uint64_t length = r.u64();
            if (length > r.remaining()) r.fail("object length exceeds the data");
            size_t end = r.position() + static_cast<size_t>(length);
            PersistLoader loader = findPersistLoader(tag);
            if (!loader) r.fail("unknown object kind \"" + tag + "\"");
            ObjectRef o = loader(r, depth);
            if (!o) r.fail("the " + tag + " loader returned nothing");
            if (r.position() != end) r.fail("the " + tag + " object does not fill its length");
            return Variant(std::move(o));
        }
        default:
            break;
    }
    r.fail("unknown value kind");
}

void writeFormatHeader(ByteWriter& w, std::string_view magic, uint8_t version) {
    w.raw(magic.data(), magic.size());
    w.u8(version);
}

uint8_t readFormatHeader(ByteReader& r, std::string_view magic, uint8_t maxVersion) {
    auto m = r.take(magic.size());
    if (std::memcmp(m.data(), magic.data(), magic.size()) != 0)
        r.fail("expected the \"" + std::string(magic) + "\" signature");
    uint8_t version = r.u8();
    if (version == 0 || version > maxVersion)
        r.fail("unsupported format version " + std::to_string(version));
    return version;
}

}  // namespace pelta
