// The property bag and its byte form.
//
// Byte form, version 1 (all integers little-endian; "varint" is unsigned
// LEB128; "text" is a varint byte length and that many bytes of UTF-8):
//
//   bag      = "PBAG" version:u8=1  count:varint  property{count}
//   property = name:text  value          names unique without regard to ASCII case
//   value    = kind:u8  payload
//
//   kind  payload
//    0    Empty        (none)
//    1    Null         (none)
//    2    Missing      (none)
//    3    Boolean      u8, 0 or 1
//    4    Byte         u8
//    5    Integer      i16
//    6    Long         i32
//    7    Double       f64 (IEEE 754 bits)
//    8    Currency     i64, the value times 10,000
//    9    Decimal      lo:u64  hi:u32  scale:u8 (0..28)  sign:u8 (0 or 1)
//   10    Date         f64, days since 1899-12-30, finite, years 100 to 9999
//   11    String       text
//   12    Error        i32, the error code
//   13    Array        count:varint  value{count}
//   14    Bytes        varint length and the bytes
//   15    Nothing      (none)
//   16    Object       tag:text (ASCII)  length:u64  the object's own bytes
//
// An object's bytes are whatever its persist() writes and its registered
// loader reads back; the loader must consume exactly `length` bytes. A bag
// inside a bag is an object with tag "PropertyBag" whose bytes are a complete
// bag as above. Arrays and objects nest at most kMaxPersistDepth levels.
// Decoding checks every length against the bytes that remain, rejects unknown
// kinds, bad UTF-8, out-of-range scales and dates, duplicate names and trailing
// bytes, and raises InvalidData naming the byte position. No bytes at all read
// as an empty bag (a request without parameters).
#include "platform/data/propertybag.h"

#include "platform/automation/error.h"
#include "platform/data/variant_bytes.h"

namespace pelta {

namespace {

constexpr std::string_view kMagic = "PBAG";
constexpr uint8_t kVersion = 1;

char foldAscii(char c) noexcept {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c + 32) : c;
}

[[maybe_unused]] const bool g_registered = [] {
    registerPersistLoader(PropertyBag::kTag, &PropertyBag::load);
    return true;
}();

[[noreturn]] void wrongArgumentCount(std::string_view member) {
    raise(errc::WrongArgumentCount, {}, "PropertyBag." + std::string(member));
}

std::string argText(const Variant& v) {
    return v.isString() ? v.str() : v.toString();
}

}  // namespace

size_t PropertyBag::FoldHash::operator()(std::string_view s) const noexcept {
    // FNV-1a over the folded bytes.
    uint64_t h = 1469598103934665603ull;
    for (char c : s) {
        h ^= static_cast<uint8_t>(foldAscii(c));
        h *= 1099511628211ull;
    }
    return static_cast<size_t>(h);
}

bool PropertyBag::FoldEqual::operator()(std::string_view a, std::string_view b) const noexcept {
    return memberIs(a, b);
}

const PropertyBag::Entry* PropertyBag::find(std::string_view name) const noexcept {
    auto it = index_.find(name);
    return it == index_.end() ? nullptr : &entries_[it->second];
}

void PropertyBag::writeProperty(std::string_view name, Variant value) {
    if (!isValidUtf8(name))
        raise(errc::InvalidProcedureCall, "A property name must be UTF-8 text", "PropertyBag");
    checkWritable(value, 1);
    if (auto it = index_.find(name); it != index_.end()) {
        entries_[it->second].value = std::move(value);
        return;
    }
    entries_.push_back({std::string(name), std::move(value)});
    index_.emplace(std::string(name), entries_.size() - 1);
}

Variant PropertyBag::readProperty(std::string_view name, const Variant& defaultValue) const {
    const Entry* e = find(name);
    return e ? e->value : defaultValue;
}

bool PropertyBag::hasProperty(std::string_view name) const noexcept {
    return find(name);
}

std::vector<std::string> PropertyBag::names() const {
    std::vector<std::string> out;
    out.reserve(entries_.size());
    for (const auto& e : entries_)
        out.push_back(e.name);
    return out;
}

void PropertyBag::encode(ByteWriter& w, int depth) const {
    writeFormatHeader(w, kMagic, kVersion);
    w.varint(entries_.size());
    for (const auto& e : entries_) {
        w.str(e.name);
        try {
            writeVariant(w, e.value, depth + 1, /*checked=*/true);
        } catch (const Error& err) {
            raise(err.number(), err.description() + " (property \"" + e.name + "\")", err.source());
        }
    }
}

void PropertyBag::decode(ByteReader& r, int depth) {
    readFormatHeader(r, kMagic, kVersion);
    size_t n = r.length(2);  // a name takes at least one byte, a value too
    entries_.reserve(n);
    index_.reserve(n);
    for (size_t i = 0; i < n; ++i) {
        auto name = r.str();
        if (!isValidUtf8(name)) r.fail("property name is not UTF-8");
        if (!index_.try_emplace(std::string(name), i).second) r.fail("duplicate property name");
        entries_.push_back({std::string(name), readVariant(r, depth + 1)});
    }
}

Bytes PropertyBag::contents() const {
    Bytes out;
    ByteWriter w(out);
    encode(w, 0);
    return out;
}

void PropertyBag::persist(ByteWriter& w) const {
    encode(w, persistDepth());
}

ObjectRef PropertyBag::load(ByteReader& r, int depth) {
    auto bag = makeRef<PropertyBag>();
    bag->decode(r, depth);
    return bag;
}

Ref<PropertyBag> PropertyBag::fromContents(std::span<const uint8_t> bytes) {
    auto bag = makeRef<PropertyBag>();
    if (bytes.empty()) return bag;
    ByteReader r(bytes);
    bag->decode(r, 0);
    if (!r.atEnd()) r.fail("unexpected bytes after the end of the bag");
    return bag;
}

void PropertyBag::setContents(std::span<const uint8_t> bytes) {
    auto loaded = fromContents(bytes);
    entries_.swap(loaded->entries_);
    index_.swap(loaded->index_);
}

Variant PropertyBag::invoke(std::string_view member, CallKind kind, std::span<Variant> args) {
    auto wrongCount = [member] { wrongArgumentCount(member); };
    if (memberIs(member, "WriteProperty")) {
        if (args.size() != 2) wrongCount();
        writeProperty(argText(args[0]), args[1]);
        return {};
    }
    if (memberIs(member, "ReadProperty")) {
        if (args.empty() || args.size() > 2) wrongCount();
        Variant def = args.size() == 2 && !args[1].isMissing() ? args[1] : Variant();
        return readProperty(argText(args[0]), def);
    }
    if (memberIs(member, "Contents")) {
        if (kind == CallKind::PropertyPut) {
            if (args.size() != 1) wrongCount();
            if (args[0].isEmpty()) {
                setContents({});
            } else if (args[0].isBytes()) {
                setContents(args[0].bytes());
            } else {
                raise(errc::TypeMismatch, {}, "PropertyBag.Contents");
            }
            return {};
        }
        if (!args.empty()) wrongCount();
        return Variant(contents());
    }
    if (memberIs(member, "Count") && kind != CallKind::PropertyPut) {
        if (!args.empty()) wrongCount();
        return Variant(static_cast<int32_t>(entries_.size()));
    }
    return Object::invoke(member, kind, args);
}

}  // namespace pelta
