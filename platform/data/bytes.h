// The byte form shared by property bags and recordsets: a bounds-checked
// writer and reader of little-endian values, and the hook through which
// objects (recordsets, nested bags) write themselves into a bag.
//
// A reader never reads outside its span and never trusts a length field: every
// length is checked against the bytes that remain before anything is sized by
// it. Malformed input raises pelta::Error with errc::InvalidData.
#pragma once

#include <cstdint>
#include <cstring>
#include <span>
#include <string>
#include <string_view>

#include "platform/automation/object.h"
#include "platform/automation/variant.h"

namespace pelta {

class ByteWriter {
public:
    explicit ByteWriter(Bytes& out) : out_(out) {}

    void u8(uint8_t v) { out_.push_back(v); }
    void u32(uint32_t v) { raw(&v, sizeof v); }
    void u64(uint64_t v) { raw(&v, sizeof v); }
    void i32(int32_t v) { raw(&v, sizeof v); }
    void i64(int64_t v) { raw(&v, sizeof v); }
    void f64(double v) { raw(&v, sizeof v); }
    // Unsigned LEB128.
    void varint(uint64_t v);
    // Length (varint) and bytes.
    void blob(std::span<const uint8_t> b);
    void str(std::string_view s);
    void raw(const void* p, size_t n) {
        auto* b = static_cast<const uint8_t*>(p);
        out_.insert(out_.end(), b, b + n);
    }
    size_t size() const noexcept { return out_.size(); }
    Bytes& buffer() noexcept { return out_; }

private:
    Bytes& out_;
};

class ByteReader {
public:
    explicit ByteReader(std::span<const uint8_t> in) : in_(in) {}

    uint8_t u8();
    uint32_t u32();
    uint64_t u64();
    int32_t i32();
    int64_t i64();
    double f64();
    uint64_t varint();
    // A length that must not exceed the bytes left, each element at least
    // `minElementSize` bytes long.
    size_t length(size_t minElementSize = 1);
    std::span<const uint8_t> blob();
    std::string_view str();
    std::span<const uint8_t> take(size_t n);
    size_t remaining() const noexcept { return in_.size() - pos_; }
    size_t position() const noexcept { return pos_; }
    bool atEnd() const noexcept { return pos_ == in_.size(); }
    // Raises InvalidData naming the position.
    [[noreturn]] void fail(std::string_view what) const;

private:
    template <class T>
    T fixed() {
        T v;
        std::memcpy(&v, take(sizeof v).data(), sizeof v);
        return v;
    }
    std::span<const uint8_t> in_;
    size_t pos_ = 0;
};

// An object that can be written into a property bag's byte form. The tag names
// its kind in the bytes ("Recordset", "PropertyBag") and selects the loader.
class Persistable : public virtual Object {
public:
    virtual std::string_view persistTag() const = 0;
    virtual void persist(ByteWriter& w) const = 0;
};

using PersistLoader = ObjectRef (*)(ByteReader& r, int depth);

// Loaders by tag. Kinds register themselves once at start-up.
void registerPersistLoader(std::string_view tag, PersistLoader loader);
PersistLoader findPersistLoader(std::string_view tag);

// Nesting limit for bags holding bags holding recordsets ...
inline constexpr int kMaxPersistDepth = 32;

}  // namespace pelta
