// The property bag: named values with a byte form. Requests and responses of
// the business-logic service travel as the contents of bags whose properties
// hold scalars, arrays, recordsets and further bags.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "platform/data/bytes.h"

namespace pelta {

class PropertyBag : public virtual Persistable {
public:
    // The tag of a bag held inside another bag.
    static constexpr std::string_view kTag = "PropertyBag";

    PropertyBag() = default;

    // Sets `name` to `value`, replacing a property of the same name (names are
    // compared without regard to ASCII case; the first spelling is kept, and so
    // is the order of first writes). Objects are held by reference and written
    // when contents() is taken. Raises InvalidProcedureCall for a value that
    // cannot be written (an object that is not Persistable, text that is not
    // UTF-8, a date out of range, arrays nested too deeply).
    void writeProperty(std::string_view name, Variant value);
    // The value of `name`, or `defaultValue` (Empty unless given) when missing.
    Variant readProperty(std::string_view name, const Variant& defaultValue = {}) const;
    bool hasProperty(std::string_view name) const noexcept;
    // Property names in the order of first write.
    std::vector<std::string> names() const;
    size_t count() const noexcept { return entries_.size(); }

    // The byte form. Raises InvalidProcedureCall when a held object cannot be
    // written (nesting beyond kMaxPersistDepth, e.g. a bag that holds itself).
    Bytes contents() const;
    // A bag from its byte form; no bytes at all give an empty bag. Raises
    // InvalidData, naming the byte position, for anything malformed.
    static Ref<PropertyBag> fromContents(std::span<const uint8_t> bytes);
    // Replaces every property with those of `bytes` (unchanged on failure).
    void setContents(std::span<const uint8_t> bytes);

    std::string_view persistTag() const override { return kTag; }
    void persist(ByteWriter& w) const override;

    // Late-bound members: WriteProperty(Name, Value), ReadProperty(Name
    // [, Default]), Contents (get; put replaces the properties), Count.
    Variant invoke(std::string_view member, CallKind kind, std::span<Variant> args) override;
    std::string typeName() const override { return "PropertyBag"; }

    // Reads the framing and properties of a bag at nesting `depth`; the
    // loader registered for kTag.
    static ObjectRef load(ByteReader& r, int depth);

private:
    struct FoldHash {
        using is_transparent = void;
        size_t operator()(std::string_view s) const noexcept;
    };
    struct FoldEqual {
        using is_transparent = void;
        bool operator()(std::string_view a, std::string_view b) const noexcept;
    };
    struct Entry {
        std::string name;
        Variant value;
    };

    void encode(ByteWriter& w, int depth) const;
    void decode(ByteReader& r, int depth);
    const Entry* find(std::string_view name) const noexcept;

    std::vector<Entry> entries_;
    std::unordered_map<std::string, size_t, FoldHash, FoldEqual> index_;
};

}  // namespace pelta
