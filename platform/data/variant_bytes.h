// The byte encoding of one Variant, shared by property bags and recordsets,
// and the framing every persisted kind starts with (a four-byte magic and a
// version byte). The layout is described at the top of propertybag.cpp.
#pragma once

#include <cstdint>
#include <string_view>

#include "platform/data/bytes.h"

namespace pelta {

// Writes `v` at nesting `depth` (1 for a value held directly by a bag or a
// row). Raises InvalidProcedureCall when the value cannot be written: an
// object that is not Persistable, text that is not UTF-8, a date out of range,
// or nesting deeper than kMaxPersistDepth (which also stops a bag that holds
// itself). `checked` skips the text and date checks for a value that has
// already passed checkWritable and cannot have changed since.
void writeVariant(ByteWriter& w, const Variant& v, int depth, bool checked = false);

// Reads one value written by writeVariant. Raises InvalidData naming the byte
// position for anything malformed, including nesting beyond kMaxPersistDepth.
// A PersistLoader called with `depth` reads the values it holds at depth + 1.
Variant readVariant(ByteReader& r, int depth);

// Checks, without writing, what writeVariant would refuse (objects are checked
// for being Persistable but not walked). Raises as writeVariant does.
void checkWritable(const Variant& v, int depth);

// While an object's persist() runs inside writeVariant: the depth at which the
// object sits (0 otherwise). Values the object writes go at persistDepth() + 1,
// so that whatever is written within the limit can be read back.
int persistDepth() noexcept;

// The framing of a persisted kind: `magic` (four bytes) and `version`.
void writeFormatHeader(ByteWriter& w, std::string_view magic, uint8_t version);
// Reads and checks the framing; returns the version, which must be between 1
// and `maxVersion`.
uint8_t readFormatHeader(ByteReader& r, std::string_view magic, uint8_t maxVersion);

// Well-formed UTF-8 (no overlong forms, no surrogates, nothing above U+10FFFF).
bool isValidUtf8(std::string_view s) noexcept;

}  // namespace pelta
