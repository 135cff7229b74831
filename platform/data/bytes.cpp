#include "platform/data/bytes.h"

#include <map>
#include <mutex>

#include "platform/automation/error.h"

namespace pelta {

void ByteWriter::varint(uint64_t v) {
    while (v >= 0x80) {
        out_.push_back(static_cast<uint8_t>(v | 0x80));
        v >>= 7;
    }
    out_.push_back(static_cast<uint8_t>(v));
}

void ByteWriter::blob(std::span<const uint8_t> b) {
    varint(b.size());
    raw(b.data(), b.size());
}

void ByteWriter::str(std::string_view s) {
    varint(s.size());
    raw(s.data(), s.size());
}

void ByteReader::fail(std::string_view what) const {
    raise(errc::InvalidData,
          "Malformed data at byte " + std::to_string(pos_) + ": " + std::string(what),
          "ByteReader");
}

std::span<const uint8_t> ByteReader::take(size_t n) {
    if (n > remaining()) fail("truncated");
    auto s = in_.subspan(pos_, n);
    pos_ += n;
    return s;
}

uint8_t ByteReader::u8() {
    return take(1)[0];
}
uint32_t ByteReader::u32() {
    return fixed<uint32_t>();
}
uint64_t ByteReader::u64() {
    return fixed<uint64_t>();
}
int32_t ByteReader::i32() {
    return fixed<int32_t>();
}
int64_t ByteReader::i64() {
    return fixed<int64_t>();
}
double ByteReader::f64() {
    return fixed<double>();
}

uint64_t ByteReader::varint() {
    uint64_t v = 0;
    for (int shift = 0; shift < 64; shift += 7) {
        uint8_t b = u8();
        if (shift == 63 && b > 1) fail("varint overflow");
        v |= static_cast<uint64_t>(b & 0x7F) << shift;
        if (!(b & 0x80)) return v;
    }
    fail("varint too long");
}

size_t ByteReader::length(size_t minElementSize) {
    uint64_t n = varint();
    if (minElementSize == 0) minElementSize = 1;
    if (n > remaining() / minElementSize) fail("length exceeds the data");
    return static_cast<size_t>(n);
}

std::span<const uint8_t> ByteReader::blob() {
    return take(length());
}

std::string_view ByteReader::str() {
    auto b = blob();
    return {reinterpret_cast<const char*>(b.data()), b.size()};
}

namespace {
std::mutex g_loadersMutex;
std::map<std::string, PersistLoader, std::less<>>& loaders() {
    static std::map<std::string, PersistLoader, std::less<>> m;
    return m;
}
}  // namespace

void registerPersistLoader(std::string_view tag, PersistLoader loader) {
    std::lock_guard lock(g_loadersMutex);
    loaders()[std::string(tag)] = loader;
}

PersistLoader findPersistLoader(std::string_view tag) {
    std::lock_guard lock(g_loadersMutex);
    auto it = loaders().find(tag);
    return it == loaders().end() ? nullptr : it->second;
}

}  // namespace pelta
