// The byte form of recordsets (little-endian):
//
//   "PLRS" u32 version(1)
//   varint fieldCount, then per field: str name, u8 type, u32 definedSize,
//                                      u8 precision, u8 scale, u8 flags (1: nullable)
//   varint rowCount, then rowCount status bytes (RowStatus)
//   per field, a column of rowCount values:
//     null bitmap: ceil(rowCount / 64) u64 words (bit set: Null)
//     Boolean u8 | Long i32 | Double, Date f64 | Currency i64 |
//     Decimal 16 bytes (u64 lo, u32 hi, u8 scale, u8 negative, 2 zero bytes) |
//     Guid 16 bytes |
//     Text, LongText, Binary: varint arena size, arena bytes, then per row
//                             u32 offset and u32 length into the arena
//   varint count of rows with original values, then per such row:
//     varint row index, and per field a cell: u8 (0 value, 1 Null) and the
//     value as in the columns (text and bytes as varint length + bytes)
//
// Columns are written and read as bulk copies. Loading checks every count
// against the bytes that remain before sizing anything by it, and every
// text span against its arena.
#include <algorithm>
#include <bit>
#include <cstring>

#include "platform/automation/error.h"
#include "platform/automation/guid.h"
#include "platform/data/recordset.h"
#include "platform/data/recordset_impl.h"

namespace pelta {

using namespace rsimpl;

static_assert(std::endian::native == std::endian::little, "the byte form is little-endian");

namespace {

constexpr char kMagic[4] = {'P', 'L', 'R', 'S'};
constexpr uint32_t kVersion = 1;

size_t fixedSize(FieldType t) {
    switch (t) {
        case FieldType::Boolean:
            return 1;
        case FieldType::Long:
            return 4;
        case FieldType::Double:
        case FieldType::Date:
        case FieldType::Currency:
            return 8;
        case FieldType::Decimal:
        case FieldType::Guid:
            return 16;
        default:
            return 0;
    }
}

void putDecimal(ByteWriter& w, const Decimal& d) {
    uint8_t b[16] = {};
    uint64_t lo = d.lo();
    uint32_t hi = d.hi();
    std::memcpy(b, &lo, 8);
    std::memcpy(b + 8, &hi, 4);
    b[12] = static_cast<uint8_t>(d.scale());
    b[13] = d.negative() ? 1 : 0;
    w.raw(b, 16);
}

Decimal getDecimal(ByteReader& r, const uint8_t* b) {
    if (b[12] > Decimal::kMaxScale || b[13] > 1 || b[14] || b[15])
        r.fail("malformed decimal value");
    uint64_t lo;
    uint32_t hi;
    std::memcpy(&lo, b, 8);
    std::memcpy(&hi, b + 8, 4);
    return Decimal::fromParts(lo, hi, b[12], b[13] != 0);
}

template <class T>
void putVector(ByteWriter& w, const std::vector<T>& v, std::span<const uint32_t> rows, bool all) {
    if (all) {
        w.raw(v.data(), v.size() * sizeof(T));
        return;
    }
    for (uint32_t r : rows)
        w.raw(&v[r], sizeof(T));
}

template <class T>
void getVector(ByteReader& r, std::vector<T>& v, size_t n) {
    auto b = r.take(n * sizeof(T));
    v.resize(n);
    if (n) std::memcpy(v.data(), b.data(), n * sizeof(T));
}

void putCell(ByteWriter& w, FieldType type, const Variant& v) {
    if (v.isNull()) {
        w.u8(1);
        return;
    }
    w.u8(0);
    switch (type) {
        case FieldType::Boolean:
            w.u8(v.rawBool() ? 1 : 0);
            break;
        case FieldType::Long:
            w.i32(v.rawLong());
            break;
        case FieldType::Double:
            w.f64(v.rawDouble());
            break;
        case FieldType::Date:
            w.f64(v.toDate().oa);
            break;
        case FieldType::Currency:
            w.i64(v.rawCurrency());
            break;
        case FieldType::Decimal:
            putDecimal(w, v.rawDecimal());
            break;
        case FieldType::Guid: {
            auto g = Guid::parse(v.str());
            std::array<uint8_t, 16> b = g ? g->bytes : std::array<uint8_t, 16>{};
            w.raw(b.data(), 16);
            break;
        }
        case FieldType::Text:
        case FieldType::LongText:
            w.str(v.str());
            break;
        case FieldType::Binary:
            w.blob(v.bytes());
            break;
    }
}

Variant getCell(ByteReader& r, FieldType type) {
    uint8_t flag = r.u8();
    if (flag == 1) return Variant::null();
    if (flag != 0) r.fail("malformed cell flag");
    switch (type) {
        case FieldType::Boolean:
            return Variant(r.u8() != 0);
        case FieldType::Long:
            return Variant(r.i32());
        case FieldType::Double:
            return Variant(r.f64());
        case FieldType::Date:
            return Variant(Date{r.f64()});
        case FieldType::Currency:
            return Variant(Currency{r.i64()});
        case FieldType::Decimal:
            return Variant(getDecimal(r, r.take(16).data()));
        case FieldType::Guid: {
            Guid g;
            std::memcpy(g.bytes.data(), r.take(16).data(), 16);
            return Variant(g.toString());
        }
        case FieldType::Text:
        case FieldType::LongText:
            return Variant(std::string(r.str()));
        case FieldType::Binary: {
            auto b = r.blob();
            return Variant(Bytes(b.begin(), b.end()));
        }
    }
    r.fail("malformed field type");
}

}  // namespace

void Recordset::persist(ByteWriter& w) const {
    const Table& t = *table_;
    if (!t.open)
        raiseRs(rserr::ObjectClosed, "Operation is not allowed when the recordset is closed");
    // Which rows: see the header.
    std::vector<uint32_t> rows;
    bool all = false;
    const View& v = *view_;
    if (v.kind == FilterKind::None) {
        all = true;
        for (uint8_t st : t.status)
            if (st == kRemoved) all = false;
        if (!all) {
            for (uint32_t r = 0; r < t.slots(); ++r)
                if (t.status[r] != kRemoved) rows.push_back(r);
        }
    } else {
        for (uint32_t r : v.ids) {
            uint8_t st = t.status[r];
            if (st == kRemoved) continue;
            if (v.kind == FilterKind::Pending ? st == static_cast<uint8_t>(RowStatus::Unmodified)
                                              : st == static_cast<uint8_t>(RowStatus::Deleted))
                continue;
            rows.push_back(r);
        }
        std::sort(rows.begin(), rows.end());
    }
    const size_t n = all ? t.slots() : rows.size();

    // Reserve the whole output once.
    size_t estimate = 64 + n;
    for (size_t f = 0; f < t.defs.size(); ++f) {
        estimate += t.defs[f].name.size() + 16 + (n + 63) / 64 * 8;
        const Column& c = t.cols[f];
        estimate += isTextType(c.type) ? n * 8 + c.arena.size() + 10 : n * fixedSize(c.type);
    }
    w.buffer().reserve(w.size() + estimate);

    w.raw(kMagic, 4);
    w.u32(kVersion);
    w.varint(t.defs.size());
    for (const FieldDef& d : t.defs) {
        w.str(d.name);
        w.u8(static_cast<uint8_t>(d.type));
        w.u32(d.definedSize);
        w.u8(d.precision);
        w.u8(d.scale);
        w.u8(d.nullable ? 1 : 0);
    }
    w.varint(n);
    if (all)
        w.raw(t.status.data(), n);
    else
        for (uint32_t r : rows)
            w.u8(t.status[r]);

    for (size_t f = 0; f < t.defs.size(); ++f) {
        const Column& c = t.cols[f];
        const size_t words = (n + 63) / 64;
        if (all) {
            w.raw(c.nulls.data(), words * 8);
        } else {
            std::vector<uint64_t> bits(words);
            for (size_t i = 0; i < n; ++i)
                if (c.isNull(rows[i])) bits[i >> 6] |= uint64_t{1} << (i & 63);
            w.raw(bits.data(), words * 8);
        }
        switch (c.type) {
            case FieldType::Boolean:
                putVector(w, c.b, rows, all);
                break;
            case FieldType::Long:
                putVector(w, c.i32, rows, all);
                break;
            case FieldType::Double:
            case FieldType::Date:
                putVector(w, c.f64, rows, all);
                break;
            case FieldType::Currency:
                putVector(w, c.i64, rows, all);
                break;
            case FieldType::Decimal:
                if (all)
                    for (const Decimal& d : c.dec)
                        putDecimal(w, d);
                else
                    for (uint32_t r : rows)
                        putDecimal(w, c.dec[r]);
                break;
            case FieldType::Guid:
                putVector(w, c.guid, rows, all);
                break;
            case FieldType::Text:
            case FieldType::LongText:
            case FieldType::Binary: {
                if (all && c.garbage * 4 <= c.arena.size()) {
                    w.varint(c.arena.size());
                    w.raw(c.arena.data(), c.arena.size());
                    w.raw(c.spans.data(), n * sizeof(TextSpan));
                    break;
                }
                // Gather only the live bytes.
                auto rowAt = [&](size_t i) { return all ? static_cast<uint32_t>(i) : rows[i]; };
                uint64_t total = 0;
                for (size_t i = 0; i < n; ++i)
                    total += c.spans[rowAt(i)].length;
                w.varint(total);
                for (size_t i = 0; i < n; ++i) {
                    auto s = c.text(rowAt(i));
                    w.raw(s.data(), s.size());
                }
                uint32_t off = 0;
                for (size_t i = 0; i < n; ++i) {
                    TextSpan s{off, c.spans[rowAt(i)].length};
                    w.raw(&s, sizeof s);
                    off += s.length;
                }
                break;
            }
        }
    }

    // Original values of modified and deleted rows, by saved index.
    std::vector<std::pair<uint32_t, const std::vector<Variant>*>> orig;
    if (!t.originals.empty()) {
        if (all) {
            for (const auto& [r, vals] : t.originals)
                if (t.status[r] != kRemoved) orig.emplace_back(r, &vals);
        } else {
            for (size_t i = 0; i < rows.size(); ++i) {
                auto it = t.originals.find(rows[i]);
                if (it != t.originals.end())
                    orig.emplace_back(static_cast<uint32_t>(i), &it->second);
            }
        }
        std::sort(orig.begin(), orig.end());
    }
    w.varint(orig.size());
    for (const auto& [index, vals] : orig) {
        w.varint(index);
        for (size_t f = 0; f < t.defs.size(); ++f)
            putCell(w, t.defs[f].type, (*vals)[f]);
    }
}

Bytes Recordset::save() const {
    Bytes out;
    ByteWriter w(out);
    persist(w);
    return out;
}

Ref<Recordset> Recordset::loadFrom(ByteReader& r) {
    auto magic = r.take(4);
    if (std::memcmp(magic.data(), kMagic, 4) != 0) r.fail("not a recordset");
    uint32_t version = r.u32();
    if (version != kVersion) r.fail("unsupported recordset version " + std::to_string(version));

    auto table = std::make_shared<Table>();
    Table& t = *table;
    const size_t fields = r.length(9);
    for (size_t f = 0; f < fields; ++f) {
        FieldDef d;
        d.name.assign(r.str());
        uint8_t type = r.u8();
        if (type > static_cast<uint8_t>(FieldType::Binary)) r.fail("unknown field type");
        d.type = static_cast<FieldType>(type);
        d.definedSize = r.u32();
        d.precision = r.u8();
        d.scale = r.u8();
        uint8_t flags = r.u8();
        if (flags > 1) r.fail("malformed field flags");
        d.nullable = flags & 1;
        try {
            t.addField(std::move(d));
        } catch (const Error& e) {
            r.fail(e.description());
        }
    }
    t.openEmpty();

    const size_t n = r.length(1);
    auto status = r.take(n);
    t.status.assign(status.begin(), status.end());
    for (uint8_t st : t.status)
        if (st > static_cast<uint8_t>(RowStatus::Deleted)) r.fail("malformed row status");

    for (size_t f = 0; f < fields; ++f) {
        Column& c = t.cols[f];
        const size_t words = (n + 63) / 64;
        getVector(r, c.nulls, words);
        if (n & 63) c.nulls.back() &= (uint64_t{1} << (n & 63)) - 1;
        switch (c.type) {
            case FieldType::Boolean:
                getVector(r, c.b, n);
                for (auto& b : c.b)
                    b = b != 0;
                break;
            case FieldType::Long:
                getVector(r, c.i32, n);
                break;
            case FieldType::Double:
            case FieldType::Date:
                getVector(r, c.f64, n);
                break;
            case FieldType::Currency:
                getVector(r, c.i64, n);
                break;
            case FieldType::Decimal: {
                auto b = r.take(n * 16);
                c.dec.reserve(n);
                for (size_t i = 0; i < n; ++i)
                    c.dec.push_back(getDecimal(r, b.data() + i * 16));
                break;
            }
            case FieldType::Guid:
                getVector(r, c.guid, n);
                break;
            case FieldType::Text:
            case FieldType::LongText:
            case FieldType::Binary: {
                const size_t size = r.length(1);
                if (size > UINT32_MAX) r.fail("text column too large");
                auto a = r.take(size);
                c.arena.assign(reinterpret_cast<const char*>(a.data()), a.size());
                getVector(r, c.spans, n);
                for (const TextSpan& s : c.spans)
                    if (uint64_t{s.offset} + s.length > size) r.fail("text outside its column");
                break;
            }
        }
    }

    const size_t withOriginals = r.length(1);
    for (size_t k = 0; k < withOriginals; ++k) {
        uint64_t index = r.varint();
        if (index >= n) r.fail("original values of a row that does not exist");
        uint8_t st = t.status[index];
        if (st != static_cast<uint8_t>(RowStatus::Modified) &&
            st != static_cast<uint8_t>(RowStatus::Deleted))
            r.fail("original values of a row neither modified nor deleted");
        std::vector<Variant> vals;
        vals.reserve(fields);
        for (size_t f = 0; f < fields; ++f)
            vals.push_back(getCell(r, t.defs[f].type));
        if (!t.originals.emplace(static_cast<uint32_t>(index), std::move(vals)).second)
            r.fail("original values given twice for a row");
    }

    Ref<Recordset> rs(new Recordset(std::move(table)));
    rs->rebuildView();
    return rs;
}

Ref<Recordset> Recordset::load(std::span<const uint8_t> bytes) {
    ByteReader r(bytes);
    Ref<Recordset> rs = loadFrom(r);
    if (!r.atEnd()) r.fail("unexpected bytes after the recordset");
    return rs;
}

namespace {
ObjectRef loadPersisted(ByteReader& r, int) {
    return ObjectRef(Recordset::loadFrom(r));
}
[[maybe_unused]] const bool kRegistered =
    (registerPersistLoader("Recordset", &loadPersisted), true);
}  // namespace

}  // namespace pelta
